#pragma once

#include <string_view>

#include "view/model/model.hpp"

namespace view {

// Whether a text tells one logical unit from another at all: it is neither empty nor all blanks or zeros.
bool isTelling(std::string_view identifier);

// Fills the model's LUNs: what the trees list, grouped by identifier. Adds a problem for each identifier that
// several LUNs share, and puts the problems into their order.
void groupLuns(Model& model);

} // namespace view
