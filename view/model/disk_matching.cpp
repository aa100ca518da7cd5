#include "view/model/disk_matching.hpp"

#include <algorithm>
#include <string_view>

namespace view {

namespace {

// A WWN of sysfs as a log writes it.
std::string loggedWwn(std::string_view wwn) {
    std::string written;
    for (const char digit : wwnDigits(wwn)) {
        written += written.size() % 3 == 2 ? ":" : "";
        written += digit;
    }
    return written;
}

bool isAt(const Address& address, const KernelDisk& disk) {
    if (disk.lun != address.lun) {
        return false;
    }
    if (address.isFc) {
        return wwnDigits(disk.targetPort) == address.target &&
               (disk.initiatorPort.empty() || wwnDigits(disk.initiatorPort) == address.initiator);
    }
    const auto isPortal = [&](const std::string& portal) { return loggedAddress(portal) == address.portal; };
    return disk.targetIqn == address.target &&
           (disk.targetAddresses.empty() ||
            std::any_of(disk.targetAddresses.begin(), disk.targetAddresses.end(), isPortal));
}

bool isAtOneOf(const LogDevice& device, const KernelDisk& disk) {
    return std::any_of(device.addresses.begin(), device.addresses.end(),
                       [&](const Address& address) { return isAt(address, disk); });
}

// What the kernel calls a disk, or would; empty when it has no name.
std::string nameOf(const KernelDisk& disk) {
    return disk.page83 ? unitOf(disk).names().kernel : disk.wwid;
}

} // namespace

LogicalUnit unitOf(const KernelDisk& disk) {
    return {*disk.page83, disk.vendor, disk.model};
}

bool hasAddress(const KernelDisk& disk) {
    return disk.lun && (!disk.targetPort.empty() || !disk.targetIqn.empty());
}

PathOfLun pathTo(const KernelDisk& disk) {
    const bool isFc = !disk.targetPort.empty();
    const bool isIscsi = !disk.targetIqn.empty();
    PathView path;
    path.tree = isFc ? Tree::Fc : isIscsi ? Tree::Iscsi : Tree::Direct;
    path.device = nodeName(disk.name);
    path.initiator = loggedWwn(disk.initiatorPort);
    path.target = isFc ? loggedWwn(disk.targetPort) : disk.targetIqn;
    if (isIscsi && !disk.targetAddresses.empty()) {
        path.target += ' ' + disk.targetAddresses.front();
    }
    path.lun = (isFc || isIscsi) && disk.lun ? std::to_string(*disk.lun) : "";
    return {path, disk.page83 ? unitOf(disk).names().multipath : ""};
}

DiskMatching::DiskMatching(std::vector<LogDevice>& devices, const Kernel& kernel, bool isOldLog)
    : mDevices(devices), mIsOldLog(isOldLog) {
    for (const KernelDisk& disk : kernel.disks) {
        mByName.emplace(disk.name, &disk);
        if (hasAddress(disk)) {
            const std::string target = disk.targetPort.empty() ? disk.targetIqn : wwnDigits(disk.targetPort);
            mByPlace.emplace(Address{true, {}, target, {}, *disk.lun}.key(), &disk);
        }
        if (const std::string name = nameOf(disk); isOldLog && !name.empty()) {
            mByIdentity.emplace(name, &disk);
        }
    }
}

void DiskMatching::match() {
    for (LogDevice& device : mDevices) {
        const auto named = mByName.find(diskName(device.node));
        if (named != mByName.end() && isNameRight(device, *named->second)) {
            take(device, *named->second);
        }
    }
    for (LogDevice& device : mDevices) {
        if (device.disk == nullptr) {
            matchByAddress(device);
        }
        if (device.disk == nullptr && mIsOldLog) {
            matchByIdentity(device);
        }
    }
}

bool DiskMatching::isNameRight(const LogDevice& device, const KernelDisk& disk) const {
    return hasAddress(disk) && !device.addresses.empty() ? isAtOneOf(device, disk) : !mIsOldLog;
}

void DiskMatching::matchByAddress(LogDevice& device) {
    std::set<const KernelDisk*> candidates;
    for (const Address& address : device.addresses) {
        const auto [first, last] = mByPlace.equal_range(address.key());
        for (auto place = first; place != last; ++place) {
            if (isAt(address, *place->second) && !isTaken(*place->second)) {
                candidates.insert(place->second);
            }
        }
    }
    takeOnly(device, candidates);
}

void DiskMatching::matchByIdentity(LogDevice& device) {
    std::set<const KernelDisk*> candidates;
    const auto [first, last] = mByIdentity.equal_range(device.unit.names().kernel);
    for (auto place = first; place != last; ++place) {
        if (!isTaken(*place->second)) {
            candidates.insert(place->second);
        }
    }
    takeOnly(device, candidates);
    device.isUnplaced = device.disk == nullptr;
}

void DiskMatching::takeOnly(LogDevice& device, const std::set<const KernelDisk*>& candidates) {
    if (candidates.size() == 1) {
        take(device, **candidates.begin());
    }
}

void DiskMatching::take(LogDevice& device, const KernelDisk& disk) {
    device.disk = &disk;
    mTaken.insert(&disk);
}

} // namespace view
