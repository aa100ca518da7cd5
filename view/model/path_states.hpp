#pragma once

#include <vector>

#include "view/kernel/kernel.hpp"
#include "view/model/verify.hpp"

namespace view {

// What the kernel and multipathd say against a path. `listed` is the path in multipathd's list; null when it
// is not.
std::vector<Detail> troublesOf(const KernelDisk& disk, const ListedPath* listed);

} // namespace view
