#pragma once

#include <cstdint>
#include <optional>
#include <set>
#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "view/identity/names.hpp"

namespace view {

// Who a logical unit is by its page 83h, to be compared with what others remember of it.
class LogicalUnit {
public:
    LogicalUnit() = default;

    // Takes what namesOf takes.
    LogicalUnit(std::span<const std::uint8_t> page83, std::string_view vendor, std::string_view product);

    // Whether the page has a designator that tells one logical unit from another.
    [[nodiscard]] bool isNamed() const { return !mNaming.empty() || !mVendorSpecific.empty(); }

    // Whether both pages are one unit's; nothing when they do not tell. Designators of a port or a target do
    // not count, for they belong to the path; vendor specific ones, which may hold a name that an
    // administrator changes, count only where there are no others. Of a page whose end is missing, what is
    // there counts.
    [[nodiscard]] std::optional<bool> isSame(const LogicalUnit& other) const;

    // Whether a `wwid` of the kernel is made of one of the designators. Which one differs between releases.
    [[nodiscard]] bool isKernelName(const std::string& wwid) const { return mKernelNames.contains(wwid); }

    // Whether a multipath map of this WWID may be this unit's: multipath takes it from udev or reads it
    // itself, and an administrator may choose.
    [[nodiscard]] bool isMapName(const std::string& wwid) const { return mMapNames.contains(wwid); }

    [[nodiscard]] const Names& names() const { return mNames; }

private:
    std::vector<std::string> mNaming; // designators with their type in front, in the page's order
    std::vector<std::string> mVendorSpecific;
    bool mIsWhole = true;
    Names mNames;
    std::set<std::string> mKernelNames;
    std::set<std::string> mMapNames;
};

} // namespace view
