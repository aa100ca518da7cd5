#include <unistd.h>

#include <cstdlib>
#include <exception>
#include <iostream>
#include <string>
#include <vector>

#include <CLI/CLI.hpp>
#include <nlohmann/json.hpp>

#include "view/input_log.hpp"
#include "view/model/diff.hpp"
#include "view/model/san.hpp"
#include "view/output_file.hpp"
#include "view/show/escape.hpp"
#include "view/show/html_page.hpp"
#include "view/show/json.hpp"
#include "view/show/text.hpp"
#include "view/show/warnings.hpp"
#include "view/trouble.hpp"
#include "view/verify_command.hpp"

namespace {

constexpr int kExitSame = 0;
constexpr int kExitDifferent = 1;
constexpr int kExitTrouble = 2;

void warnOf(const view::Model& model) {
    for (const std::string& warning : view::warningsOf(model.log)) {
        std::cerr << "morvane-view: warning: " << view::printable(model.log.name) << ": " << warning << '\n';
    }
}

nlohmann::ordered_json named(const std::string& name, const view::Model& model) {
    return {{"name", name}, {"report", view::toJson(model)}};
}

// The document of a page that shows one report.
nlohmann::ordered_json pageOf(const view::Model& model) {
    const std::string host = model.host.empty() ? "an unnamed host" : view::printable(model.host);
    nlohmann::ordered_json reports = nlohmann::ordered_json::array();
    reports.push_back(named(host, model));
    return {{"title", "Storage paths of " + host}, {"reports", std::move(reports)}, {"san", nullptr}};
}

view::Style outputStyle() {
    const char* noColour = std::getenv("NO_COLOR");
    return view::Style::of((noColour == nullptr || *noColour == '\0') && isatty(STDOUT_FILENO) == 1);
}

struct Options {
    std::string log = "./MorvaneLogs/Morvane.log";
    std::string before;
    std::string after;
    std::vector<std::string> logs;
    std::string page;
    bool json = false;
};

int report(const Options& options) {
    const view::Model model = view::openLog(options.log);
    if (!options.page.empty()) {
        const nlohmann::ordered_json document = pageOf(model);
        view::writeOutput(options.page, {options.log},
                          [&](std::ostream& output) { view::writePage(output, document); });
    }
    if (options.json) {
        std::cout << view::toJson(model).dump(2) << '\n';
    }
    if (options.json || !options.page.empty()) {
        warnOf(model);
    } else {
        view::writeText(std::cout, model, outputStyle());
    }
    return kExitSame;
}

int diff(const Options& options) {
    const view::Difference difference =
        view::compare(view::openLog(options.before), view::openLog(options.after));
    if (options.json) {
        std::cout << view::toJson(difference).dump(2) << '\n';
    } else {
        view::writeText(std::cout, difference, outputStyle());
    }
    return difference.isEmpty() ? kExitSame : kExitDifferent;
}

int san(const Options& options) {
    std::vector<view::Model> reports;
    int status = kExitSame;
    for (const std::string& log : options.logs) {
        try {
            reports.push_back(view::openLog(log));
            warnOf(reports.back());
        } catch (const view::Trouble& trouble) {
            std::cerr << "morvane-view: left out: " << trouble.what() << '\n';
            status = kExitTrouble;
        }
    }
    if (reports.empty()) {
        throw view::Trouble("there is no log to show");
    }
    const view::San joined = view::join(reports);
    if (!options.page.empty()) {
        nlohmann::ordered_json list = nlohmann::ordered_json::array();
        const nlohmann::ordered_json summary = view::toJson(joined);
        for (std::size_t i = 0; i < reports.size(); ++i) {
            list.push_back(named(summary["hosts"][i]["name"], reports[i]));
        }
        const nlohmann::ordered_json document = {
            {"title", "SAN view of " + std::to_string(reports.size()) + " logs"},
            {"reports", std::move(list)},
            {"san", summary}};
        view::writeOutput(options.page, options.logs,
                          [&](std::ostream& output) { view::writePage(output, document); });
    }
    if (options.json) {
        std::cout << view::toJson(joined).dump(2) << '\n';
    } else if (options.page.empty()) {
        view::writeText(std::cout, joined, outputStyle());
    }
    return status;
}

int verify(const Options& options, const view::VerifyRequest& request) {
    const view::VerifyAnswer answer = view::answer(request);
    if (!options.page.empty()) {
        nlohmann::ordered_json document = pageOf(answer.model);
        document["verify"] = view::toJson(answer.verification);
        view::writeOutput(options.page, {answer.log},
                          [&](std::ostream& output) { view::writePage(output, document); });
    }
    if (options.json) {
        std::cout << view::toJson(answer.verification).dump(2) << '\n';
    } else if (options.page.empty()) {
        view::writeText(std::cout, answer.verification, outputStyle());
    }
    warnOf(answer.model);
    return answer.verification.findings.empty() ? kExitSame : kExitDifferent;
}

constexpr const char* kExamples = R"(Examples:
  morvane-view                               read ./MorvaneLogs/Morvane.log
  ssh db1 cat MorvaneLogs/Morvane.log | morvane-view -
  morvane-view --html paths.html Morvane.log
  morvane-view --json Morvane.log | jq '.luns[] | select(.pathCount < 2)'
  morvane-view diff before.log after.log     exit status 0 same, 1 different, 2 trouble
  morvane-view san --html san.html logs/*/Morvane.log)";

int run(int argc, char** argv) {
    Options options;
    CLI::App app{
        "Reads the logs of morvane: the storage paths of a host, what is wrong with them, what changed.",
        "morvane-view"};
    app.footer(kExamples);
    app.set_version_flag("--version", MORVANE_VERSION);
    CLI::Option* log = app.add_option("LOG", options.log, "the log to read, - for standard input");
    log->capture_default_str();
    app.add_flag("--json", options.json, "write JSON instead of text");
    CLI::Option* page = app.add_option("--html", options.page, "write a page for the browser to FILE");
    page->type_name("FILE");

    CLI::App* diffCommand = app.add_subcommand("diff", "compare two logs of a host");
    diffCommand->excludes(log);
    diffCommand->excludes(page);
    diffCommand->add_option("OLD", options.before, "the earlier log")->required();
    diffCommand->add_option("NEW", options.after, "the later log")->required();
    diffCommand->add_flag("--json", options.json, "write JSON instead of text");

    CLI::App* sanCommand = app.add_subcommand("san", "show the logs of many hosts as one view");
    sanCommand->excludes(log);
    sanCommand->add_option("LOG", options.logs, "the hosts' logs")->required();
    sanCommand->add_flag("--json", options.json, "write JSON instead of text");
    sanCommand->add_option("--html", options.page, "write a page for the browser to FILE")->type_name("FILE");

    view::VerifyRequest request;
    CLI::App* verifyCommand = app.add_subcommand(
        "verify", "compare a log with what the kernel and multipath remember of the devices");
    verifyCommand->excludes(log);
    verifyCommand->excludes(page);
    verifyCommand->add_option("LOG", request.log, "the log of this host, - for standard input");
    verifyCommand->add_option("--root", request.root, "look below DIR, a recording, instead of this host's /")
        ->type_name("DIR");
    verifyCommand
        ->add_option("--maps", request.maps, "the states of paths, as multipathd show maps json printed them")
        ->type_name("FILE");
    verifyCommand
        ->add_option("--record", request.record, "copy the files that are read and the log into a new folder")
        ->type_name("DIR");
    verifyCommand->add_flag("--force", request.isForced, "take a log of another host");
    verifyCommand->add_flag("--json", options.json, "write JSON instead of text");
    verifyCommand->add_option("--html", options.page, "write a page for the browser to FILE")
        ->type_name("FILE");

    try {
        app.parse(argc, argv);
    } catch (const CLI::ParseError& error) {
        return app.exit(error) == 0 ? kExitSame : kExitTrouble;
    }
    int status = kExitSame;
    if (*diffCommand) {
        status = diff(options);
    } else if (*sanCommand) {
        status = san(options);
    } else if (*verifyCommand) {
        status = verify(options, request);
    } else {
        status = report(options);
    }
    std::cout.flush();
    if (!std::cout) {
        throw view::Trouble("standard output: the report could not be written");
    }
    return status;
}

} // namespace

int main(int argc, char** argv) {
    try {
        std::ios::sync_with_stdio(false);
        return run(argc, argv);
    } catch (const std::exception& error) {
        std::cerr << "morvane-view: " << error.what() << '\n';
    }
    return kExitTrouble;
}
