#include <array>
#include <utility>

#include "view/identity/namers.hpp"

namespace view {

namespace {

// What sg_inq tells the rules of the logical unit: its designators, of each kind the last one.
struct Found {
    std::string vendorSpecific;
    std::string t10;
    std::string ata; // of a T10 designator whose vendor is ATA: model and serial number
    std::string eui64;
    std::string naaExtended;           // NAA 2
    std::string naaRegistered;         // NAA 5
    std::string naaRegisteredExtended; // NAA 6
    std::string naaLocal;              // any other
    std::string scsiName;
};

bool isBlank(char c) {
    return c == ' ' || c == '\t';
}

// A text with blanks as underscores, one for a run of them and none at its ends, and with dots for what
// cannot be shown. A single NUL is passed over, two end it.
std::string shown(std::string_view text) {
    constexpr std::string_view kPadding(" \t\0", 3);
    text.remove_prefix(std::min(text.find_first_not_of(kPadding), text.size()));
    text = text.substr(0, text.find_last_not_of(kPadding) + 1);
    std::string result;
    for (std::size_t i = 0; i < text.size() && !text.substr(i).starts_with(std::string_view("\0\0", 2));
         ++i) {
        const char c = text[i];
        if (isBlank(c)) {
            result += result.ends_with('_') ? "" : "_";
        } else if (c != '\0') {
            result += c > ' ' && c <= '~' ? c : '.';
        }
    }
    return result;
}

// A text with the characters that a shell may take for its own in hexadecimal.
std::string encoded(const std::string& text) {
    constexpr std::string_view kDigits = "0123456789abcdef";
    std::string result;
    for (const char c : text) {
        if (isSafe(c)) {
            result += c;
        } else {
            const auto byte = static_cast<unsigned char>(c);
            result += "\\x";
            result += kDigits[byte >> 4U];
            result += kDigits[byte & 0xFU];
        }
    }
    return result;
}

// The value of a line KEY=value as udev reads it.
std::string lineValue(std::string value) {
    value.resize(std::min(value.find('\n'), value.size()));
    value.resize(value.find_last_not_of(" \t\r\v\f") + 1);
    return value;
}

std::string& naaOf(Found& found, unsigned format) {
    switch (format) {
    case 2:
        return found.naaExtended;
    case 5:
        return found.naaRegistered;
    case 6:
        return found.naaRegisteredExtended;
    default:
        return found.naaLocal;
    }
}

void take(const Page83Bytes& page, const Designator& designator, Found& found) {
    const bool isText = designator.codeSet == Designator::kAscii || designator.codeSet == Designator::kUtf8;
    const std::string hex = page.hex(designator.at, designator.length);
    const std::string text = page.text(designator.at, designator.length);
    switch (designator.type) {
    case Designator::kVendorSpecific:
        if (designator.length > 0) {
            found.vendorSpecific = isText ? encoded(shown(text)) : hex;
        }
        break;
    case Designator::kT10:
        found.t10 = isText ? encoded(shown(text)) : hex;
        if (isText && text.starts_with("ATA     ")) {
            found.ata = shown(text).substr(std::min<std::size_t>(shown(text).size(), 4));
        }
        break;
    case Designator::kEui64:
        if (!isText) {
            found.eui64 = hex;
        }
        break;
    case Designator::kNaa:
        if (!isText) {
            naaOf(found, designator.naaFormat) = hex;
        }
        break;
    case Designator::kScsiName:
        if (designator.codeSet == Designator::kUtf8) {
            found.scsiName = lineValue(upToNul(text));
        }
        break;
    default:
        break;
    }
}

Found find(const Page83Bytes& page) {
    Found found;
    if (page.isBareIdentifier()) {
        naaOf(found, page[Page83Bytes::kHeader] >> 4U) =
            page.hex(Page83Bytes::kHeader, page.size() - Page83Bytes::kHeader);
        return found;
    }
    Designator designator;
    for (std::size_t at = Page83Bytes::kHeader; at + Page83Bytes::kDesignatorHeader <= page.size();
         at = designator.end()) {
        designator = Designator::read(page, at);
        if (designator.end() > page.size() || designator.association == 3) { // a reserved one
            break;
        }
        if (designator.association == 0) {
            take(page, designator, found);
        }
    }
    return found;
}

} // namespace

Sg3Names sg3Names(const Page83Bytes& page, std::string_view vendor, std::string_view product) {
    if (!page.isPage83()) {
        return {};
    }
    const Found found = find(page);
    Sg3Names names;
    for (const std::string* naa :
         {&found.naaRegisteredExtended, &found.naaRegistered, &found.naaExtended, &found.naaLocal}) {
        names.wwn = names.wwn.empty() ? *naa : names.wwn;
    }
    // In the rules' order of preference, with the prefix of the name.
    const auto kinds = std::to_array<std::pair<std::string_view, const std::string*>>({
        {"3", &found.naaRegisteredExtended},
        {"3", &found.naaRegistered},
        {"3", &found.naaExtended},
        {"2", &found.eui64},
        {"8", &found.scsiName},
        {"1", &found.t10},
    });
    if (!found.ata.empty()) {
        names.serial = found.ata;
        names.bus = "ata";
    }
    for (const auto& [prefix, id] : kinds) {
        if (!id->empty()) {
            names.links.push_back("scsi-" + std::string(prefix) + *id);
            if (names.serial.empty()) {
                names.serial = std::string(prefix) + *id;
                names.bus = "scsi";
            }
        }
    }
    if (!found.naaLocal.empty()) {
        names.links.push_back("scsi-3" + found.naaLocal);
    }
    if (!found.vendorSpecific.empty() && !(vendor.empty() && product.empty())) {
        names.links.push_back("scsi-0" + encoded(shown(vendor)) + '_' + encoded(shown(product)) + '_' +
                              found.vendorSpecific);
    }
    return names;
}

} // namespace view
