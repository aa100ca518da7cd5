#pragma once

#include "view/model/model.hpp"

namespace view {

// Fills the model's LUNs: what the trees list, grouped by identifier. Adds a problem for each identifier that
// several LUNs share, and puts the problems into their order.
void groupLuns(Model& model);

} // namespace view
