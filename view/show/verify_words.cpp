#include "view/show/verify_words.hpp"

#include <array>
#include <ctime>

#include "view/show/escape.hpp"

namespace view {

namespace {

struct KindWords {
    std::string_view name;
    std::string_view meaning;
    std::string_view advice;
};

constexpr std::string_view kNewLog = "Run morvane again, and verify with the new log.";

constexpr auto kKindWords = std::to_array<KindWords>({
    {"stale-identity", "the device is not the one that the kernel remembers",
     "Do not write to it. Find out which LUN belongs there. Then let the kernel ask again (echo 1 > "
     "/sys/block/NAME/device/rescan) or remove the device (echo 1 > /sys/block/NAME/device/delete) and scan its "
     "host; then multipath -r."},
    {"mixed-map", "a map holds paths to several LUNs",
     "Do not write to the map: data goes to either LUN. Take the paths that are not its own out of it "
     "(multipathd del path NAME), see that the kernel asks these devices again, then multipath -r."},
    {"map-name", "a map was made for another LUN than its paths lead to",
     "Stop what uses the map before anything is written, and find out which LUN belongs there. Then flush the map "
     "(multipath -f MAP), let the kernel ask its paths again, and make it anew (multipath -r)."},
    {"shared-identity", "several LUNs have one name",
     "Have the array give each its own identifier, or unmap the copy: multipath takes them for paths to one LUN."},
    {"lun-without-map", "a LUN with several paths has neither a map nor PowerPath",
     "See why multipath leaves it out (multipath -v3, the blacklist, multipathd's state); a file system on one of "
     "its paths has no other to fail over to."},
    {"path-missing", "a path of a LUN is missing from its map",
     "Add it (multipathd add path NAME); if it does not stay, multipath -v3 says why."},
    {"path-state", "a path is offline, blocked or failed",
     "Look at its cable, port, zone and array; then see that the kernel's device is running again."},
    {"not-in-log", "the kernel has a device that the log lacks",
     "Run morvane again: the device came later, or its tree ended early."},
    {"not-in-kernel", "the log has a device that the kernel lacks",
     "Run morvane again: the device went away. If it should be there, scan its host."},
    {"maps-differ", "multipathd lists maps otherwise than the kernel has them",
     "Take multipathd's list and the rest at one time. If they still differ: multipathd reconfigure."},
    {"log-older-than-boot",
     "the log was made before the host was started; its devices were found by their addresses", kNewLog},
    {"log-older-than-device", "the log was made before the kernel had the device", kNewLog},
});

constexpr std::string_view kOldLogAdvice =
    "The log is older than what the kernel remembers. Run morvane again; if they still differ, do not write to "
    "the device.";

struct ReasonWords {
    std::string_view name;
    std::string_view meaning;
};

constexpr auto kReasonWords = std::to_array<ReasonWords>({
    {"no-scsi", "no SCSI device by the kernel, which keeps no page 0x83 of it"},
    {"nothing-in-log", "the log has no designators of it"},
    {"nothing-in-kernel", "the kernel keeps neither page 0x83 nor a wwid of it"},
    {"nothing-tells", "no designators tell the log's device from the kernel's"},
    {"old-log", "the log is older than the boot, and only a name would tell which device it was"},
});

template <typename Words, typename Enumeration>
const typename Words::value_type& pick(const Words& words, Enumeration value) {
    return words.at(static_cast<std::size_t>(value));
}

} // namespace

std::string_view name(FindingKind kind) {
    return pick(kKindWords, kind).name;
}

std::string_view name(NotCompared reason) {
    return pick(kReasonWords, reason).name;
}

std::string_view meaning(FindingKind kind) {
    return pick(kKindWords, kind).meaning;
}

std::string_view advice(const Finding& finding) {
    return finding.isOfOldLog ? kOldLogAdvice : pick(kKindWords, finding.kind).advice;
}

std::string_view meaning(NotCompared reason) {
    return pick(kReasonWords, reason).meaning;
}

std::string words(const Detail& detail) {
    using Kind = Detail::Kind;
    switch (detail.kind) {
    case Kind::SameKernelName:
        return "the kernel's name for both is the same; other designators differ";
    case Kind::SeveralLunNumbers:
        return "one target shows it at several LUN numbers";
    case Kind::OtherDesignators:
        return "their other designators differ";
    case Kind::OtherProduct:
        return "they are of different products";
    case Kind::DiskState:
        return "the kernel's device is " + detail.state;
    case Kind::PortState:
        return "its target port is " + detail.state;
    case Kind::SessionState:
        return "its session is " + detail.state;
    case Kind::ControllerState:
        return "its controller " + detail.device + " is " + detail.state;
    case Kind::ListedDeviceState:
        return "multipathd's device state is " + detail.state;
    case Kind::ListedMapState:
        return "multipathd's map state is " + detail.state;
    case Kind::CheckerState:
        return "multipathd's checker says " + detail.state;
    case Kind::MapNotListed:
        return "the kernel has it, multipathd's list lacks it";
    case Kind::MapListedAlone:
        return "multipathd lists it, the kernel lacks it";
    case Kind::PathListedAlone:
        return "multipathd lists " + detail.device + " in it, the kernel does not";
    default:
        return "the kernel has " + detail.device + " in it, multipathd's list does not";
    }
}

std::string particulars(const Finding& finding) {
    std::string text;
    const auto add = [&](const std::string& part) { text += (text.empty() ? "" : "; ") + part; };
    if (!finding.map.empty()) {
        add("map " + printable(finding.map));
    }
    if (finding.kind == FindingKind::StaleIdentity) {
        const std::string& lun = finding.paths.front().lun;
        add("the device says " + (lun.empty() ? "something else" : printable(lun)) +
            ", the kernel remembers " +
            (finding.remembered.empty() ? "no name" : printable(finding.remembered)));
    } else if (finding.kind == FindingKind::LunWithoutMap || finding.kind == FindingKind::SharedIdentity) {
        add(printable(finding.paths.front().lun) + " by " + std::to_string(finding.paths.size()) + " paths");
    } else if (finding.kind == FindingKind::MapName) {
        add("it was made for " + printable(finding.remembered));
    }
    for (const Detail& detail : finding.details) {
        add(printable(words(detail)));
    }
    return text;
}

std::string timeWords(std::int64_t time) {
    const auto seconds = static_cast<std::time_t>(time);
    std::tm parts{};
    std::array<char, 64> text{};
    if (seconds != time || gmtime_r(&seconds, &parts) == nullptr ||
        std::strftime(text.data(), text.size(), "%Y-%m-%d %H:%M:%S UTC", &parts) == 0) {
        return std::to_string(time) + " s after 1970";
    }
    return text.data();
}

} // namespace view
