#pragma once

#include <string>

#include <nlohmann/json.hpp>

#include "view/model/model.hpp"
#include "view/show/text_layout.hpp"

namespace view {

// Says on standard error what to know of a log before its report is believed.
void warnOf(const Model& model);

// Colours on a terminal, unless NO_COLOR is set and not empty.
Style outputStyle();

// A report of a page, as the page's script calls it.
nlohmann::ordered_json named(const std::string& name, const Model& model);

// The document of a page that shows one report.
nlohmann::ordered_json pageOf(const Model& model);

} // namespace view
