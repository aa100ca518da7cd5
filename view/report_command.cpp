#include <iostream>

#include "view/command_line.hpp"
#include "view/command_output.hpp"
#include "view/commands.hpp"
#include "view/input_log.hpp"
#include "view/output_file.hpp"
#include "view/show/html_page.hpp"
#include "view/show/json.hpp"
#include "view/show/prometheus.hpp"
#include "view/show/text.hpp"

namespace view {

int runReport(const CommandLine& line) {
    const Model model = openLog(line.log);
    if (!line.page.empty()) {
        const nlohmann::ordered_json document = pageOf(model);
        writeOutput(line.page, {line.log}, [&](std::ostream& output) { writePage(output, document); });
    }
    if (line.json) {
        std::cout << toJson(model).dump(2) << '\n';
    }
    if (!line.metrics.empty()) {
        writeOutput(line.metrics, {line.log},
                    [&](std::ostream& output) { writePrometheus(output, model, timeWritten(line.log)); });
    }
    if (line.json || !line.page.empty() || !line.metrics.empty()) {
        warnOf(model);
    } else {
        writeText(std::cout, model, outputStyle());
    }
    return kExitSame;
}

} // namespace view
