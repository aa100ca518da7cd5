#pragma once

#include <ostream>
#include <string>

#include <nlohmann/json.hpp>

namespace view {

// Writes a page that shows a JSON document by itself, without the network. The document has "title",
// "reports" (a list of {"name", "report"}, the report of kind "report") and "san" (of kind "san", or null).
void writePage(std::ostream& output, const nlohmann::ordered_json& document);

} // namespace view
