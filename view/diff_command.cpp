#include <iostream>
#include <memory>
#include <string>

#include "view/command_line.hpp"
#include "view/command_output.hpp"
#include "view/commands.hpp"
#include "view/input_log.hpp"
#include "view/model/diff.hpp"
#include "view/show/json.hpp"
#include "view/show/text.hpp"

namespace view {

namespace {

struct Logs {
    std::string before;
    std::string after;
};

int run(const CommandLine& line, const Logs& logs) {
    const Difference difference = compare(openLog(logs.before), openLog(logs.after));
    if (line.json) {
        std::cout << toJson(difference).dump(2) << '\n';
    } else {
        writeText(std::cout, difference, outputStyle());
    }
    return difference.isEmpty() ? kExitSame : kExitDifferent;
}

} // namespace

void addDiff(CommandLine& line) {
    const auto logs = std::make_shared<Logs>();
    CLI::App* command =
        line.addCommand("diff", "compare two logs of a host", [&line, logs] { return run(line, *logs); });
    command->excludes(line.pageOption);
    command->add_option("OLD", logs->before, "the earlier log")->required()->type_name("FILE");
    command->add_option("NEW", logs->after, "the later log")->required()->type_name("FILE");
    line.addJson(command);
}

} // namespace view
