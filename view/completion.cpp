#include "view/completion.hpp"

#include <utility>

#include "view/command_line.hpp"

namespace view {

namespace {

CompletedValue completedValue(const CommandLine& line, const CLI::Option& option) {
    CompletedValue completed;
    for (const std::string& name : option.get_snames()) {
        completed.names.push_back("-" + name);
    }
    for (const std::string& name : option.get_lnames()) {
        completed.names.push_back("--" + name);
    }
    completed.description = option.get_description();
    if (option.get_items_expected_max() > 0) {
        const std::string type = option.get_type_name();
        completed.value = option.nonpositional() ? type : option.get_name(true);
        completed.isFile = type == "FILE" || type == "DIR";
    }
    if (const auto words = line.words.find(&option); words != line.words.end()) {
        completed.words = words->second;
        completed.isList = option.get_delimiter() == ',';
    }
    completed.isRepeated = option.get_items_expected_max() > 1 && !completed.isList;
    return completed;
}

CompletedCommand completedCommand(const CommandLine& line, const CLI::App& command) {
    CompletedCommand completed = {"", command.get_description(), {}, {}};
    for (const CLI::Option* option : command.get_options()) {
        (option->nonpositional() ? completed.options : completed.arguments)
            .push_back(completedValue(line, *option));
    }
    return completed;
}

} // namespace

std::vector<CompletedCommand> completedCommands(const CommandLine& line) {
    std::vector<CompletedCommand> commands = {completedCommand(line, line.app)};
    for (const auto& [command, run] : line.commands) {
        commands.push_back(completedCommand(line, *command));
        commands.back().name = command->get_name();
    }
    return commands;
}

} // namespace view
