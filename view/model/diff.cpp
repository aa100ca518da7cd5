#include "view/model/diff.hpp"

#include <algorithm>
#include <iterator>
#include <map>
#include <set>
#include <string_view>
#include <unordered_map>
#include <unordered_set>
#include <utility>

namespace view {

namespace {

struct ListedPath {
    PathView view;
    std::optional<std::string> identifier;
};

using PathsByPlace = std::map<std::string, std::vector<ListedPath>>;

std::optional<std::string> readIdentifier(const Identifier& identifier) {
    if (identifier.kind == IdentifierKind::None) {
        return std::nullopt;
    }
    return identifier.text;
}

// Every listed path by what stays the same when its device gets another name.
PathsByPlace pathsByPlace(const Model& model) {
    PathsByPlace places;
    for (std::size_t i = 0; i < model.fc.paths.size(); ++i) {
        const FcPath& path = model.fc.paths[i];
        places["fc\n" + path.initiator + '\n' + path.targetPort + '\n' + lunNumbers(path)].push_back(
            {describe(model, {Sighting::Place::FcPath, i, 0}), readIdentifier(path.identifier)});
    }
    for (std::size_t i = 0; i < model.iscsi.paths.size(); ++i) {
        const IscsiPath& path = model.iscsi.paths[i];
        places["iscsi\n" + path.initiatorIqn + '\n' + path.initiatorPort + '\n' + path.targetIqn + '\n' +
               path.targetAddress + '\n' + std::to_string(path.lun)]
            .push_back(
                {describe(model, {Sighting::Place::IscsiPath, i, 0}), readIdentifier(path.identifier)});
    }
    return places;
}

// Takes away from both lists what they have in common.
void cancel(std::vector<ListedPath>& before, std::vector<ListedPath>& after) {
    std::unordered_map<std::optional<std::string>, std::size_t> offered;
    for (const ListedPath& path : after) {
        ++offered[path.identifier];
    }
    std::unordered_map<std::optional<std::string>, std::size_t> matched;
    std::erase_if(before, [&](const ListedPath& path) {
        const bool isSame = matched[path.identifier] < offered[path.identifier];
        matched[path.identifier] += isSame ? 1 : 0;
        return isSame;
    });
    std::erase_if(after, [&](const ListedPath& path) {
        const bool isSame = matched[path.identifier] > 0;
        matched[path.identifier] -= isSame ? 1 : 0;
        return isSame;
    });
}

std::unordered_map<std::string, std::size_t> unlistedCounts(const Model& model) {
    std::unordered_map<std::string, std::size_t> counts;
    for (const Adapter& adapter : model.fc.adapters) {
        for (const UnlistedLun& lun : adapter.unlisted) {
            ++counts[lun.identifier.text];
        }
    }
    return counts;
}

void addPath(std::vector<PathDifference>& list, const ListedPath& path,
             std::unordered_map<std::string, std::size_t>& unlistedElsewhere) {
    PathDifference difference{path.view, path.identifier.value_or(""), false};
    if (path.view.tree == Tree::Fc) {
        std::size_t& left = unlistedElsewhere[difference.identifier];
        difference.isKnownUnlisted = left > 0;
        left -= left > 0 ? 1 : 0;
    }
    list.push_back(std::move(difference));
}

void comparePaths(Difference& difference, const Model& before, const Model& after) {
    PathsByPlace old = pathsByPlace(before);
    PathsByPlace now = pathsByPlace(after);
    auto unlistedBefore = unlistedCounts(before);
    auto unlistedAfter = unlistedCounts(after);
    for (auto& [place, oldPaths] : old) {
        std::vector<ListedPath>& newPaths = now[place];
        cancel(oldPaths, newPaths);
        const std::size_t changed = std::min(oldPaths.size(), newPaths.size());
        for (std::size_t i = 0; i < changed; ++i) {
            difference.identityChanges.push_back(
                {newPaths[i].view, oldPaths[i].identifier, newPaths[i].identifier});
        }
        for (std::size_t i = changed; i < oldPaths.size(); ++i) {
            addPath(difference.lostPaths, oldPaths[i], unlistedAfter);
        }
        newPaths.erase(newPaths.begin(), newPaths.begin() + static_cast<std::ptrdiff_t>(changed));
    }
    for (const auto& [place, newPaths] : now) {
        for (const ListedPath& path : newPaths) {
            addPath(difference.newPaths, path, unlistedBefore);
        }
    }
}

void compareCounts(Difference& difference, const Model& before, const Model& after) {
    std::unordered_map<std::string_view, const Lun*> now;
    for (const Lun& lun : after.luns) {
        now[lun.identifier.text] = &lun;
    }
    std::unordered_map<std::string_view, const Lun*> old;
    for (const Lun& lun : before.luns) {
        old[lun.identifier.text] = &lun;
        const auto found = now.find(lun.identifier.text);
        const std::size_t count = found == now.end() ? 0 : found->second->devices.size();
        if (count != lun.devices.size()) {
            difference.pathCounts.push_back({lun.identifier.text, lun.facts, lun.devices.size(), count});
        }
    }
    for (const Lun& lun : after.luns) {
        if (!old.contains(lun.identifier.text)) {
            difference.pathCounts.push_back({lun.identifier.text, lun.facts, 0, lun.devices.size()});
        }
    }
}

// Devices by what stays the same when the kernel numbers its disks anew; the values are what is shown.
template <typename Shown>
using ByKey = std::multimap<std::string, Shown>;

// Devices of one key are alike: those that kept their names are the same, of the others as many as `what` has
// beside them got another name.
template <typename Shown>
void subtract(const ByKey<Shown>& from, const ByKey<Shown>& what, std::vector<Shown>& rest) {
    for (auto key = from.begin(); key != from.end();) {
        std::multiset<std::string_view> names;
        const auto [first, last] = what.equal_range(key->first);
        for (auto device = first; device != last; ++device) {
            names.insert(device->second.device);
        }
        std::vector<const Shown*> renamed;
        const auto end = from.upper_bound(key->first);
        for (; key != end; ++key) {
            const auto same = names.find(key->second.device);
            if (same == names.end()) {
                renamed.push_back(&key->second);
            } else {
                names.erase(same);
            }
        }
        for (std::size_t i = names.size(); i < renamed.size(); ++i) {
            rest.push_back(*renamed[i]);
        }
    }
}

ByKey<DeviceDifference> directByKey(const Model& model) {
    ByKey<DeviceDifference> devices;
    for (const DirectDevice& direct : model.direct.devices) {
        if (direct.identifier.kind == IdentifierKind::HostName) {
            devices.emplace(direct.device, DeviceDifference{direct.device, {}});
        } else {
            devices.emplace("id\n" + direct.identifier.text,
                            DeviceDifference{direct.device, direct.identifier.text});
        }
    }
    return devices;
}

// The disk that a partition's device name belongs to, and the partition's number: /dev/sdb1 is number 1 of
// /dev/sdb, /dev/nvme0n1p2 number 2 of /dev/nvme0n1.
std::pair<std::string, std::string> splitPartition(const std::string& device) {
    const std::size_t lastNonDigit = device.find_last_not_of("0123456789");
    if (lastNonDigit == std::string::npos || lastNonDigit + 1 == device.size()) {
        return {device, {}};
    }
    const std::string number = device.substr(lastNonDigit + 1);
    std::string disk = device.substr(0, lastNonDigit + 1);
    if (disk.size() > 1 && disk.back() == 'p' && disk[disk.size() - 2] >= '0' &&
        disk[disk.size() - 2] <= '9') {
        disk.pop_back();
    }
    return {disk, number};
}

// A logical device, and whether its log tells the LUN below it.
struct LogicalDevice {
    std::string device;
    bool isPlaced = false;
};

ByKey<LogicalDevice> logicalByKey(const Model& model) {
    std::unordered_map<std::string_view, std::string_view> identifierOfDisk;
    for (const Lun& lun : model.luns) {
        for (const std::string& device : lun.devices) {
            identifierOfDisk[device] = lun.identifier.text;
        }
    }
    ByKey<LogicalDevice> devices;
    for (const std::string& device : model.logical.devices) {
        const auto [disk, number] = splitPartition(device);
        const auto known = identifierOfDisk.find(disk);
        if (known == identifierOfDisk.end()) {
            devices.emplace(device, LogicalDevice{device, false});
        } else {
            devices.emplace("id\n" + std::string(known->second) + '\n' + number, LogicalDevice{device, true});
        }
    }
    return devices;
}

// Takes away from both lists the devices of one name of which a log does not tell the LUN: nothing says that
// they are not the same.
void cancelUnplaced(std::vector<LogicalDevice>& before, std::vector<LogicalDevice>& after) {
    std::unordered_map<std::string, bool> isPlacedBefore;
    for (const LogicalDevice& logical : before) {
        isPlacedBefore[logical.device] = logical.isPlaced;
    }
    std::unordered_set<std::string> same;
    std::erase_if(after, [&](const LogicalDevice& logical) {
        const auto old = isPlacedBefore.find(logical.device);
        const bool isSame = old != isPlacedBefore.end() && !(old->second && logical.isPlaced);
        if (isSame) {
            same.insert(logical.device);
        }
        return isSame;
    });
    std::erase_if(before, [&](const LogicalDevice& logical) { return same.contains(logical.device); });
}

void compareLogical(Difference& difference, const Model& before, const Model& after) {
    const ByKey<LogicalDevice> old = logicalByKey(before);
    const ByKey<LogicalDevice> now = logicalByKey(after);
    std::vector<LogicalDevice> lost;
    std::vector<LogicalDevice> added;
    subtract(old, now, lost);
    subtract(now, old, added);
    cancelUnplaced(lost, added);
    const auto device = [](const LogicalDevice& logical) { return DeviceDifference{logical.device, {}}; };
    std::transform(lost.begin(), lost.end(), std::back_inserter(difference.lostLogical), device);
    std::transform(added.begin(), added.end(), std::back_inserter(difference.newLogical), device);
}

// The host's ends of its paths: port WWNs and IQNs.
std::set<std::string_view> initiatorsOf(const Model& model) {
    std::set<std::string_view> initiators;
    for (const Adapter& adapter : model.fc.adapters) {
        initiators.insert(adapter.initiators.begin(), adapter.initiators.end());
    }
    for (const IscsiPath& path : model.iscsi.paths) {
        initiators.insert(path.initiatorIqn);
    }
    return initiators;
}

// Warns when the logs are of two hosts: by their names or, where a log has none, by their initiators.
void compareHosts(Difference& difference, const Model& before, const Model& after) {
    if (!before.host.empty() && !after.host.empty()) {
        if (before.host != after.host) {
            difference.warnings.push_back({DiffWarning::Kind::TwoHosts});
        }
        return;
    }
    const std::set<std::string_view> old = initiatorsOf(before);
    const std::set<std::string_view> now = initiatorsOf(after);
    const auto isCommon = [&](std::string_view initiator) { return now.contains(initiator); };
    if (!old.empty() && !now.empty() && std::none_of(old.begin(), old.end(), isCommon)) {
        difference.warnings.push_back({DiffWarning::Kind::NoCommonInitiator});
    }
}

void addWarnings(Difference& difference, const Model& model, bool isOfNewLog) {
    const auto warn = [&](DiffWarning::Kind kind, Tree tree = Tree::Run, std::uint64_t pieces = 0) {
        difference.warnings.push_back({kind, isOfNewLog, tree, pieces});
    };
    if (!model.log.complete || model.log.beginsInside) {
        warn(DiffWarning::Kind::NotWhole);
    }
    for (const auto& [tree, state] :
         {std::pair(Tree::Fc, model.fc.state), std::pair(Tree::Iscsi, model.iscsi.state),
          std::pair(Tree::Direct, model.direct.state), std::pair(Tree::Logical, model.logical.state)}) {
        if (state == TreeState::Ended) {
            warn(DiffWarning::Kind::TreeEnded, tree);
        }
    }
    if (model.log.unknownPieces > 0) {
        warn(DiffWarning::Kind::UnknownPieces, Tree::Run, model.log.unknownPieces);
    }
}

} // namespace

bool Difference::isEmpty() const {
    return identityChanges.empty() && lostPaths.empty() && newPaths.empty() && pathCounts.empty() &&
           lostDirect.empty() && newDirect.empty() && lostLogical.empty() && newLogical.empty() &&
           !powerPathBefore;
}

std::size_t Difference::dangerousChanges() const {
    return static_cast<std::size_t>(
        std::count_if(identityChanges.begin(), identityChanges.end(),
                      [](const IdentityChange& change) { return change.isDangerous(); }));
}

Difference compare(const Model& before, const Model& after) {
    Difference difference;
    difference.hostBefore = before.host;
    difference.hostAfter = after.host;
    compareHosts(difference, before, after);
    addWarnings(difference, before, false);
    addWarnings(difference, after, true);
    comparePaths(difference, before, after);
    compareCounts(difference, before, after);
    const ByKey<DeviceDifference> directBefore = directByKey(before);
    const ByKey<DeviceDifference> directAfter = directByKey(after);
    subtract(directBefore, directAfter, difference.lostDirect);
    subtract(directAfter, directBefore, difference.newDirect);
    compareLogical(difference, before, after);
    if (before.multipath.state != after.multipath.state &&
        before.multipath.state != PowerPathState::Unknown &&
        after.multipath.state != PowerPathState::Unknown) {
        difference.powerPathBefore = before.multipath.state;
        difference.powerPathAfter = after.multipath.state;
    }
    return difference;
}

} // namespace view
