#include "view/model/verify.hpp"

#include <algorithm>
#include <array>
#include <cctype>
#include <set>
#include <string_view>
#include <unordered_map>
#include <unordered_set>
#include <utility>

#include "view/identity/logical_unit.hpp"

namespace view {

namespace {

// ---- Names ----

// A device node's name in /sys/block. Some HBA libraries give two nodes, "/dev/sdb;/dev/sg4", of which the
// first is the disk's.
std::string diskName(const std::string& node) {
    constexpr std::string_view kDevices = "/dev/";
    std::string name = node.substr(0, node.find(';'));
    name.erase(0, name.starts_with(kDevices) ? kDevices.size() : 0);
    std::replace(name.begin(), name.end(), '/', '!');
    return name;
}

std::string nodeName(const std::string& disk) {
    std::string name = "/dev/" + disk;
    std::replace(name.begin(), name.end(), '!', '/');
    return name;
}

// The digits of a WWN, however it is written: with colons in a log, behind 0x in sysfs.
std::string wwnDigits(std::string_view wwn) {
    std::string digits;
    for (const char c : wwn.starts_with("0x") ? wwn.substr(2) : wwn) {
        if (c != ':') {
            digits += static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
        }
    }
    return digits;
}

// A WWN of sysfs as a log writes it.
std::string loggedWwn(std::string_view wwn) {
    std::string written;
    for (const char digit : wwnDigits(wwn)) {
        written += written.size() % 3 == 2 ? ":" : "";
        written += digit;
    }
    return written;
}

// An address as a log has it: Morvane cuts a portal at its first colon, so that "[fd66" is left of an IPv6
// one.
std::string loggedAddress(std::string_view address) {
    const std::string_view open = address.substr(address.starts_with('[') ? 1 : 0);
    return std::string(open.substr(0, open.find(':')));
}

// ---- The devices of the log ----

// Where a path of the log leads, in what stays the same when its device gets another name.
struct Address {
    bool isFc = true;
    std::string initiator; // digits of a port WWN; of Fibre Channel only
    std::string target;    // digits of a port WWN, or an IQN
    std::string portal;    // of iSCSI
    std::uint64_t lun = 0;

    [[nodiscard]] std::string key() const { return target + '\n' + std::to_string(lun); }
};

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

    // The path that the kernel's disk is, or the first.
    [[nodiscard]] PathOfLun shown() const {
        PathOfLun shown{paths.front(), lunName()};
        for (const PathView& path : paths) {
            if (disk != nullptr && !disk->initiatorPort.empty() &&
                wwnDigits(path.initiator) == wwnDigits(disk->initiatorPort)) {
                shown.path = path;
                break;
            }
        }
        if (disk != nullptr) {
            shown.path.device = nodeName(disk->name);
        }
        return shown;
    }
};

class LogDevices {
public:
    explicit LogDevices(const Model& model) {
        for (std::size_t i = 0; i < model.fc.paths.size(); ++i) {
            const FcPath& path = model.fc.paths[i];
            LogDevice* device = add(path.device, describe(model, {Sighting::Place::FcPath, i, 0}),
                                    path.page83, path.identifier, path.facts);
            if (device != nullptr) {
                device->addresses.push_back(
                    {true, wwnDigits(path.initiator), wwnDigits(path.targetPort), {}, path.lun});
                device->places.emplace_back(std::to_string(path.adapter) + ' ' + path.targetPort,
                                            lunNumbers(path));
            }
        }
        for (std::size_t i = 0; i < model.fc.adapters.size(); ++i) {
            const Adapter& adapter = model.fc.adapters[i];
            for (std::size_t k = 0; k < adapter.unlisted.size(); ++k) {
                const UnlistedLun& lun = adapter.unlisted[k];
                add(lun.device, describe(model, {Sighting::Place::Unlisted, k, i}), lun.page83,
                    lun.identifier, lun.facts);
            }
        }
        for (std::size_t i = 0; i < model.iscsi.paths.size(); ++i) {
            const IscsiPath& path = model.iscsi.paths[i];
            LogDevice* device = add(path.device, describe(model, {Sighting::Place::IscsiPath, i, 0}),
                                    path.page83, path.identifier, {});
            if (device != nullptr && path.lun >= 0) {
                device->addresses.push_back({false,
                                             {},
                                             path.targetIqn,
                                             loggedAddress(path.targetAddress),
                                             static_cast<std::uint64_t>(path.lun)});
                device->places.emplace_back(path.initiatorPort + ' ' + path.targetIqn + ' ' +
                                                path.targetAddress,
                                            std::to_string(path.lun));
            }
        }
        for (std::size_t i = 0; i < model.direct.devices.size(); ++i) {
            const DirectDevice& direct = model.direct.devices[i];
            add(direct.device, describe(model, {Sighting::Place::DirectDevice, i, 0}), direct.page83,
                direct.identifier, {});
        }
    }

    std::vector<LogDevice> devices;

private:
    // The device of a node; null for what is no disk: a LUN without a node, an sg node.
    LogDevice* add(const std::string& node, PathView path, const Page83& page, const Identifier& identifier,
                   const DeviceFacts& facts) {
        if (node.empty() || diskName(node).starts_with("sg")) {
            return nullptr;
        }
        const auto [place, isNew] = mPlaces.try_emplace(node, devices.size());
        if (isNew) {
            LogDevice device;
            device.node = node;
            device.facts = facts;
            device.identifier = identifier.text;
            if (page != nullptr) {
                device.unit = LogicalUnit(*page, facts.vendor, facts.product);
            }
            devices.push_back(std::move(device));
        }
        LogDevice& device = devices[place->second];
        device.paths.push_back(std::move(path));
        return &device;
    }

    std::unordered_map<std::string, std::size_t> mPlaces; // by node
};

// ---- Which disk of the kernel a device of the log is ----

// What the kernel remembers of a disk that has a page.
LogicalUnit unitOf(const KernelDisk& disk) {
    return {*disk.page83, disk.vendor, disk.model};
}

bool hasAddress(const KernelDisk& disk) {
    return disk.lun && (!disk.targetPort.empty() || !disk.targetIqn.empty());
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

// Finds the disks. A name holds where the addresses agree or there are none; else the address alone counts,
// and in a log from before the boot what the device said of itself.
class Matching {
public:
    Matching(std::vector<LogDevice>& devices, const Kernel& kernel, bool isOldLog)
        : mDevices(devices), mIsOldLog(isOldLog) {
        for (const KernelDisk& disk : kernel.disks) {
            mByName.emplace(disk.name, &disk);
            if (hasAddress(disk)) {
                const std::string target =
                    disk.targetPort.empty() ? disk.targetIqn : wwnDigits(disk.targetPort);
                mByPlace.emplace(Address{true, {}, target, {}, *disk.lun}.key(), &disk);
            }
            if (const std::string name = nameOf(disk); isOldLog && !name.empty()) {
                mByIdentity.emplace(name, &disk);
            }
        }
    }

    void match() {
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

    [[nodiscard]] bool isTaken(const KernelDisk& disk) const { return mTaken.contains(&disk); }

private:
    static std::string nameOf(const KernelDisk& disk) {
        return disk.page83 ? unitOf(disk).names().kernel : disk.wwid;
    }

    [[nodiscard]] bool isNameRight(const LogDevice& device, const KernelDisk& disk) const {
        return hasAddress(disk) && !device.addresses.empty() ? isAtOneOf(device, disk) : !mIsOldLog;
    }

    void matchByAddress(LogDevice& device) {
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

    void matchByIdentity(LogDevice& device) {
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

    void takeOnly(LogDevice& device, const std::set<const KernelDisk*>& candidates) {
        if (candidates.size() == 1) {
            take(device, **candidates.begin());
        }
    }

    void take(LogDevice& device, const KernelDisk& disk) {
        device.disk = &disk;
        mTaken.insert(&disk);
    }

    std::vector<LogDevice>& mDevices;
    bool mIsOldLog;
    std::unordered_map<std::string, const KernelDisk*> mByName;
    std::unordered_multimap<std::string, const KernelDisk*> mByPlace;
    std::unordered_multimap<std::string, const KernelDisk*> mByIdentity;
    std::unordered_set<const KernelDisk*> mTaken;
};

// The path to a disk that the log does not have.
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

// ---- The comparison ----

class Comparison {
public:
    Comparison(const Model& model, const Kernel& kernel, const std::vector<ListedMap>* listed)
        : mModel(model), mKernel(kernel), mListed(listed),
          mIsOldLog(model.time && kernel.bootTime && *model.time < *kernel.bootTime), mLog(model),
          mMatching(mLog.devices, kernel, mIsOldLog) {
        mMatching.match();
        for (LogDevice& device : mLog.devices) {
            if (device.disk != nullptr) {
                mDeviceOf[device.disk->name] = &device;
            }
            if (!device.lunName().empty()) {
                const auto [place, isNew] = mLunPlaces.try_emplace(device.lunName(), mLuns.size());
                if (isNew) {
                    mLuns.emplace_back();
                }
                mLuns[place->second].push_back(&device);
            }
        }
        readMembership();
    }

    Verification run() {
        mResult.host = mModel.host.empty() ? mKernel.host : mModel.host;
        mResult.logTime = mModel.time;
        mResult.bootTime = mKernel.bootTime;
        mResult.luns = mLuns.size();
        compareAges();
        for (LogDevice& device : mLog.devices) {
            compareIdentity(device);
        }
        for (const KernelMap& map : mKernel.maps) {
            compareMap(map);
        }
        for (const std::vector<LogDevice*>& lun : mLuns) {
            compareLun(lun);
        }
        compareStates();
        comparePresence();
        compareListed();
        std::stable_sort(mResult.findings.begin(), mResult.findings.end(),
                         [](const Finding& one, const Finding& other) { return one.kind < other.kind; });
        return std::move(mResult);
    }

private:
    Finding& find(FindingKind kind) {
        mResult.findings.emplace_back();
        mResult.findings.back().kind = kind;
        return mResult.findings.back();
    }

    // A map knows its paths, and a disk what stands on it; both together tell who is in which map.
    void readMembership() {
        for (const KernelMap& map : mKernel.maps) {
            mMapByDevice[map.device] = &map;
            for (const std::string& path : map.paths) {
                mMapOf[path] = &map;
                mPathsOf[&map].push_back(path);
            }
        }
        for (const KernelDisk& disk : mKernel.disks) {
            for (const std::string& holder : disk.holders) {
                const auto map = mMapByDevice.find(holder);
                if (map != mMapByDevice.end() && mMapOf.try_emplace(disk.name, map->second).second) {
                    mPathsOf[map->second].push_back(disk.name);
                }
            }
        }
    }

    [[nodiscard]] const KernelMap* mapOf(const KernelDisk* disk) const {
        const auto found = disk == nullptr ? mMapOf.end() : mMapOf.find(disk->name);
        return found == mMapOf.end() ? nullptr : found->second;
    }

    [[nodiscard]] std::string mapNameOf(const KernelDisk* disk) const {
        const KernelMap* map = mapOf(disk);
        return map == nullptr ? "" : map->name;
    }

    void compareAges() {
        if (mIsOldLog) {
            find(FindingKind::OlderThanBoot);
        }
        for (const LogDevice& device : mLog.devices) {
            if (device.disk != nullptr && isYounger(*device.disk) && !mIsOldLog) {
                find(FindingKind::OlderThanDevice).paths = {device.shown()};
            }
        }
    }

    [[nodiscard]] bool isYounger(const KernelDisk& disk) const {
        return mModel.time && disk.knownSince && *mModel.time < *disk.knownSince;
    }

    void compareIdentity(LogDevice& device) {
        const KernelDisk* disk = device.disk;
        if (disk == nullptr) {
            if (device.isUnplaced) {
                leaveOut(NotCompared::OldLog, device);
            }
            return;
        }
        if (!disk->isScsi) {
            leaveOut(NotCompared::NoScsi, device);
        } else if (!device.unit.isNamed()) {
            leaveOut(NotCompared::NothingInLog, device);
        } else if (disk->page83) {
            const LogicalUnit known = unitOf(*disk);
            if (const auto isSame = device.unit.isSame(known)) {
                ++mResult.comparedByPage;
                judge(device, *isSame, known.names().kernel);
            } else {
                leaveOut(NotCompared::NothingTells, device);
            }
        } else if (!disk->wwid.empty() && device.unit.isNamed()) {
            ++mResult.comparedByWwid;
            judge(device, device.unit.isKernelName(disk->wwid), disk->wwid);
        } else {
            leaveOut(NotCompared::NothingInKernel, device);
        }
    }

    void leaveOut(NotCompared reason, const LogDevice& device) {
        mResult.notCompared[reason].push_back(device.node);
    }

    void judge(LogDevice& device, bool isSame, const std::string& remembered) {
        mResult.renamed += device.disk->name == diskName(device.node) ? 0U : 1U;
        if (isSame) {
            return;
        }
        device.isStale = true;
        Finding& finding = find(FindingKind::StaleIdentity);
        finding.paths = {device.shown()};
        finding.remembered = remembered;
        finding.map = mapNameOf(device.disk);
        if (remembered == device.unit.names().kernel) {
            finding.details.emplace_back("the kernel's name for both is the same; other designators differ");
        }
        finding.isOfOldLog = mIsOldLog || isYounger(*device.disk);
    }

    void compareMap(const KernelMap& map) {
        ++mResult.maps;
        std::vector<PathOfLun> paths;
        std::set<std::string> names;
        bool isAccepted = false;
        for (const std::string& path : mPathsOf[&map]) {
            const auto found = mDeviceOf.find(path);
            if (found != mDeviceOf.end() && !found->second->lunName().empty()) {
                paths.push_back(found->second->shown());
                names.insert(found->second->lunName());
                isAccepted = isAccepted || found->second->unit.isMapName(map.wwid);
            }
        }
        if (paths.empty()) {
            return;
        }
        ++mResult.mapsCompared;
        mResult.mapPaths += paths.size();
        if (names.size() > 1) {
            Finding& finding = find(FindingKind::MixedMap);
            finding.map = map.name;
            finding.paths = paths;
        }
        if (!isAccepted) {
            Finding& finding = find(FindingKind::MapName);
            finding.map = map.name;
            finding.paths = std::move(paths);
            finding.remembered = map.wwid;
        }
    }

    // Compares the devices that have one name.
    void compareLun(const std::vector<LogDevice*>& devices) {
        std::vector<std::string> reasons = sharingOf(devices);
        if (!reasons.empty()) {
            Finding& finding = find(FindingKind::SharedIdentity);
            finding.details = std::move(reasons);
            for (const LogDevice* device : devices) {
                finding.paths.push_back(device->shown());
            }
            return;
        }
        std::vector<PathOfLun> outside;
        const KernelMap* map = nullptr;
        std::size_t count = 0;
        for (const LogDevice* device : devices) {
            if (device->disk == nullptr || device->isStale) { // what it is in follows from what it was
                continue;
            }
            ++count;
            if (const KernelMap* own = mapOf(device->disk)) {
                map = own;
            } else {
                outside.push_back(device->shown());
            }
        }
        if (count < 2 || outside.empty() || isUnderPowerPath(devices)) {
            return;
        }
        if (map == nullptr) {
            find(FindingKind::LunWithoutMap).paths = std::move(outside);
            return;
        }
        for (PathOfLun& path : outside) {
            Finding& finding = find(FindingKind::PathMissing);
            finding.paths = {std::move(path)};
            finding.map = map->name;
        }
    }

    // Why devices of one name are several LUNs; empty when nothing speaks for it.
    static std::vector<std::string> sharingOf(const std::vector<LogDevice*>& devices) {
        std::map<std::string, std::set<std::string>> lunsAt;
        bool hasOtherDesignators = false;
        bool hasOtherProduct = false;
        const LogDevice* first = devices.front();
        for (const LogDevice* device : devices) {
            for (const auto& [target, lun] : device->places) {
                lunsAt[target].insert(lun);
            }
            hasOtherDesignators = hasOtherDesignators || first->unit.isSame(device->unit) == false;
            hasOtherProduct =
                hasOtherProduct || (!device->facts.product.empty() && !first->facts.product.empty() &&
                                    (device->facts.product != first->facts.product ||
                                     device->facts.vendor != first->facts.vendor));
        }
        std::vector<std::string> reasons;
        if (std::any_of(lunsAt.begin(), lunsAt.end(),
                        [](const auto& place) { return place.second.size() > 1; })) {
            reasons.emplace_back("one target shows it at several LUN numbers");
        }
        if (hasOtherDesignators) {
            reasons.emplace_back("their other designators differ");
        }
        if (hasOtherProduct) {
            reasons.emplace_back("they are of different products");
        }
        return reasons;
    }

    [[nodiscard]] bool isUnderPowerPath(const std::vector<LogDevice*>& devices) const {
        return std::any_of(devices.begin(), devices.end(), [&](const LogDevice* device) {
            const auto& known = mModel.multipath.devices;
            return !device->facts.pseudoDevice.empty() ||
                   std::any_of(known.begin(), known.end(),
                               [&](const PseudoDevice& pseudo) { return pseudo.ulid == device->identifier; });
        });
    }

    void compareStates() {
        std::unordered_map<std::string, const ListedPath*> listed;
        if (mListed != nullptr) {
            for (const ListedMap& map : *mListed) {
                for (const ListedPath& path : map.paths) {
                    listed[path.device] = &path;
                }
            }
        }
        for (const KernelDisk& disk : mKernel.disks) {
            const auto found = listed.find(disk.name);
            const std::vector<std::string> reasons =
                troublesOf(disk, found == listed.end() ? nullptr : found->second);
            mResult.statesChecked += disk.state.empty() && disk.nvmePaths.empty() ? 0U : 1U;
            if (!reasons.empty()) {
                Finding& finding = find(FindingKind::PathState);
                const auto device = mDeviceOf.find(disk.name);
                finding.paths = {device == mDeviceOf.end() ? pathTo(disk) : device->second->shown()};
                finding.map = mapNameOf(&disk);
                finding.details = reasons;
            }
        }
    }

    // What the kernel and multipathd say against a path, in words.
    static std::vector<std::string> troublesOf(const KernelDisk& disk, const ListedPath* listed) {
        std::vector<std::string> words;
        const auto note = [&](std::string_view who, const std::string& state,
                              std::initializer_list<std::string_view> good) {
            if (!state.empty() && std::find(good.begin(), good.end(), state) == good.end()) {
                words.push_back(std::string(who) + ' ' + state);
            }
        };
        note("the kernel's device is", disk.state, {"running"});
        note("its target port is", disk.portState, {"Online"});
        note("its session is", disk.sessionState, {"LOGGED_IN"});
        for (const NvmePath& path : disk.nvmePaths) {
            note("its controller " + path.controller + " is", path.state, {"live"});
        }
        if (listed != nullptr) {
            note("multipathd's device state is", listed->deviceState, {"running", "undef"});
            note("multipathd's map state is", listed->mapState, {"active", "undef"});
            note("multipathd's checker says", listed->checkState, {"ready", "ghost", "i/o pending", "undef"});
        }
        return words;
    }

    void comparePresence() {
        for (const KernelDisk& disk : mKernel.disks) {
            if (!mMatching.isTaken(disk) && !isMentioned(disk) && !(mIsOldLog && !hasAddress(disk))) {
                find(FindingKind::NotInLog).paths = {pathTo(disk)};
            }
        }
        for (const LogDevice& device : mLog.devices) {
            if (device.disk == nullptr && !device.isUnplaced) {
                find(FindingKind::NotInKernel).paths = {device.shown()};
            }
        }
    }

    // Whether the log has a disk without reporting it as one: among the logical devices, or in a problem.
    bool isMentioned(const KernelDisk& disk) {
        if (mMentioned.empty()) {
            mMentioned.insert(mModel.logical.devices.begin(), mModel.logical.devices.end());
            for (const Problem& problem : mModel.problems) {
                mMentioned.insert(problem.subject.substr(0, problem.subject.find(' ')));
            }
        }
        return mMentioned.contains(nodeName(disk.name));
    }

    // Compares multipathd's list with the kernel's maps: one that is of another moment or host tells nothing.
    void compareListed() {
        if (mListed == nullptr) {
            return;
        }
        mResult.listedMaps = mListed->size();
        std::unordered_map<std::string, const ListedMap*> listed;
        for (const ListedMap& map : *mListed) {
            listed[map.wwid] = &map;
        }
        for (const KernelMap& map : mKernel.maps) {
            const auto found = listed.find(map.wwid);
            if (found == listed.end()) {
                differ(map.name, "the kernel has it, multipathd's list lacks it");
                continue;
            }
            compareMembers(map, *found->second);
            listed.erase(found);
        }
        for (const ListedMap& map : *mListed) {
            if (listed.contains(map.wwid)) {
                differ(map.name, "multipathd lists it, the kernel lacks it");
            }
        }
    }

    void compareMembers(const KernelMap& map, const ListedMap& listed) {
        const std::vector<std::string>& own = mPathsOf[&map];
        std::set<std::string> members(own.begin(), own.end());
        for (const ListedPath& path : listed.paths) {
            if (members.erase(path.device) == 0) {
                differ(map.name, "multipathd lists " + path.device + " in it, the kernel does not");
            }
        }
        for (const std::string& path : members) {
            differ(map.name, "the kernel has " + path + " in it, multipathd's list does not");
        }
    }

    void differ(const std::string& map, std::string detail) {
        Finding& finding = find(FindingKind::MapsDiffer);
        finding.map = map;
        finding.details = {std::move(detail)};
    }

    const Model& mModel;
    const Kernel& mKernel;
    const std::vector<ListedMap>* mListed;
    bool mIsOldLog;
    LogDevices mLog;
    Matching mMatching;
    std::unordered_map<std::string, LogDevice*> mDeviceOf; // by the name of its disk
    std::unordered_map<std::string, std::size_t> mLunPlaces;
    std::vector<std::vector<LogDevice*>> mLuns; // devices of one name each
    std::unordered_map<std::string, const KernelMap*> mMapByDevice;
    std::unordered_map<std::string, const KernelMap*> mMapOf; // by the name of a disk
    std::unordered_map<const KernelMap*, std::vector<std::string>> mPathsOf;
    std::unordered_set<std::string> mMentioned; // device nodes
    Verification mResult;
};

} // namespace

Verification verify(const Model& model, const Kernel& kernel, const std::vector<ListedMap>* listed) {
    return Comparison(model, kernel, listed).run();
}

} // namespace view
