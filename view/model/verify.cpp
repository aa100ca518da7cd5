#include "view/model/verify.hpp"

#include <algorithm>
#include <set>
#include <unordered_map>
#include <unordered_set>
#include <utility>

#include "view/identity/logical_unit.hpp"
#include "view/model/disk_matching.hpp"
#include "view/model/log_devices.hpp"
#include "view/model/map_membership.hpp"
#include "view/model/path_states.hpp"

namespace view {

namespace {

class Comparison {
public:
    Comparison(const Model& model, const Kernel& kernel, const std::vector<ListedMap>* listed)
        : mModel(model), mKernel(kernel), mListed(listed),
          mIsOldLog(model.time && kernel.bootTime && *model.time < *kernel.bootTime), mLog(model),
          mMatching(mLog.devices, kernel, mIsOldLog), mMaps(kernel) {
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
        finding.map = mMaps.mapNameOf(device.disk);
        if (remembered == device.unit.names().kernel) {
            finding.details.push_back({Detail::Kind::SameKernelName, {}, {}});
        }
        finding.isOfOldLog = mIsOldLog || isYounger(*device.disk);
    }

    void compareMap(const KernelMap& map) {
        ++mResult.maps;
        std::vector<PathOfLun> paths;
        std::set<std::string> names;
        bool isAccepted = false;
        for (const std::string& path : mMaps.pathsOf(map)) {
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
        std::vector<Detail> reasons = sharingOf(devices);
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
            if (const KernelMap* own = mMaps.mapOf(device->disk)) {
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
    static std::vector<Detail> sharingOf(const std::vector<LogDevice*>& devices) {
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
        std::vector<Detail> reasons;
        if (std::any_of(lunsAt.begin(), lunsAt.end(),
                        [](const auto& place) { return place.second.size() > 1; })) {
            reasons.push_back({Detail::Kind::SeveralLunNumbers, {}, {}});
        }
        if (hasOtherDesignators) {
            reasons.push_back({Detail::Kind::OtherDesignators, {}, {}});
        }
        if (hasOtherProduct) {
            reasons.push_back({Detail::Kind::OtherProduct, {}, {}});
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
            const std::vector<Detail> reasons =
                troublesOf(disk, found == listed.end() ? nullptr : found->second);
            mResult.statesChecked += disk.state.empty() && disk.nvmePaths.empty() ? 0U : 1U;
            if (!reasons.empty()) {
                Finding& finding = find(FindingKind::PathState);
                const auto device = mDeviceOf.find(disk.name);
                finding.paths = {device == mDeviceOf.end() ? pathTo(disk) : device->second->shown()};
                finding.map = mMaps.mapNameOf(&disk);
                finding.details = reasons;
            }
        }
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
                differ(map.name, {Detail::Kind::MapNotListed, {}, {}});
                continue;
            }
            compareMembers(map, *found->second);
            listed.erase(found);
        }
        for (const ListedMap& map : *mListed) {
            if (listed.contains(map.wwid)) {
                differ(map.name, {Detail::Kind::MapListedAlone, {}, {}});
            }
        }
    }

    void compareMembers(const KernelMap& map, const ListedMap& listed) {
        const std::vector<std::string>& own = mMaps.pathsOf(map);
        std::set<std::string> members(own.begin(), own.end());
        for (const ListedPath& path : listed.paths) {
            if (members.erase(path.device) == 0) {
                differ(map.name, {Detail::Kind::PathListedAlone, path.device, {}});
            }
        }
        for (const std::string& path : members) {
            differ(map.name, {Detail::Kind::PathNotListed, path, {}});
        }
    }

    void differ(const std::string& map, Detail detail) {
        Finding& finding = find(FindingKind::MapsDiffer);
        finding.map = map;
        finding.details = {std::move(detail)};
    }

    const Model& mModel;
    const Kernel& mKernel;
    const std::vector<ListedMap>* mListed;
    bool mIsOldLog;
    LogDevices mLog;
    DiskMatching mMatching;
    MapMembership mMaps;
    std::unordered_map<std::string, LogDevice*> mDeviceOf; // by the name of its disk
    std::unordered_map<std::string, std::size_t> mLunPlaces;
    std::vector<std::vector<LogDevice*>> mLuns; // devices of one name each
    std::unordered_set<std::string> mMentioned; // device nodes
    Verification mResult;
};

} // namespace

Verification verify(const Model& model, const Kernel& kernel, const std::vector<ListedMap>* listed) {
    return Comparison(model, kernel, listed).run();
}

} // namespace view
