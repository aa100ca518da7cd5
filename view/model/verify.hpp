#pragma once

#include <cstddef>
#include <cstdint>
#include <map>
#include <optional>
#include <string>
#include <vector>

#include "view/kernel/kernel.hpp"
#include "view/model/model.hpp"
#include "view/model/path_view.hpp"

namespace view {

// What is wrong between the devices, the kernel's memory of them and multipath's, the worst first.
enum class FindingKind : unsigned char {
    StaleIdentity,   // the device is not the one that the kernel remembers
    MixedMap,        // a map holds paths to several LUNs
    MapName,         // a map was made for another LUN than its paths lead to
    SharedIdentity,  // several LUNs have one name
    LunWithoutMap,   // a LUN with several paths has neither a map nor PowerPath
    PathMissing,     // a path of a LUN is in no map, and others of it are
    PathState,       // a path is offline, blocked or failed
    NotInLog,        // the kernel has a device that the log lacks
    NotInKernel,     // the log has a device that the kernel lacks
    MapsDiffer,      // multipathd lists a map otherwise than the kernel has it
    OlderThanBoot,   // the log was made before the host was started
    OlderThanDevice, // the log was made before the kernel had this device
};

// Whether data may be read from or written to a wrong LUN.
constexpr bool isDanger(FindingKind kind) {
    return kind <= FindingKind::SharedIdentity;
}

// A path, and the name of the LUN that the log shows there; empty when it shows none.
struct PathOfLun {
    PathView path;
    std::string lun;
};

// A particular of a finding.
struct Detail {
    enum class Kind : unsigned char {
        // Of StaleIdentity.
        SameKernelName, // other designators differ
        // Of SharedIdentity: why several LUNs are behind the name.
        SeveralLunNumbers, // at one target
        OtherDesignators,
        OtherProduct,
        // Of PathState: who says that the path is in the state.
        DiskState,
        PortState,
        SessionState,
        ControllerState,
        ListedDeviceState, // this and the following: multipathd
        ListedMapState,
        CheckerState,
        // Of MapsDiffer: who knows the map, or a device in it, alone.
        MapNotListed,
        MapListedAlone,
        PathListedAlone,
        PathNotListed,
    };
    Kind kind = Kind::SameKernelName;
    std::string device; // the controller of ControllerState, the device of PathListedAlone and PathNotListed
    std::string state;  // of the kinds of PathState
};

struct Finding {
    FindingKind kind = FindingKind::StaleIdentity;
    std::vector<PathOfLun> paths; // that it is about; none where it is about a map or the log alone
    std::string map;              // that holds them or should, by its name; empty when none does
    std::string remembered;       // of StaleIdentity and MapName: the name that the kernel or the map has
    std::vector<Detail> details;
    bool isOfOldLog = false; // of StaleIdentity: the log is older than the kernel's memory
};

// Why a device of the log could not be compared.
enum class NotCompared : unsigned char {
    NoScsi, // it is none, or names itself by nothing that the kernel keeps: NVMe, virtio, old controllers
    NothingInLog, // the log has no identification of it
    NothingInKernel,
    NothingTells, // the log or the kernel has one that names no logical unit
    OldLog,       // the log is older than the boot, and nothing but a name tells which device it was
};

struct Verification {
    std::string host;
    std::optional<std::int64_t> logTime; // seconds since the epoch
    std::optional<std::int64_t> bootTime;
    std::vector<Finding> findings;  // by kind, then in the order of the log
    std::size_t comparedByPage = 0; // devices, with the kernel's VPD page 83h
    std::size_t comparedByWwid = 0; // with the name that it made of one
    std::size_t renamed = 0;        // of the compared: found by their address under another name
    std::map<NotCompared, std::vector<std::string>> notCompared; // devices
    std::size_t luns = 0;                                        // named ones
    std::size_t maps = 0;
    std::size_t mapsCompared = 0; // whose paths lead to LUNs that the log names
    std::size_t mapPaths = 0;     // in these
    std::size_t statesChecked = 0;
    std::size_t listedMaps = 0; // multipathd's
};

// Compares what the devices said of themselves, as the log has it, with what the kernel and multipath
// remember. `listed` is what multipathd lists, null when it was not asked. The log's time is the model's.
Verification verify(const Model& model, const Kernel& kernel, const std::vector<ListedMap>* listed);

} // namespace view
