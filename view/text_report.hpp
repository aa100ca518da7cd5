#pragma once

#include <ostream>
#include <string>
#include <vector>

#include "view/model.hpp"
#include "view/text_layout.hpp"

namespace view {

// What is odd about the log itself, a sentence each, fit to be shown; empty for a whole log of one run.
std::vector<std::string> logWarnings(const LogFacts& log);

// Writes the report as text for a reader: problems first, then LUNs by identity, then the trees.
void writeText(std::ostream& output, const Model& model, const Style& style);

} // namespace view
