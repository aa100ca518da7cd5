#include "view/show/warnings.hpp"

#include <sstream>

#include "view/show/escape.hpp"
#include "view/show/words.hpp"

namespace view {

namespace {

std::string words(const DiffWarning& warning, const Difference& difference) {
    const std::string log = warning.isOfNewLog ? "the new log" : "the old log";
    switch (warning.kind) {
    case DiffWarning::Kind::TwoHosts:
        return "the logs are of two hosts: " + printable(difference.hostBefore) + " and " +
               printable(difference.hostAfter);
    case DiffWarning::Kind::NoCommonInitiator:
        return "the logs have no initiator in common: they may be of two hosts";
    case DiffWarning::Kind::NotWhole:
        return log + " is not whole: what it does not reach counts as lost";
    case DiffWarning::Kind::TreeEnded:
        return log + "'s " + std::string(section(warning.tree)) +
               " tree was ended early: what it does not list counts as lost";
    default:
        return log + " holds " + counted(warning.pieces, "piece") + " that are none of Morvane's texts";
    }
}

} // namespace

std::vector<std::string> warningsOf(const LogFacts& log) {
    std::vector<std::string> warnings;
    if (log.runs > 1) {
        warnings.push_back("it holds " + counted(log.runs, "run") + "; the last one is shown");
    }
    if (log.beginsInside) {
        warnings.emplace_back("its beginning is missing");
    }
    if (log.leftoverTexts > 0) {
        warnings.push_back(
            counted(log.leftoverTexts, "text") +
            " before the first run or behind the end of the last one left out: an older run's");
    }
    if (log.cutInLine) {
        warnings.emplace_back("its last line has no end");
    }
    if (log.unknownPieces > 0) {
        std::ostringstream warning;
        warning << counted(log.unknownPieces, "piece") << (log.unknownPieces == 1 ? " is" : " are")
                << " none of Morvane's texts:";
        for (const UnknownPiece& piece : log.unknownSamples) {
            warning << "\n    line " << piece.line << ": " << printable(piece.bytes);
        }
        if (log.unknownPieces > log.unknownSamples.size()) {
            warning << "\n    and " << log.unknownPieces - log.unknownSamples.size() << " more";
        }
        warnings.push_back(warning.str());
    }
    return warnings;
}

std::vector<std::string> warningsOf(const Difference& difference) {
    std::vector<std::string> warnings;
    for (const DiffWarning& warning : difference.warnings) {
        warnings.push_back(words(warning, difference));
    }
    return warnings;
}

} // namespace view
