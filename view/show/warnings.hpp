#pragma once

#include <string>
#include <vector>

#include "view/model/diff.hpp"
#include "view/model/model.hpp"

namespace view {

// What is odd about a log itself, a sentence each, fit to be shown; empty for a whole log of one run.
std::vector<std::string> warningsOf(const LogFacts& log);

// Why two logs may not compare well, a sentence each, fit to be shown.
std::vector<std::string> warningsOf(const Difference& difference);

} // namespace view
