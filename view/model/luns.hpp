#pragma once

#include "view/identity/names.hpp"
#include "view/model/model.hpp"

namespace view {

// Fills the model's LUNs: what the trees list, grouped by identifier. Adds a problem for each identifier that
// several LUNs share and for each LUN whose paths other programs would name differently, and puts the
// problems into their order.
void groupLuns(Model& model);

// What other programs call the device that answered with `page83`; nothing when the log has no answer.
Names namesOf(const Page83& page83, const DeviceFacts& facts);

} // namespace view
