// What the kernel, udev and multipath of a simulated host remember of its disks.
#pragma once

#include <filesystem>

#include "simhost/description.hpp"

namespace simhost {

// Writes each of the host's memories as the files of a root, in a folder of its name below `folder`: `sys`,
// `proc`, `run`, and multipathd's list as `MorvaneLogs/maps.json`. Every node of a disk is a device there, at
// its place of /sys/block or, without one, at a place of its own. `folder` is made, and must be empty when it
// is there. Throws std::system_error.
void writeMemories(const Host& host, const std::filesystem::path& folder);

} // namespace simhost
