#include <string>
#include <utility>

#include "view/show/escape.hpp"
#include "view/show/json.hpp"
#include "view/show/json_values.hpp"
#include "view/show/words.hpp"

namespace view {

nlohmann::ordered_json toJson(const San& san) {
    using Json = nlohmann::ordered_json;
    Json hosts = Json::array();
    for (std::size_t i = 0; i < san.hosts.size(); ++i) {
        const Model& report = (*san.reports)[i];
        hosts.push_back({{"name", printable(san.hosts[i])},
                         {"log", printable(report.log.name)},
                         {"complete", report.log.complete},
                         {"lunCount", report.luns.size()},
                         {"problemCount", problemCount(report)}});
    }
    Json luns = Json::array();
    for (const SanLun& lun : san.luns) {
        Json seenBy = Json::array();
        for (const auto& [host, paths] : lun.hosts) {
            seenBy.push_back({{"host", printable(san.hosts[host])}, {"pathCount", paths}});
        }
        luns.push_back({{"identifier", printable(lun.identifier.text)},
                        {"identifierKind", name(lun.identifier.kind)},
                        {"vendor", textOrNull(lun.facts.vendor)},
                        {"product", textOrNull(lun.facts.product)},
                        {"directOnly", lun.isDirectOnly},
                        {"hosts", std::move(seenBy)},
                        {"notUnique", lun.notUnique}});
    }
    return {{"kind", "san"}, {"hosts", std::move(hosts)}, {"luns", std::move(luns)}};
}

} // namespace view
