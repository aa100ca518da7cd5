#pragma once

#include <ostream>
#include <string>
#include <vector>

namespace view {

struct CommandLine;

// An option or an argument, as a shell completes it.
struct CompletedValue {
    std::vector<std::string> names; // of an option, with its dashes; none for an argument
    std::string description;
    std::string value;              // what it takes: FILE, LOG; empty for an option that takes nothing
    bool isFile = false;            // whether what it takes is the name of a file or folder
    std::vector<std::string> words; // what it takes, where that is one of a few words
    bool isList = false;            // whether it takes several of the words, with commas between them
    bool isRepeated = false;        // whether it takes any number
};

// A command and what may stand behind it.
struct CompletedCommand {
    std::string name; // empty: the program without a command
    std::string description;
    std::vector<CompletedValue> options;
    std::vector<CompletedValue> arguments;
};

// The program without a command, and then each command, from the definitions of the command line.
std::vector<CompletedCommand> completedCommands(const CommandLine& line);

// Write the script that has a shell complete them: what `completedCommands` gave.
void writeBashCompletion(std::ostream& output, const std::vector<CompletedCommand>& commands);
void writeZshCompletion(std::ostream& output, const std::vector<CompletedCommand>& commands);
void writeFishCompletion(std::ostream& output, const std::vector<CompletedCommand>& commands);

} // namespace view
