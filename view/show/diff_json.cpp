#include <string>
#include <utility>
#include <vector>

#include "view/show/escape.hpp"
#include "view/show/json.hpp"
#include "view/show/json_values.hpp"
#include "view/show/warnings.hpp"
#include "view/show/words.hpp"

namespace view {

namespace {

using Json = nlohmann::ordered_json;

Json pathJson(const PathView& path) {
    return {{"tree", name(path.tree)},
            {"initiator", printable(path.initiator)},
            {"target", printable(path.target)},
            {"lun", path.lun},
            {"device", printable(path.device)}};
}

Json identityChangesJson(const std::vector<IdentityChange>& changes) {
    const auto identifier = [](const std::optional<std::string>& text) {
        return text ? Json(printable(*text)) : Json();
    };
    Json list = Json::array();
    for (const IdentityChange& change : changes) {
        Json json = pathJson(change.path);
        json["before"] = identifier(change.before);
        json["after"] = identifier(change.after);
        json["dangerous"] = change.isDangerous();
        list.push_back(std::move(json));
    }
    return list;
}

Json pathsJson(const std::vector<PathDifference>& paths) {
    Json list = Json::array();
    for (const PathDifference& difference : paths) {
        Json json = pathJson(difference.path);
        json["identifier"] = textOrNull(difference.identifier);
        json["knownUnlisted"] = difference.isKnownUnlisted;
        list.push_back(std::move(json));
    }
    return list;
}

Json pathCountsJson(const std::vector<PathCountChange>& changes) {
    Json list = Json::array();
    for (const PathCountChange& change : changes) {
        list.push_back({{"identifier", printable(change.identifier)},
                        {"before", change.before},
                        {"after", change.after}});
    }
    return list;
}

Json devicesJson(const std::vector<DeviceDifference>& devices) {
    Json list = Json::array();
    for (const DeviceDifference& difference : devices) {
        list.push_back(
            {{"device", printable(difference.device)}, {"identifier", textOrNull(difference.identifier)}});
    }
    return list;
}

} // namespace

nlohmann::ordered_json toJson(const Difference& difference) {
    Json powerPath;
    if (difference.powerPathBefore && difference.powerPathAfter) {
        powerPath = {{"before", name(*difference.powerPathBefore)},
                     {"after", name(*difference.powerPathAfter)}};
    }
    return {{"kind", "diff"},
            {"same", difference.isEmpty()},
            {"warnings", warningsOf(difference)},
            {"identityChanges", identityChangesJson(difference.identityChanges)},
            {"lostPaths", pathsJson(difference.lostPaths)},
            {"newPaths", pathsJson(difference.newPaths)},
            {"pathCounts", pathCountsJson(difference.pathCounts)},
            {"lostDirect", devicesJson(difference.lostDirect)},
            {"newDirect", devicesJson(difference.newDirect)},
            {"lostLogical", devicesJson(difference.lostLogical)},
            {"newLogical", devicesJson(difference.newLogical)},
            {"powerPath", powerPath}};
}

} // namespace view
