#include <algorithm>
#include <cstddef>
#include <iostream>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "view/command_line.hpp"
#include "view/command_output.hpp"
#include "view/commands.hpp"
#include "view/input_log.hpp"
#include "view/show/escape.hpp"
#include "view/show/path_table.hpp"
#include "view/show/words.hpp"
#include "view/trouble.hpp"

namespace view {

namespace {

struct Request {
    std::vector<std::string> columns = {"device", "luid", "initiator", "target", "lun"}; // together 97 wide
    std::vector<std::string> filters;
    bool hasNoHeader = false;
    bool isCsv = false;
    bool isJsonLines = false;
};

std::vector<std::string> columnNames() {
    std::vector<std::string> names;
    for (const PathColumn& column : pathColumns()) {
        names.emplace_back(column.name);
    }
    return names;
}

const PathColumn* columnOf(std::string_view name) {
    const std::vector<PathColumn>& columns = pathColumns();
    const auto found = std::find_if(columns.begin(), columns.end(),
                                    [&](const PathColumn& column) { return column.name == name; });
    if (found == columns.end()) {
        throw Trouble("there is no column \"" + printable(name) + "\"; there are " +
                      CLI::detail::join(columnNames(), ", "));
    }
    return &*found;
}

// "COLUMN=GLOB" or "COLUMN!=GLOB".
PathFilter filterOf(const std::string& text) {
    const std::size_t sign = text.find('=');
    if (sign == std::string::npos) {
        throw Trouble("the filter \"" + printable(text) + "\" is neither COLUMN=GLOB nor COLUMN!=GLOB");
    }
    const bool isMatching = sign == 0 || text[sign - 1] != '!';
    return {columnOf(std::string_view(text).substr(0, isMatching ? sign : sign - 1)), text.substr(sign + 1),
            isMatching};
}

int run(const CommandLine& line, const Request& request) {
    PathQuery query;
    for (const std::string& name : request.columns) {
        query.columns.push_back(columnOf(name));
    }
    for (const std::string& filter : request.filters) {
        query.filters.push_back(filterOf(filter));
    }
    query.hasHeader = !request.hasNoHeader;
    const Model model = openLog(line.log);
    warnOf(model);
    if (const std::size_t problems = problemCount(model); problems > 0) {
        std::cerr << "morvane-view: warning: " << printable(model.log.name) << ": the report tells of "
                  << counted(problems, "problem") << "; what was dropped has no row\n";
    }
    if (request.isCsv) {
        writePathCsv(std::cout, model, query);
    } else if (request.isJsonLines) {
        writePathJsonLines(std::cout, model, query);
    } else {
        writePathTable(std::cout, model, query);
    }
    return kExitSame;
}

} // namespace

void addPaths(CommandLine& line) {
    const auto request = std::make_shared<Request>();
    CLI::App* command = line.addCommand("paths", "show the paths as one flat table",
                                        [&line, request] { return run(line, *request); });
    command->excludes(line.pageOption);
    command->excludes(line.jsonOption);
    std::string columns = "Columns:\n";
    for (const PathColumn& column : pathColumns()) {
        columns += "  " + std::string(column.name) + std::string(12 - column.name.size(), ' ') +
                   std::string(column.description) + '\n';
    }
    command->footer(columns);
    command->add_option("LOG", line.log, "the log to read, - for standard input")
        ->type_name("FILE")
        ->capture_default_str();
    CLI::Option* option =
        command->add_option("-o,--columns", request->columns, "the columns, with commas between");
    option->type_name("COLUMN")->delimiter(',')->allow_extra_args(false);
    line.words[option] = columnNames();
    command
        ->add_option("--filter", request->filters,
                     "only rows whose COLUMN matches GLOB (!= does not); of several, all")
        ->type_name("COLUMN=GLOB")
        ->allow_extra_args(false);
    command->add_flag("--no-header", request->hasNoHeader, "leave out the names of the columns");
    CLI::Option* csv = command->add_flag("--csv", request->isCsv, "write CSV");
    command->add_flag("--json-lines", request->isJsonLines, "write JSON, an object a line")->excludes(csv);
}

} // namespace view
