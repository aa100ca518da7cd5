#include "view/model/check.hpp"

#include <algorithm>
#include <charconv>
#include <system_error>

namespace view {

namespace {

std::optional<std::uint64_t> wholeNumber(std::string_view text) {
    std::uint64_t number = 0;
    const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), number);
    if (text.empty() || error != std::errc() || end != text.data() + text.size()) {
        return std::nullopt;
    }
    return number;
}

// Why what the log does not list need not be lost.
std::optional<DiffWarning> doubtOf(const Difference& difference) {
    const auto& warnings = difference.warnings;
    const auto isDoubt = [&](const DiffWarning& warning) {
        switch (warning.kind) {
        case DiffWarning::Kind::TreeEnded: // as in the baseline: it is what this host has
            return warning.isOfNewLog &&
                   std::none_of(warnings.begin(), warnings.end(), [&](const auto& other) {
                       return other.kind == warning.kind && other.tree == warning.tree && !other.isOfNewLog;
                   });
        case DiffWarning::Kind::UnknownPieces:
            return false;
        default:
            return true;
        }
    };
    const auto found = std::find_if(warnings.begin(), warnings.end(), isDoubt);
    return found == warnings.end() ? std::nullopt : std::optional(*found);
}

// Lost paths and disks that have no identifier, and so count for no LUN.
std::size_t lostWithoutIdentifier(const Difference& difference) {
    const auto isNameless = [](const auto& lost) { return lost.identifier.empty(); };
    const auto isNamelessPath = [](const PathDifference& lost) {
        return lost.path.tree == Tree::Iscsi && lost.identifier.empty();
    };
    return static_cast<std::size_t>(
        std::count_if(difference.lostPaths.begin(), difference.lostPaths.end(), isNamelessPath) +
        std::count_if(difference.lostDirect.begin(), difference.lostDirect.end(), isNameless));
}

CheckStatus statusOf(const Check& check) {
    const auto& changes = check.difference.pathCounts;
    const bool isShort = std::any_of(changes.begin(), changes.end(), [&](const PathCountChange& change) {
        return change.after < change.before && change.after < check.limits.leastPaths;
    });
    if (check.difference.dangerousChanges() > 0) {
        return CheckStatus::Critical;
    }
    if (check.doubt) {
        return CheckStatus::Unknown;
    }
    if (check.lostLuns > 0 || isShort || check.limits.critical.isAlarm(check.lostPaths)) {
        return CheckStatus::Critical;
    }
    if (check.limits.warning.isAlarm(check.lostPaths) ||
        check.difference.powerPathAfter == PowerPathState::NotRunning) {
        return CheckStatus::Warning;
    }
    return CheckStatus::Ok;
}

} // namespace

std::optional<CountRange> countRange(std::string_view text) {
    CountRange range;
    range.text = text;
    range.isInverted = text.starts_with('@');
    text.remove_prefix(range.isInverted ? 1 : 0);
    const std::size_t colon = text.find(':');
    const std::string_view last = colon == std::string_view::npos ? text : text.substr(colon + 1);
    if (colon != std::string_view::npos && text.substr(0, colon) != "~") {
        const auto least = wholeNumber(text.substr(0, colon));
        if (!least) {
            return std::nullopt;
        }
        range.least = *least;
    }
    if (!last.empty()) {
        const auto most = wholeNumber(last);
        if (!most || *most < range.least) {
            return std::nullopt;
        }
        range.most = *most;
    }
    return text.empty() ? std::nullopt : std::optional(range);
}

Check check(const Model& baseline, const Model& log, const CheckLimits& limits) {
    Check check;
    check.limits = limits;
    check.difference = compare(baseline, log);
    check.doubt = doubtOf(check.difference);
    check.luns = log.luns.size();
    for (const Lun& lun : log.luns) {
        check.paths += lun.devices.size();
    }
    check.lostPaths = lostWithoutIdentifier(check.difference);
    for (const PathCountChange& change : check.difference.pathCounts) {
        check.lostPaths += change.before > change.after ? change.before - change.after : 0;
        check.lostLuns += change.after == 0 ? 1 : 0;
    }
    check.status = statusOf(check);
    return check;
}

} // namespace view
