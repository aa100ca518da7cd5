#pragma once

#include <string>
#include <unordered_map>
#include <vector>

#include "view/kernel/kernel.hpp"

namespace view {

// Who is in which map of multipath: a map knows its paths, and a disk what stands on it; both together tell.
// The kernel's maps and disks must outlive it.
class MapMembership {
public:
    explicit MapMembership(const Kernel& kernel);

    // The map that a disk is in; null for none, and for a null disk.
    [[nodiscard]] const KernelMap* mapOf(const KernelDisk* disk) const;

    // Its name; empty for none.
    [[nodiscard]] std::string mapNameOf(const KernelDisk* disk) const;

    // The names of the disks in a map, in the order of the map and then of the disks.
    [[nodiscard]] const std::vector<std::string>& pathsOf(const KernelMap& map) const;

private:
    std::unordered_map<std::string, const KernelMap*> mMapOf;                // by the name of a disk
    std::unordered_map<const KernelMap*, std::vector<std::string>> mPathsOf; // of every map
};

} // namespace view
