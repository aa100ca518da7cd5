#pragma once

#include "view/kernel/host_tree.hpp"
#include "view/kernel/kernel.hpp"

namespace view {

// The host's name; empty when it is not told.
std::string hostNameOf(HostTree& tree);

// Reads what the kernel tells below sys, its name and the time of its boot, and what udev has noted of the
// devices' ages. What a kernel does not tell stays empty. Throws std::runtime_error when there is no
// sys/block.
Kernel readKernel(HostTree& tree);

} // namespace view
