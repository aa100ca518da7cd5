#include <algorithm>
#include <string>

#include "view/show/escape.hpp"
#include "view/show/text.hpp"
#include "view/show/verify_words.hpp"
#include "view/show/words.hpp"

namespace view {

namespace {

void writePath(Columns& columns, const PathOfLun& shown) {
    const PathView& path = shown.path;
    columns.add({printable(path.device), path.lun.empty() ? "" : "LUN " + path.lun,
                 path.target.empty() ? "" : printable(path.initiator) + " -> " + printable(path.target),
                 printable(shown.lun)});
}

// Writes sentences in lines of a terminal's width.
void writeFolded(std::ostream& output, const Style& style, std::string_view text) {
    constexpr std::size_t kWidth = 96;
    while (!text.empty()) {
        const std::size_t blank = text.size() <= kWidth ? text.size() : text.rfind(' ', kWidth);
        const std::size_t end = std::min(blank, text.size());
        output << "    " << style.faint << text.substr(0, end) << style.end << '\n';
        text.remove_prefix(std::min(end + 1, text.size()));
    }
}

void writeFindings(std::ostream& output, const Verification& verification, const Style& style,
                   bool areDangers) {
    const auto isWanted = [&](const Finding& finding) { return isDanger(finding.kind) == areDangers; };
    const auto& findings = verification.findings;
    const auto count = std::count_if(findings.begin(), findings.end(), isWanted);
    if (count == 0) {
        return;
    }
    output << '\n'
           << style.problem << (areDangers ? "Danger (" : "Warnings (") << count << ')' << style.end << '\n';
    const Finding* last = nullptr;
    for (const Finding& finding : findings) {
        if (!isWanted(finding)) {
            continue;
        }
        if (last == nullptr || last->kind != finding.kind || advice(*last) != advice(finding)) {
            output << "  " << style.heading << meaning(finding.kind) << style.end << '\n';
            writeFolded(output, style, advice(finding));
        }
        last = &finding;
        Columns columns;
        for (const PathOfLun& path : finding.paths) {
            writePath(columns, path);
        }
        columns.write(output, "    ");
        const std::string words = particulars(finding);
        if (!words.empty()) {
            output << (finding.paths.empty() ? "    " : "      ") << words << '\n';
        }
    }
}

void writeCompared(std::ostream& output, const Verification& verification, const Style& style) {
    writeHeading(output, style, "Compared");
    const auto line = [&](const std::string& words) { output << "  " << words << '\n'; };
    line(counted(verification.comparedByPage + verification.comparedByWwid, "device") + ": " +
         std::to_string(verification.comparedByPage) + " with the kernel's page 0x83, " +
         std::to_string(verification.comparedByWwid) + " with its wwid");
    if (verification.renamed > 0) {
        line(std::to_string(verification.renamed) + " of them under another name than in the log");
    }
    for (const auto& [reason, devices] : verification.notCompared) {
        constexpr std::size_t kMostNames = 8;
        std::string names;
        for (std::size_t i = 0; i < std::min(devices.size(), kMostNames); ++i) {
            names += (i == 0 ? "" : ", ") + printable(devices[i]);
        }
        line(counted(devices.size(), "device") + " could not be compared: " + std::string(meaning(reason)));
        line("  " + names + (devices.size() > kMostNames ? ", ..." : ""));
    }
    line(counted(verification.luns, "LUN") + " with a name, " + counted(verification.maps, "multipath map") +
         ", " + std::to_string(verification.mapsCompared) + " of them compared with " +
         counted(verification.mapPaths, "path") + " of the log");
    line("the states of " + counted(verification.statesChecked, "device") +
         (verification.listedMaps > 0
              ? ", " + counted(verification.listedMaps, "map") + " of multipathd's list"
              : ""));
    if (verification.logTime) {
        line("the log is of " + timeWords(*verification.logTime) +
             (verification.bootTime ? ", the boot of " + timeWords(*verification.bootTime) : ""));
    }
}

} // namespace

void writeText(std::ostream& output, const Verification& verification, const Style& style) {
    output << style.heading << "What the devices of "
           << (verification.host.empty() ? "an unnamed host" : printable(verification.host))
           << " say, and what is remembered of them" << style.end << '\n';
    if (verification.findings.empty()) {
        output << '\n' << style.good << "Everything agrees." << style.end << '\n';
    }
    writeFindings(output, verification, style, true);
    writeFindings(output, verification, style, false);
    writeCompared(output, verification, style);
}

} // namespace view
