#pragma once

#include <cstdint>
#include <limits>
#include <optional>
#include <string>
#include <string_view>

#include "view/model/diff.hpp"
#include "view/model/model.hpp"

namespace view {

// A state of a service; its number is the exit status by which programs that watch services know it.
enum class CheckStatus : unsigned char { Ok, Warning, Critical, Unknown };

// Counts that are no reason for an alarm, as plugins of monitoring programs write them: "3" (up to 3), "1:3",
// "2:" (2 or more), "~:3" (up to 3), and with an @ before it the counts that are one.
struct CountRange {
    std::string text; // as it was given; empty: no count is a reason
    std::uint64_t least = 0;
    std::uint64_t most = std::numeric_limits<std::uint64_t>::max();
    bool isInverted = false;

    [[nodiscard]] bool isAlarm(std::uint64_t count) const {
        return (least <= count && count <= most) == isInverted;
    }
};

// The range that a text writes; nothing when it writes none, or one of other than whole numbers.
std::optional<CountRange> countRange(std::string_view text);

// When a loss is an alarm.
struct CheckLimits {
    CountRange warning{"0", 0, 0, false}; // of lost paths
    CountRange critical;                  // likewise
    std::uint64_t leastPaths = 1; // that a LUN which lost some must have left; with fewer it is critical
};

// What became of a host's paths since the baseline.
struct Check {
    CheckStatus status = CheckStatus::Ok;
    std::optional<DiffWarning> doubt; // why what is lost cannot be judged
    Difference difference;            // from the baseline to the log
    CheckLimits limits;
    std::size_t luns = 0;      // of the log
    std::size_t paths = 0;     // to them
    std::size_t lostPaths = 0; // those of the baseline's LUNs, and those to what has no identifier
    std::size_t lostLuns = 0;
};

// Judges a log by the baseline. Another LUN behind a path is critical even where losses cannot be judged.
Check check(const Model& baseline, const Model& log, const CheckLimits& limits);

} // namespace view
