#pragma once

#include <string_view>
#include <vector>

#include "view/kernel/kernel.hpp"

namespace view {

// The maps of the JSON that "multipathd show maps json" prints. Throws std::runtime_error, which says why,
// for anything else.
std::vector<ListedMap> readMaps(std::string_view json);

} // namespace view
