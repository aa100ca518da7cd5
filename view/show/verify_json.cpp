#include <string>

#include "view/show/escape.hpp"
#include "view/show/json.hpp"
#include "view/show/json_values.hpp"
#include "view/show/verify_words.hpp"
#include "view/show/words.hpp"

namespace view {

namespace {

using Json = nlohmann::ordered_json;

Json timeJson(const std::optional<std::int64_t>& time) {
    return time ? Json(*time) : Json();
}

Json pathJson(const PathOfLun& shown) {
    return {{"tree", name(shown.path.tree)},
            {"device", printable(shown.path.device)},
            {"initiator", textOrNull(shown.path.initiator)},
            {"target", textOrNull(shown.path.target)},
            {"lun", textOrNull(shown.path.lun)},
            {"name", textOrNull(shown.lun)}};
}

Json findingJson(const Finding& finding) {
    Json paths = Json::array();
    for (const PathOfLun& path : finding.paths) {
        paths.push_back(pathJson(path));
    }
    Json details = Json::array();
    for (const Detail& detail : finding.details) {
        details.push_back(printable(words(detail)));
    }
    return {{"severity", isDanger(finding.kind) ? "danger" : "warning"},
            {"kind", name(finding.kind)},
            {"meaning", meaning(finding.kind)},
            {"paths", paths},
            {"map", textOrNull(finding.map)},
            {"remembered", textOrNull(finding.remembered)},
            {"details", details},
            {"says", particulars(finding)},
            {"advice", advice(finding)}};
}

} // namespace

nlohmann::ordered_json toJson(const Verification& verification) {
    Json findings = Json::array();
    for (const Finding& finding : verification.findings) {
        findings.push_back(findingJson(finding));
    }
    Json notCompared = Json::array();
    for (const auto& [reason, devices] : verification.notCompared) {
        notCompared.push_back(
            {{"reason", name(reason)}, {"meaning", meaning(reason)}, {"devices", texts(devices)}});
    }
    return {{"kind", "verify"},
            {"host", textOrNull(verification.host)},
            {"agree", verification.findings.empty()},
            {"logTime", timeJson(verification.logTime)},
            {"bootTime", timeJson(verification.bootTime)},
            {"findings", findings},
            {"compared",
             {{"byPage83", verification.comparedByPage},
              {"byWwid", verification.comparedByWwid},
              {"renamed", verification.renamed},
              {"luns", verification.luns},
              {"maps", verification.maps},
              {"mapsWithPaths", verification.mapsCompared},
              {"mapPaths", verification.mapPaths},
              {"states", verification.statesChecked},
              {"listedMaps", verification.listedMaps}}},
            {"notCompared", notCompared}};
}

} // namespace view
