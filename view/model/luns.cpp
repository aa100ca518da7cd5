#include "view/model/luns.hpp"

#include <algorithm>
#include <string>
#include <string_view>
#include <unordered_map>
#include <unordered_set>
#include <utility>

namespace view {

namespace {

// Whether a text tells one logical unit from another at all: it is neither empty nor all blanks or zeros.
bool isTelling(std::string_view identifier) {
    return identifier.find_first_not_of("0 ") != std::string_view::npos;
}

// Builds the groups one sighting at a time.
class LunGroups {
public:
    explicit LunGroups(Model& model) : mModel(model) {}

    void addAll() {
        for (std::size_t i = 0; i < mModel.fc.paths.size(); ++i) {
            const FcPath& path = mModel.fc.paths[i];
            add({Sighting::Place::FcPath, i, 0}, path.identifier, path.facts, path.page83, path.device);
            addPlace(path.identifier.text, std::to_string(path.adapter) + ' ' + path.targetPort,
                     lunNumbers(path));
        }
        for (std::size_t i = 0; i < mModel.fc.adapters.size(); ++i) {
            const Adapter& adapter = mModel.fc.adapters[i];
            for (std::size_t k = 0; k < adapter.unlisted.size(); ++k) {
                const UnlistedLun& lun = adapter.unlisted[k];
                add({Sighting::Place::Unlisted, k, i}, lun.identifier, lun.facts, lun.page83, lun.device);
            }
        }
        for (std::size_t i = 0; i < mModel.iscsi.paths.size(); ++i) {
            const IscsiPath& path = mModel.iscsi.paths[i];
            if (path.identifier.kind != IdentifierKind::None) {
                add({Sighting::Place::IscsiPath, i, 0}, path.identifier, {}, path.page83, path.device);
                addPlace(path.identifier.text,
                         path.initiatorPort + ' ' + path.targetIqn + ' ' + path.targetAddress,
                         std::to_string(path.lun));
            }
        }
        for (std::size_t i = 0; i < mModel.direct.devices.size(); ++i) {
            const DirectDevice& direct = mModel.direct.devices[i];
            if (direct.identifier.kind != IdentifierKind::HostName) {
                add({Sighting::Place::DirectDevice, i, 0}, direct.identifier, {}, direct.page83,
                    direct.device);
            }
        }
    }

    void judge() {
        for (Lun& lun : mModel.luns) {
            const std::string& identifier = lun.identifier.text;
            if (!isTelling(identifier)) {
                lun.notUnique = identifier.empty()
                                    ? "an empty identifier is none"
                                    : "blanks or zeros are no identifier; a device that refuses page "
                                      "0x83 is given them";
            } else if (lun.identifier.kind == IdentifierKind::StandardInquiry && identifier.ends_with(':')) {
                lun.notUnique = "vendor, product and revision alone: every device of the model may carry it";
            } else if (mShared.contains(identifier)) {
                lun.notUnique = "several LUN numbers of one target carry it";
            }
            if (!lun.notUnique.empty()) {
                mModel.problems.push_back(
                    {Severity::Problem, ProblemKind::IdentifierNotUnique, Tree::Run, identifier,
                     "not unique, " + std::to_string(lun.devices.size()) +
                         (lun.devices.size() == 1 ? " device carries" : " devices carry") +
                         " it: " + lun.notUnique,
                     0});
            } else if (const auto odd = mOddDevice.find(identifier); odd != mOddDevice.end()) {
                mModel.problems.push_back({Severity::Problem, ProblemKind::NamesDiffer, Tree::Run, identifier,
                                           odd->second + " answers with other designators than " +
                                               lun.devices.front() +
                                               ": to multipath, the kernel or udev they are two LUNs",
                                           0});
            }
        }
    }

private:
    void add(Sighting sighting, const Identifier& identifier, const DeviceFacts& facts, const Page83& page83,
             const std::string& device) {
        const auto [found, isNew] = mLunByIdentifier.try_emplace(identifier.text, mModel.luns.size());
        if (isNew) {
            mModel.luns.emplace_back();
            mModel.luns.back().identifier = identifier;
            mModel.luns.back().facts = facts;
        }
        Lun& lun = mModel.luns[found->second];
        if (lun.page83 == nullptr) {
            lun.page83 = page83;
        } else if (page83 != nullptr && page83 != lun.page83 && *page83 != *lun.page83 &&
                   namesOf(page83, facts) != namesOf(lun.page83, facts)) {
            mOddDevice.try_emplace(identifier.text, device);
        }
        lun.sightings.push_back(sighting);
        if (mDevices.emplace(identifier.text + '\n' + device).second) {
            lun.devices.push_back(device);
        }
    }

    // Notes a LUN number at which a target port shows the identifier.
    void addPlace(const std::string& identifier, const std::string& target, const std::string& lun) {
        const auto [found, isNew] = mLunByPlace.try_emplace(identifier + '\n' + target, lun);
        if (!isNew && found->second != lun) {
            mShared.insert(identifier);
        }
    }

    Model& mModel;
    std::unordered_map<std::string, std::size_t> mLunByIdentifier;
    std::unordered_set<std::string> mDevices;
    std::unordered_map<std::string, std::string> mLunByPlace;
    std::unordered_set<std::string> mShared;
    std::unordered_map<std::string, std::string> mOddDevice; // by identifier: the first that has other names
};

} // namespace

Names namesOf(const Page83& page83, const DeviceFacts& facts) {
    return page83 == nullptr ? Names() : namesOf(*page83, facts.vendor, facts.product);
}

void groupLuns(Model& model) {
    LunGroups groups(model);
    groups.addAll();
    groups.judge();
    std::stable_sort(model.problems.begin(), model.problems.end(),
                     [](const Problem& a, const Problem& b) { return a.severity < b.severity; });
}

} // namespace view
