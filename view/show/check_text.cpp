#include <algorithm>
#include <array>
#include <sstream>
#include <string>
#include <string_view>
#include <vector>

#include "view/show/escape.hpp"
#include "view/show/text.hpp"
#include "view/show/warnings.hpp"
#include "view/show/words.hpp"

namespace view {

namespace {

constexpr std::size_t kMostNamed = 3; // subjects of one kind, in the first line

constexpr std::array<std::string_view, 4> kStatuses = {"OK", "WARNING", "CRITICAL", "UNKNOWN"};

// A text without the sign that begins performance data, in whatever line of the output it stands.
std::string withoutBars(std::string_view text) {
    std::string shown;
    for (const char c : text) {
        if (c == '|') {
            shown += "\\x7C";
        } else {
            shown += c;
        }
    }
    return shown;
}

// "WORDS (the first few subjects)".
std::string withSubjects(const std::string& words, const std::vector<std::string>& subjects) {
    std::string list;
    for (std::size_t i = 0; i < subjects.size() && i < kMostNamed; ++i) {
        list += (i == 0 ? "" : ", ") + subjects[i];
    }
    return words + " (" + list + (subjects.size() > kMostNamed ? ", ..." : "") + ")";
}

std::string doubtWords(const DiffWarning& doubt, const Difference& difference) {
    const std::string log = doubt.isOfNewLog ? "the log" : "the baseline";
    switch (doubt.kind) {
    case DiffWarning::Kind::TwoHosts:
        return "the baseline is of host " + printable(difference.hostBefore) + ", the log of host " +
               printable(difference.hostAfter) + ": if the host was renamed, take a new baseline";
    case DiffWarning::Kind::NoCommonInitiator:
        return "the baseline and the log have no initiator in common: they may be of two hosts";
    case DiffWarning::Kind::TreeEnded:
        return log + "'s " + std::string(section(doubt.tree)) +
               " tree was ended early: what is lost cannot be judged";
    default:
        return log + " is not whole: what is lost cannot be judged";
    }
}

void addIdentityChanges(std::vector<std::string>& reasons, const Difference& difference) {
    std::vector<std::string> devices;
    for (const IdentityChange& change : difference.identityChanges) {
        if (change.isDangerous()) {
            devices.push_back(printable(change.path.device));
        }
    }
    if (!devices.empty()) {
        reasons.push_back(withSubjects("another LUN behind " + counted(devices.size(), "path"), devices));
    }
}

void addLosses(std::vector<std::string>& reasons, const Check& check) {
    std::vector<PathCountChange> changes = check.difference.pathCounts;
    std::stable_sort(changes.begin(), changes.end(),
                     [](const PathCountChange& a, const PathCountChange& b) { return a.after < b.after; });
    std::vector<std::string> gone;
    std::vector<std::string> fewer;
    for (const PathCountChange& change : changes) {
        const std::string identifier = identifierWords({change.identifier, {}});
        if (change.after == 0) {
            gone.push_back(identifier);
        } else if (change.after < change.before) {
            fewer.push_back(identifier + ": " + std::to_string(change.after) + " of " +
                            std::to_string(change.before));
        }
    }
    if (!gone.empty()) {
        reasons.push_back(withSubjects(counted(gone.size(), "LUN") + " gone", gone));
    }
    if (!fewer.empty()) {
        reasons.push_back(withSubjects(counted(fewer.size(), "LUN") + " with fewer paths", fewer));
    }
    if (check.lostPaths > 0) {
        reasons.push_back(counted(check.lostPaths, "path") + " lost");
    }
    if (check.difference.powerPathAfter == PowerPathState::NotRunning) {
        reasons.emplace_back("PowerPath no longer runs");
    }
    if (reasons.empty()) {
        reasons.push_back("nothing lost, " + counted(check.luns, "LUN") + " with " +
                          counted(check.paths, "path"));
    }
}

void writeFirstLine(std::ostream& output, CheckStatus status, std::string_view words) {
    output << "MORVANE " << kStatuses.at(static_cast<std::size_t>(status)) << ": " << withoutBars(words);
}

// LABEL=VALUE;WARNING;CRITICAL;MINIMUM of each count.
void writePerformanceData(std::ostream& output, const Check& check) {
    output << " | luns=" << check.luns << ";;;0 paths=" << check.paths << ";;;0 lost_luns=" << check.lostLuns
           << ";;0;0 lost_paths=" << check.lostPaths << ';' << check.limits.warning.text << ';'
           << check.limits.critical.text << ";0 changed_identities=" << check.difference.dangerousChanges()
           << ";;0;0";
}

} // namespace

void writeText(std::ostream& output, const Check& check) {
    std::vector<std::string> reasons;
    addIdentityChanges(reasons, check.difference);
    if (check.doubt) {
        reasons.push_back(doubtWords(*check.doubt, check.difference));
    } else {
        addLosses(reasons, check);
    }
    std::string words;
    for (const std::string& reason : reasons) {
        words += (words.empty() ? "" : ", ") + reason;
    }
    writeFirstLine(output, check.status, words);
    if (!check.doubt) {
        writePerformanceData(output, check);
    }
    output << '\n';
    if (!check.difference.isEmpty() || !check.difference.warnings.empty()) {
        std::ostringstream details;
        writeText(details, check.difference, Style::of(false));
        output << withoutBars(details.str());
    }
}

void writeUnknown(std::ostream& output, std::string_view reason) {
    writeFirstLine(output, CheckStatus::Unknown, reason);
    output << '\n';
}

} // namespace view
