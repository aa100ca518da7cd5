#include "view/identity/logical_unit.hpp"

#include <algorithm>
#include <cstddef>

#include "view/identity/namers.hpp"
#include "view/identity/page83.hpp"

namespace view {

namespace {

constexpr unsigned kMd5 = 7; // types of designators that no program here makes a name of
constexpr unsigned kUuid = 10;

bool isNaming(unsigned type) {
    switch (type) {
    case Designator::kT10:
    case Designator::kEui64:
    case Designator::kNaa:
    case Designator::kScsiName:
    case kMd5:
    case kUuid:
        return true;
    default:
        return false;
    }
}

// A page with nothing but the designator from `at` to `end` of another.
std::vector<std::uint8_t> alone(std::span<const std::uint8_t> page, std::size_t at, std::size_t end) {
    const std::size_t length = end - at;
    std::vector<std::uint8_t> bytes = {page[0], 0x83, static_cast<std::uint8_t>(length >> 8U),
                                       static_cast<std::uint8_t>(length & 0xffU)};
    bytes.insert(bytes.end(), page.begin() + static_cast<std::ptrdiff_t>(at),
                 page.begin() + static_cast<std::ptrdiff_t>(end));
    return bytes;
}

// Whether the lists are the same as far as both go.
std::optional<bool> agree(std::vector<std::string> one, std::vector<std::string> other, bool areWhole) {
    if (!areWhole) {
        const std::size_t common = std::min(one.size(), other.size());
        if (common == 0) {
            return std::nullopt;
        }
        one.resize(common);
        other.resize(common);
    }
    std::sort(one.begin(), one.end());
    std::sort(other.begin(), other.end());
    return one == other;
}

} // namespace

LogicalUnit::LogicalUnit(std::span<const std::uint8_t> page83, std::string_view vendor,
                         std::string_view product)
    : mNames(namesOf(page83, vendor, product)) {
    mKernelNames.insert(mNames.kernel);
    mMapNames.insert({mNames.multipath, mNames.scsiId, mNames.sg3Rules});
    const Page83Bytes page(page83);
    if (page[1] != 0x83) {
        return;
    }
    const std::size_t end = std::min(page.listEnd(), page.size());
    mIsWhole = page.listEnd() <= page.size();
    Designator designator;
    for (std::size_t at = Page83Bytes::kHeader; at < end; at = designator.end()) {
        designator = Designator::read(page, at);
        if (designator.end() > end) {
            mIsWhole = false;
            break;
        }
        if (designator.association != 0 || designator.length == 0) {
            continue;
        }
        std::string text = std::to_string(designator.type) + ' ' + page.hex(designator.at, designator.length);
        if (isNaming(designator.type)) {
            mNaming.push_back(std::move(text));
            const std::vector<std::uint8_t> only = alone(page83, at, designator.end());
            mKernelNames.insert(kernelName(Page83Bytes(only)));
            mMapNames.insert(multipathName(Page83Bytes(only)));
        } else if (designator.type == Designator::kVendorSpecific) {
            mVendorSpecific.push_back(std::move(text));
        }
    }
    mKernelNames.erase("");
    mMapNames.erase("");
}

std::optional<bool> LogicalUnit::isSame(const LogicalUnit& other) const {
    if (!isNamed() || !other.isNamed()) {
        return std::nullopt;
    }
    const bool areWhole = mIsWhole && other.mIsWhole;
    if (!mNaming.empty() || !other.mNaming.empty()) {
        return agree(mNaming, other.mNaming, areWhole);
    }
    return agree(mVendorSpecific, other.mVendorSpecific, areWhole);
}

} // namespace view
