#include <cstdio>
#include <exception>
#include <memory>
#include <optional>
#include <sstream>
#include <string>

#include "view/command_line.hpp"
#include "view/commands.hpp"
#include "view/input_log.hpp"
#include "view/model/check.hpp"
#include "view/show/text.hpp"

namespace view {

namespace {

struct Request {
    std::string baseline;
    CheckLimits limits;
};

// Writes what a check came to and gives the exit status: unknown, too, when nobody can read it.
int tell(const std::ostringstream& output, CheckStatus status) {
    const std::string text = output.str();
    const bool isTold =
        std::fwrite(text.data(), 1, text.size(), stdout) == text.size() && std::fflush(stdout) == 0;
    return static_cast<int>(isTold ? status : CheckStatus::Unknown);
}

int run(const CommandLine& line, const Request& request) {
    try {
        const Check check = view::check(openLog(request.baseline), openLog(line.log), request.limits);
        std::ostringstream output;
        writeText(output, check);
        return tell(output, check.status);
    } catch (const std::exception& error) {
        return endUnknown(error.what());
    }
}

// Adds an option that takes a range of counts.
void addRange(CLI::App* command, const std::string& names, CountRange& range, const std::string& words) {
    const auto take = [&range](const std::string& text) {
        const std::optional<CountRange> given = countRange(text);
        if (!given) {
            throw CLI::ValidationError(text + " is no range of whole numbers");
        }
        range = *given;
    };
    command->add_option_function<std::string>(names, take, words)->type_name("RANGE");
}

} // namespace

int endUnknown(const std::string& reason) {
    std::ostringstream output;
    writeUnknown(output, reason);
    return tell(output, CheckStatus::Unknown);
}

void addCheck(CommandLine& line) {
    const auto request = std::make_shared<Request>();
    CLI::App* command =
        line.addCommand("check", "compare a log with the accepted one, for programs that watch services",
                        [&line, request] { return run(line, *request); });
    command->excludes(line.pageOption);
    command->excludes(line.jsonOption);
    command->add_option("BASELINE", request->baseline, "the log of the state that was accepted")
        ->required()
        ->type_name("FILE");
    command->add_option("LOG", line.log, "the log to judge, - for standard input")
        ->capture_default_str()
        ->type_name("FILE");
    addRange(command, "-w,--warning", request->limits.warning,
             "numbers of lost paths that are no warning; 0 unless given");
    addRange(command, "-c,--critical", request->limits.critical,
             "numbers of lost paths that are not critical; any unless given");
    command
        ->add_option("--least-paths", request->limits.leastPaths,
                     "critical when a LUN that lost paths has fewer left")
        ->type_name("COUNT")
        ->check(CLI::Range(1, 1000))
        ->capture_default_str();
}

} // namespace view
