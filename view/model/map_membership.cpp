#include "view/model/map_membership.hpp"

namespace view {

MapMembership::MapMembership(const Kernel& kernel) {
    std::unordered_map<std::string, const KernelMap*> mapByDevice;
    for (const KernelMap& map : kernel.maps) {
        mapByDevice[map.device] = &map;
        for (const std::string& path : map.paths) {
            mMapOf[path] = &map;
        }
        mPathsOf[&map] = map.paths;
    }
    for (const KernelDisk& disk : kernel.disks) {
        for (const std::string& holder : disk.holders) {
            const auto map = mapByDevice.find(holder);
            if (map != mapByDevice.end() && mMapOf.try_emplace(disk.name, map->second).second) {
                mPathsOf[map->second].push_back(disk.name);
            }
        }
    }
}

const KernelMap* MapMembership::mapOf(const KernelDisk* disk) const {
    const auto found = disk == nullptr ? mMapOf.end() : mMapOf.find(disk->name);
    return found == mMapOf.end() ? nullptr : found->second;
}

std::string MapMembership::mapNameOf(const KernelDisk* disk) const {
    const KernelMap* map = mapOf(disk);
    return map == nullptr ? "" : map->name;
}

const std::vector<std::string>& MapMembership::pathsOf(const KernelMap& map) const {
    return mPathsOf.at(&map);
}

} // namespace view
