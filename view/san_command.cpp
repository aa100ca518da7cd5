#include <cstddef>
#include <iostream>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "view/command_line.hpp"
#include "view/command_output.hpp"
#include "view/commands.hpp"
#include "view/input_log.hpp"
#include "view/model/san.hpp"
#include "view/output_file.hpp"
#include "view/show/html_page.hpp"
#include "view/show/json.hpp"
#include "view/show/text.hpp"
#include "view/trouble.hpp"

namespace view {

namespace {

int run(const CommandLine& line, const std::vector<std::string>& logs) {
    std::vector<Model> reports;
    int status = kExitSame;
    for (const std::string& log : logs) {
        try {
            reports.push_back(openLog(log));
            warnOf(reports.back());
        } catch (const Trouble& trouble) {
            std::cerr << "morvane-view: left out: " << trouble.what() << '\n';
            status = kExitTrouble;
        }
    }
    if (reports.empty()) {
        throw Trouble("there is no log to show");
    }
    const San joined = join(reports);
    if (!line.page.empty()) {
        nlohmann::ordered_json list = nlohmann::ordered_json::array();
        const nlohmann::ordered_json summary = toJson(joined);
        for (std::size_t i = 0; i < reports.size(); ++i) {
            list.push_back(named(summary["hosts"][i]["name"], reports[i]));
        }
        const nlohmann::ordered_json document = {
            {"title", "SAN view of " + std::to_string(reports.size()) + " logs"},
            {"reports", std::move(list)},
            {"san", summary}};
        writeOutput(line.page, logs, [&](std::ostream& output) { writePage(output, document); });
    }
    if (line.json) {
        std::cout << toJson(joined).dump(2) << '\n';
    } else if (line.page.empty()) {
        writeText(std::cout, joined, outputStyle());
    }
    return status;
}

} // namespace

void addSan(CommandLine& line) {
    const auto logs = std::make_shared<std::vector<std::string>>();
    CLI::App* command = line.addCommand("san", "show the logs of many hosts as one view",
                                        [&line, logs] { return run(line, *logs); });
    command->add_option("LOG", *logs, "the hosts' logs")->required()->type_name("FILE");
    line.addJson(command);
    line.addPage(command);
}

} // namespace view
