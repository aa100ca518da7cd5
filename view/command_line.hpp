#pragma once

#include <functional>
#include <map>
#include <string>
#include <utility>
#include <vector>

#include <CLI/CLI.hpp>

namespace view {

// The command line of morvane-view: the one place where help, what is accepted and what shells complete come
// from. Each command has a file of its own, whose function adds it. What an option or argument takes is told
// by its type name: FILE and DIR are names of files, and are completed as such.
struct CommandLine {
    // Runs what was asked for and gives the program's exit status; throws Trouble.
    using Run = std::function<int()>;

    CommandLine();

    // Adds a command. The program's own LOG and --prometheus are refused beside it.
    CLI::App* addCommand(const std::string& name, const std::string& description, Run run);

    // Adds --json and --html FILE; what they are given before the command's name counts as well.
    void addJson(CLI::App* command);
    void addPage(CLI::App* command);

    CLI::App app;
    CLI::Option* logOption = nullptr;     // the program's own LOG
    CLI::Option* jsonOption = nullptr;    // the program's own --json
    CLI::Option* pageOption = nullptr;    // the program's own --html
    CLI::Option* metricsOption = nullptr; // the program's own --prometheus
    std::string log = "./MorvaneLogs/Morvane.log";
    bool json = false;
    std::string page;    // the file of --html; empty: none
    std::string metrics; // the file of --prometheus; likewise
    std::vector<std::pair<CLI::App*, Run>> commands;
    // The words that an option or argument takes; one that has a delimiter takes a list of them.
    std::map<const CLI::Option*, std::vector<std::string>> words;
};

} // namespace view
