#include <array>

#include "view/identity/namers.hpp"

namespace view {

namespace {

constexpr std::size_t kAsked = 254;   // bytes it asks the device for
constexpr std::size_t kMaximum = 256; // bytes of its name, the NUL at the end included
constexpr std::size_t kVendor = 8;    // bytes of the fields of the standard INQUIRY data
constexpr std::size_t kProduct = 16;
constexpr std::size_t kWwn = 32; // digits of a WWN with its extension

// What is looked for, in this order, through all of the page each time.
struct Wanted {
    Designator::Type type;
    Designator::CodeSet codeSet;
    std::optional<unsigned> naaFormat;
};

constexpr auto kWanted = std::to_array<Wanted>({
    {Designator::kNaa, Designator::kBinary, 6},
    {Designator::kNaa, Designator::kAscii, 6},
    {Designator::kNaa, Designator::kBinary, 5},
    {Designator::kNaa, Designator::kAscii, 5},
    {Designator::kNaa, Designator::kBinary, std::nullopt},
    {Designator::kNaa, Designator::kAscii, std::nullopt},
    {Designator::kEui64, Designator::kBinary, std::nullopt},
    {Designator::kEui64, Designator::kAscii, std::nullopt},
    {Designator::kT10, Designator::kBinary, std::nullopt},
    {Designator::kT10, Designator::kAscii, std::nullopt},
    {Designator::kVendorSpecific, Designator::kBinary, std::nullopt},
    {Designator::kVendorSpecific, Designator::kAscii, std::nullopt},
});

std::string padded(std::string_view field, std::size_t width) {
    std::string text(field);
    text.resize(width, ' ');
    return text;
}

bool fits(const Designator& designator, const Wanted& wanted) {
    const std::size_t length = (designator.codeSet == Designator::kAscii ? 1 : 2) * designator.length + 2 +
                               (designator.type == Designator::kVendorSpecific ? kVendor + kProduct : 0);
    return designator.association == 0 && designator.type == wanted.type &&
           designator.codeSet == wanted.codeSet &&
           (!wanted.naaFormat || designator.naaFormat == *wanted.naaFormat) && length <= kMaximum;
}

std::optional<Designator> find(const Page83Bytes& page, const Wanted& wanted) {
    Designator designator;
    for (std::size_t at = Page83Bytes::kHeader; at < std::min(page.listEnd(), kAsked);
         at = designator.end()) {
        designator = Designator::read(page, at);
        if (fits(designator, wanted)) {
            return designator;
        }
    }
    return std::nullopt;
}

} // namespace

ScsiIdName scsiIdName(const Page83Bytes& page, std::string_view vendor, std::string_view product) {
    if (!page.isPage83()) {
        return {};
    }
    const Page83Bytes asked = page.first(kAsked);
    if (asked.isBareIdentifier()) {
        return {"3" + asked.hex(Page83Bytes::kHeader, std::min<std::size_t>(asked[3], (kMaximum - 3) / 2)),
                {}};
    }
    for (const Wanted& wanted : kWanted) {
        const std::optional<Designator> designator = find(asked, wanted);
        if (!designator) {
            continue;
        }
        const std::string id = designator->codeSet == Designator::kAscii
                                   ? upToNul(asked.text(designator->at, designator->length))
                                   : asked.hex(designator->at, designator->length);
        if (wanted.type == Designator::kVendorSpecific) {
            return vendor.empty() && product.empty()
                       ? ScsiIdName()
                       : ScsiIdName{upToNul("0" + padded(vendor, kVendor) + padded(product, kProduct) + id),
                                    {}};
        }
        const std::size_t shown = wanted.type == Designator::kNaa ? kWwn : 0;
        return {std::to_string(wanted.type) + id, id.substr(0, shown)};
    }
    return {};
}

} // namespace view
