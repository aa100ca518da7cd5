#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>
#include <unordered_map>
#include <utility>
#include <vector>

#include "view/identity/logical_unit.hpp"
#include "view/kernel/kernel.hpp"
#include "view/model/model.hpp"
#include "view/model/path_view.hpp"
#include "view/model/verify.hpp"

namespace view {

// A device node's name in /sys/block. Some HBA libraries give two nodes, "/dev/sdb;/dev/sg4", of which the
// first is the disk's.
std::string diskName(const std::string& node);

// The device node of a name in /sys/block.
std::string nodeName(const std::string& disk);

// The digits of a WWN, however it is written: with colons in a log, behind 0x in sysfs.
std::string wwnDigits(std::string_view wwn);

// An address as a log has it: Morvane cuts a portal at its first colon, so that "[fd66" is left of an IPv6
// one.
std::string loggedAddress(std::string_view address);

// Where a path of the log leads, in what stays the same when its device gets another name.
struct Address {
    bool isFc = true;
    std::string initiator; // digits of a port WWN; of Fibre Channel only
    std::string target;    // digits of a port WWN, or an IQN
    std::string portal;    // of iSCSI
    std::uint64_t lun = 0;

    [[nodiscard]] std::string key() const { return target + '\n' + std::to_string(lun); }
};

// A device node of the log with its paths, and the disk of the kernel that it is.
struct LogDevice {
    std::string node;
    std::vector<PathView> paths; // the FC tree lists a device below each port of its adapter
    std::vector<Address> addresses;
    std::vector<std::pair<std::string, std::string>> places; // a target, and both LUN numbers there
    DeviceFacts facts;
    std::string identifier; // Morvane's
    const KernelDisk* disk = nullptr;
    bool isStale = false;
    bool isUnplaced = false; // the log is too old to tell which disk it is
    LogicalUnit unit;

    // What multipath calls the LUN; empty when it has no name for it.
    [[nodiscard]] const std::string& lunName() const { return unit.names().multipath; }

    // The path that the kernel's disk is, or the first; under the disk's name of now.
    [[nodiscard]] PathOfLun shown() const;
};

// The device nodes of a log, in their order.
class LogDevices {
public:
    explicit LogDevices(const Model& model);

    std::vector<LogDevice> devices;

private:
    LogDevice* add(const std::string& node, PathView path, const Page83& page, const Identifier& identifier,
                   const DeviceFacts& facts);

    std::unordered_map<std::string, std::size_t> mPlaces; // by node
};

} // namespace view
