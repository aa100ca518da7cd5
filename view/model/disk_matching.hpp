#pragma once

#include <set>
#include <string>
#include <unordered_map>
#include <unordered_set>
#include <vector>

#include "view/identity/logical_unit.hpp"
#include "view/kernel/kernel.hpp"
#include "view/model/log_devices.hpp"
#include "view/model/verify.hpp"

namespace view {

// What the kernel remembers of a disk that has a page.
LogicalUnit unitOf(const KernelDisk& disk);

// Whether the kernel tells where the path of a disk leads.
bool hasAddress(const KernelDisk& disk);

// The path to a disk that the log does not have.
PathOfLun pathTo(const KernelDisk& disk);

// Finds the disk of the kernel that each device of a log is. A name holds where the addresses agree or there
// are none; else the address alone counts, and in a log from before the boot what the device said of itself.
class DiskMatching {
public:
    // The devices and the kernel's disks must outlive the matching.
    DiskMatching(std::vector<LogDevice>& devices, const Kernel& kernel, bool isOldLog);

    // Sets the disk of each device that it finds one for, and what is unplaced.
    void match();

    // Whether a device of the log is this disk.
    [[nodiscard]] bool isTaken(const KernelDisk& disk) const { return mTaken.contains(&disk); }

private:
    [[nodiscard]] bool isNameRight(const LogDevice& device, const KernelDisk& disk) const;
    void matchByAddress(LogDevice& device);
    void matchByIdentity(LogDevice& device);
    void takeOnly(LogDevice& device, const std::set<const KernelDisk*>& candidates);
    void take(LogDevice& device, const KernelDisk& disk);

    std::vector<LogDevice>& mDevices;
    bool mIsOldLog;
    std::unordered_map<std::string, const KernelDisk*> mByName;
    std::unordered_multimap<std::string, const KernelDisk*> mByPlace;
    std::unordered_multimap<std::string, const KernelDisk*> mByIdentity;
    std::unordered_set<const KernelDisk*> mTaken;
};

} // namespace view
