#include "view/command_line.hpp"

#include <iostream>

#include "view/commands.hpp"
#include "view/show/escape.hpp"
#include "view/trouble.hpp"

namespace view {

namespace {

constexpr const char* kExamples = R"(Examples:
  morvane-view                               read ./MorvaneLogs/Morvane.log
  ssh db1 cat MorvaneLogs/Morvane.log | morvane-view -
  morvane-view --html paths.html Morvane.log
  morvane-view --json Morvane.log | jq '.luns[] | select(.pathCount < 2)'
  morvane-view paths -o device,luid,map --filter 'problem=*unique*'
  morvane-view diff before.log after.log     exit status 0 same, 1 different, 2 trouble
  morvane-view check accepted.log            for Nagios, Icinga, Checkmk: one line, status 0 to 3
  morvane-view san --html san.html logs/*/Morvane.log)";

} // namespace

CommandLine::CommandLine()
    : app("Reads the logs of morvane: the storage paths of a host, what is wrong with them, what changed.",
          "morvane-view") {
    app.footer(kExamples);
    app.set_version_flag("--version", MORVANE_VERSION);
    logOption = app.add_option("LOG", log, "the log to read, - for standard input")->type_name("FILE");
    logOption->capture_default_str();
    addJson(&app);
    addPage(&app);
    jsonOption = app.get_option("--json");
    pageOption = app.get_option("--html");
    metricsOption = app.add_option("--prometheus", metrics,
                                   "write metrics to FILE, for the textfile collector of node_exporter");
    metricsOption->type_name("FILE");
    addPaths(*this);
    addCheck(*this);
    addDiff(*this);
    addSan(*this);
    addVerify(*this);
    addCompletion(*this);
}

CLI::App* CommandLine::addCommand(const std::string& name, const std::string& description, Run run) {
    CLI::App* command = app.add_subcommand(name, description);
    command->excludes(logOption);
    command->excludes(metricsOption);
    commands.emplace_back(command, std::move(run));
    return command;
}

void CommandLine::addJson(CLI::App* command) {
    command->add_flag("--json", json, "write JSON instead of text");
}

void CommandLine::addPage(CLI::App* command) {
    command->add_option("--html", page, "write a page for the browser to FILE")->type_name("FILE");
}

int runCommandLine(int argc, char** argv) {
    CommandLine line;
    try {
        line.app.parse(argc, argv);
    } catch (const CLI::ParseError& error) {
        if (error.get_exit_code() != 0 && line.app.got_subcommand("check")) {
            return endUnknown(printable(error.what()));
        }
        return line.app.exit(error) == 0 ? kExitSame : kExitTrouble;
    }
    for (const auto& [command, run] : line.commands) {
        if (*command) {
            return run();
        }
    }
    return runReport(line);
}

} // namespace view
