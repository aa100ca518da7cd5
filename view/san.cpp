#include "view/san.hpp"

#include <algorithm>
#include <map>
#include <set>
#include <string_view>

#include "view/escape.hpp"
#include "view/words.hpp"

namespace view {

namespace {

using Json = nlohmann::ordered_json;

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

std::string hostWords(const San& san, const SanLun& lun) {
    std::string words;
    for (const auto& [host, paths] : lun.hosts) {
        words += (words.empty() ? "" : ", ") + printable(san.hosts[host]) + " " + std::to_string(paths);
    }
    return words;
}

template <typename Selects>
void writeLuns(std::ostream& output, const San& san, const Style& style, const std::string& heading,
               Selects selects) {
    Columns columns;
    std::size_t count = 0;
    for (const SanLun& lun : san.luns) {
        if (selects(lun)) {
            ++count;
            columns.add({lun.identifier.text.empty() ? "(empty)" : printable(lun.identifier.text),
                         printable(lun.facts.vendor), printable(lun.facts.product), hostWords(san, lun)});
        }
    }
    if (count > 0) {
        writeHeading(output, style, heading + " (" + std::to_string(count) + ")");
        columns.write(output, "  ");
    }
}

// A disk of its own host: no other host can see it, so it says nothing about the SAN.
bool isLocal(const SanLun& lun) {
    return lun.isDirectOnly && lun.hosts.size() == 1 && lun.notUnique.empty();
}

std::size_t problemCount(const Model& report) {
    return static_cast<std::size_t>(
        std::count_if(report.problems.begin(), report.problems.end(),
                      [](const Problem& problem) { return problem.severity == Severity::Problem; }));
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

void writeText(std::ostream& output, const San& san, const Style& style) {
    output << style.heading << "SAN view of " << counted(san.hosts.size(), "log") << style.end << '\n';
    writeHeading(output, style, "Hosts");
    Columns hosts;
    for (std::size_t i = 0; i < san.hosts.size(); ++i) {
        const Model& report = (*san.reports)[i];
        const bool isNamedByLog = san.hosts[i].find(report.log.name) != std::string::npos;
        hosts.add({printable(san.hosts[i]), counted(report.luns.size(), "LUN"),
                   counted(problemCount(report), "problem"), report.log.complete ? "" : "the log is cut off",
                   isNamedByLog ? "" : printable(report.log.name)});
    }
    hosts.write(output, "  ");

    const auto notUnique = [](const SanLun& lun) { return !lun.notUnique.empty(); };
    if (std::any_of(san.luns.begin(), san.luns.end(), notUnique)) {
        output << '\n' << style.problem << "Identifiers that are not unique" << style.end << '\n';
        for (const SanLun& lun : san.luns) {
            if (notUnique(lun)) {
                output << "  " << (lun.identifier.text.empty() ? "(empty)" : printable(lun.identifier.text))
                       << "  " << hostWords(san, lun) << '\n';
                for (const std::string& reason : lun.notUnique) {
                    output << "    " << reason << '\n';
                }
            }
        }
    }
    writeLuns(output, san, style, "LUNs of several hosts, with the paths of each",
              [](const SanLun& lun) { return lun.hosts.size() > 1; });
    writeLuns(output, san, style, "LUNs of one host only",
              [](const SanLun& lun) { return lun.hosts.size() == 1 && !isLocal(lun); });
    const auto local = static_cast<std::size_t>(std::count_if(san.luns.begin(), san.luns.end(), isLocal));
    if (local > 0) {
        output << '\n' << counted(local, "direct disk") << " of single hosts left out\n";
    }
}

nlohmann::ordered_json toJson(const San& san) {
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
        Json reasons = Json::array();
        for (const std::string& reason : lun.notUnique) {
            reasons.push_back(reason);
        }
        luns.push_back({{"identifier", printable(lun.identifier.text)},
                        {"identifierKind", name(lun.identifier.kind)},
                        {"vendor", lun.facts.vendor.empty() ? Json() : Json(printable(lun.facts.vendor))},
                        {"product", lun.facts.product.empty() ? Json() : Json(printable(lun.facts.product))},
                        {"directOnly", lun.isDirectOnly},
                        {"hosts", std::move(seenBy)},
                        {"notUnique", std::move(reasons)}});
    }
    return {{"kind", "san"}, {"hosts", std::move(hosts)}, {"luns", std::move(luns)}};
}

} // namespace view
