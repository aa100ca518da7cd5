#include <algorithm>
#include <string>

#include "view/show/escape.hpp"
#include "view/show/text.hpp"
#include "view/show/words.hpp"

namespace view {

namespace {

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
            columns.add({identifierWords(lun.identifier), printable(lun.facts.vendor),
                         printable(lun.facts.product), hostWords(san, lun)});
        }
    }
    if (count > 0) {
        writeHeading(output, style, heading + " (" + std::to_string(count) + ")");
        columns.write(output, "  ");
    }
}

void writeHosts(std::ostream& output, const San& san) {
    Columns hosts;
    for (std::size_t i = 0; i < san.hosts.size(); ++i) {
        const Model& report = (*san.reports)[i];
        const bool isNamedByLog = san.hosts[i].find(report.log.name) != std::string::npos;
        hosts.add({printable(san.hosts[i]), counted(report.luns.size(), "LUN"),
                   counted(problemCount(report), "problem"), report.log.complete ? "" : "the log is cut off",
                   isNamedByLog ? "" : printable(report.log.name)});
    }
    hosts.write(output, "  ");
}

// A disk of its own host: no other host can see it, so it says nothing about the SAN.
bool isLocal(const SanLun& lun) {
    return lun.isDirectOnly && lun.hosts.size() == 1 && lun.notUnique.empty();
}

} // namespace

void writeText(std::ostream& output, const San& san, const Style& style) {
    output << style.heading << "SAN view of " << counted(san.hosts.size(), "log") << style.end << '\n';
    writeHeading(output, style, "Hosts");
    writeHosts(output, san);
    const auto notUnique = [](const SanLun& lun) { return !lun.notUnique.empty(); };
    if (std::any_of(san.luns.begin(), san.luns.end(), notUnique)) {
        output << '\n' << style.problem << "Identifiers that are not unique" << style.end << '\n';
    }
    for (const SanLun& lun : san.luns) {
        if (notUnique(lun)) {
            output << "  " << identifierWords(lun.identifier) << "  " << hostWords(san, lun) << '\n';
        }
        for (const std::string& reason : lun.notUnique) {
            output << "    " << reason << '\n';
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

} // namespace view
