#include "view/command_output.hpp"

#include <unistd.h>

#include <cstdlib>
#include <iostream>
#include <utility>

#include "view/show/escape.hpp"
#include "view/show/json.hpp"
#include "view/show/warnings.hpp"

namespace view {

void warnOf(const Model& model) {
    for (const std::string& warning : warningsOf(model.log)) {
        std::cerr << "morvane-view: warning: " << printable(model.log.name) << ": " << warning << '\n';
    }
}

Style outputStyle() {
    const char* noColour = std::getenv("NO_COLOR");
    return Style::of((noColour == nullptr || *noColour == '\0') && isatty(STDOUT_FILENO) == 1);
}

nlohmann::ordered_json named(const std::string& name, const Model& model) {
    return {{"name", name}, {"report", toJson(model)}};
}

nlohmann::ordered_json pageOf(const Model& model) {
    const std::string host = model.host.empty() ? "an unnamed host" : printable(model.host);
    nlohmann::ordered_json reports = nlohmann::ordered_json::array();
    reports.push_back(named(host, model));
    return {{"title", "Storage paths of " + host}, {"reports", std::move(reports)}, {"san", nullptr}};
}

} // namespace view
