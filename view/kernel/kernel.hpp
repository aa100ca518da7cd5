#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

// What a host's kernel and its multipathd remember of its devices. Texts are kept byte for byte, without the
// line ends of the files that they come from.
namespace view {

// One of the ways to an NVMe namespace that the kernel joins by itself.
struct NvmePath {
    std::string controller; // "nvme0"
    std::string state;      // "live"; empty when it is not told
};

// A disk of /sys/block that stands for a piece of hardware.
struct KernelDisk {
    std::string name;        // "sdc"; an exclamation mark stands for a slash of the device node's name
    std::string scsiAddress; // host:channel:target:LUN; empty when nothing tells it
    std::optional<std::uint64_t> lun; // of that
    bool isScsi = false;
    std::string vendor;
    std::string model;
    std::string wwid;                                // empty when there is none
    std::optional<std::vector<std::uint8_t>> page83; // VPD page 83h, with its header
    std::string state;                               // "running", "offline", ...; empty when it is not told

    std::string
        initiatorPort; // of Fibre Channel: 16 hexadecimal digits behind "0x"; all of these empty elsewhere
    std::string targetPort;
    std::string portState; // "Online", "Blocked", ...

    std::string targetIqn; // of iSCSI; all of these empty elsewhere
    std::vector<std::string> targetAddresses;
    std::string sessionState; // "LOGGED_IN", "FAILED", ...

    std::vector<NvmePath> nvmePaths;
    std::vector<std::string> holders;       // block devices that stand on it: "dm-0"
    std::optional<std::int64_t> knownSince; // seconds since the epoch at which udev had it ready
};

// A multipath map: a device-mapper device that multipath made.
struct KernelMap {
    std::string device;             // "dm-0"
    std::string name;               // "mpatha"
    std::string wwid;               // for which it was made
    std::vector<std::string> paths; // names of disks
};

struct Kernel {
    std::string host;                     // its name; empty when it is not told
    std::optional<std::int64_t> bootTime; // seconds since the epoch
    std::vector<KernelDisk> disks;
    std::vector<KernelMap> maps;
};

// A path as multipathd lists it.
struct ListedPath {
    std::string device;      // "sdc"
    std::string mapState;    // of device-mapper: "active", "failed", "undef"
    std::string deviceState; // of the kernel: "running", "offline", ...
    std::string checkState;  // of the path checker: "ready", "ghost", "faulty", ...
};

// A map as multipathd lists it.
struct ListedMap {
    std::string name;
    std::string wwid;
    std::vector<ListedPath> paths;
};

} // namespace view
