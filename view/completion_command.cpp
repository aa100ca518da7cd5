#include <iostream>
#include <memory>
#include <string>

#include "view/command_line.hpp"
#include "view/commands.hpp"
#include "view/completion.hpp"

namespace view {

namespace {

int run(const CommandLine& line, const std::string& shell) {
    const std::vector<CompletedCommand> commands = completedCommands(line);
    if (shell == "bash") {
        writeBashCompletion(std::cout, commands);
    } else if (shell == "zsh") {
        writeZshCompletion(std::cout, commands);
    } else {
        writeFishCompletion(std::cout, commands);
    }
    return kExitSame;
}

} // namespace

void addCompletion(CommandLine& line) {
    const auto shell = std::make_shared<std::string>();
    CLI::App* command =
        line.addCommand("completion", "print what makes a shell complete this program's arguments",
                        [&line, shell] { return run(line, *shell); });
    command->excludes(line.pageOption);
    command->excludes(line.jsonOption);
    const std::vector<std::string> shells = {"bash", "zsh", "fish"};
    CLI::Option* option = command->add_option("SHELL", *shell, "bash, zsh or fish")->required();
    option->check(CLI::IsMember(shells))->type_name("");
    line.words[option] = shells;
}

} // namespace view
