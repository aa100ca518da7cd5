#include "view/model/san.hpp"

#include <algorithm>
#include <map>
#include <set>
#include <string_view>

namespace view {

namespace {

// Host names where the logs give them, with the log's name where that is missing or not enough.
std::vector<std::string> hostNames(const std::vector<Model>& reports) {
    std::map<std::string, std::size_t> uses;
    for (const Model& report : reports) {
        ++uses[report.host];
    }
    std::vector<std::string> names;
    std::set<std::string> taken;
    for (const Model& report : reports) {
        std::string name = report.host;
        if (name.empty()) {
            name = report.log.name;
        } else if (uses[name] > 1) {
            name += " (" + report.log.name + ")";
        }
        const std::string base = name;
        for (unsigned copy = 2; !taken.insert(name).second; ++copy) {
            name = base + " #" + std::to_string(copy);
        }
        names.push_back(name);
    }
    return names;
}

void addReason(SanLun& lun, const std::string& reason) {
    if (!reason.empty() &&
        std::find(lun.notUnique.begin(), lun.notUnique.end(), reason) == lun.notUnique.end()) {
        lun.notUnique.push_back(reason);
    }
}

bool isDirectOnly(const Lun& lun) {
    return std::all_of(lun.sightings.begin(), lun.sightings.end(), [](const Sighting& sighting) {
        return sighting.place == Sighting::Place::DirectDevice;
    });
}

// Merges one host's view of a LUN into what the hosts before it saw.
void addSighting(SanLun& merged, const Lun& lun, std::size_t host) {
    if (merged.hosts.empty()) {
        merged.identifier = lun.identifier;
    }
    if (!lun.facts.product.empty()) {
        if (!merged.facts.product.empty() &&
            (merged.facts.product != lun.facts.product || merged.facts.vendor != lun.facts.vendor)) {
            addReason(merged, "devices of different products carry it");
        }
        merged.facts = lun.facts;
    }
    merged.isDirectOnly = merged.isDirectOnly && isDirectOnly(lun);
    merged.hosts.emplace_back(host, lun.devices.size());
    addReason(merged, lun.notUnique);
}

} // namespace

San join(const std::vector<Model>& reports) {
    San san;
    san.reports = &reports;
    san.hosts = hostNames(reports);
    std::map<std::string_view, SanLun> luns;
    for (std::size_t host = 0; host < reports.size(); ++host) {
        for (const Lun& lun : reports[host].luns) {
            addSighting(luns[lun.identifier.text], lun, host);
        }
    }
    for (auto& [identifier, lun] : luns) {
        san.luns.push_back(std::move(lun));
    }
    return san;
}

} // namespace view
