#include <algorithm>
#include <string_view>

#include "view/completion.hpp"

namespace view {

namespace {

// A text in single quotes.
std::string singleQuoted(std::string_view text) {
    std::string shown = "'";
    for (const char c : text) {
        shown += c == '\'' || c == '\\' ? "\\" : "";
        shown += c;
    }
    return shown + '\'';
}

// What is completed of words: of a list, its last one.
std::string wordsOf(const CompletedValue& value) {
    std::string words;
    for (const std::string& word : value.words) {
        words += (words.empty() ? "" : " ") + word;
    }
    return singleQuoted(value.isList ? "(__fish_append , " + words + ')' : words);
}

void writeOption(std::ostream& output, const std::string& begin, const CompletedValue& option) {
    output << begin;
    for (const std::string& name : option.names) {
        output << (name.starts_with("--") ? " -l " + name.substr(2) : " -s " + name.substr(1));
    }
    if (!option.words.empty()) {
        output << " -x -a " << wordsOf(option);
    } else if (option.isFile) {
        output << " -r";
    } else if (!option.value.empty()) {
        output << " -x";
    }
    output << " -d " << singleQuoted(option.description) << '\n';
}

} // namespace

void writeFishCompletion(std::ostream& output, const std::vector<CompletedCommand>& commands) {
    std::string names;
    for (const CompletedCommand& command : commands) {
        names += command.name.empty() ? "" : ' ' + command.name;
    }
    const std::string begin = "complete -c morvane-view -n ";
    const std::string first = begin + singleQuoted("not __fish_seen_subcommand_from" + names);
    output << "# fish completion for morvane-view, as `morvane-view completion fish` writes it.\n";
    for (const CompletedCommand& command : commands) {
        const std::string behind = command.name.empty()
                                       ? first
                                       : begin + singleQuoted("__fish_seen_subcommand_from " + command.name);
        if (!command.name.empty()) {
            output << first << " -a " << command.name << " -d " << singleQuoted(command.description) << '\n';
        }
        for (const CompletedValue& option : command.options) {
            writeOption(output, behind, option);
        }
        const std::vector<CompletedValue>& arguments = command.arguments;
        if (std::none_of(arguments.begin(), arguments.end(),
                         [](const auto& value) { return value.isFile; })) {
            output << behind << " -f\n"; // no names of files
        }
        for (const CompletedValue& argument : arguments) {
            if (!argument.words.empty()) {
                output << behind << " -a " << wordsOf(argument) << '\n';
            }
        }
    }
}

} // namespace view
