#include "view/identity/namers.hpp"

namespace view {

namespace {

// How much the kernel prefers a designator, from 5.11 on; 0: not at all.
unsigned priority(const Designator& designator) {
    if (designator.association != 0 || designator.length == 0) {
        return 0;
    }
    switch (designator.type) {
    case Designator::kScsiName:
        return 9;
    case Designator::kNaa:
        switch (designator.naaFormat) {
        case 6:
            return 8;
        case 5:
            return 5;
        case 4:
            return 4;
        case 3:
            return 1;
        default:
            return 0;
        }
    case Designator::kEui64:
        switch (designator.length) {
        case 16:
            return 7;
        case 12:
            return 6;
        case 8:
            return 3;
        default:
            return 0;
        }
    case Designator::kT10:
        return 1;
    default:
        return 0;
    }
}

// Bytes that are no printable ASCII characters as the kernel's printf escapes them.
std::string escaped(const std::string& bytes) {
    constexpr std::string_view kSpaces = "\f\n\r\t\v";
    constexpr std::string_view kLetters = "fnrtv";
    std::string text;
    for (const char c : bytes) {
        const auto byte = static_cast<unsigned char>(c);
        if (byte >= 0x20 && byte < 0x7F) {
            text += c;
        } else if (const std::size_t space = kSpaces.find(c); space != std::string_view::npos) {
            text += '\\';
            text += kLetters[space];
        } else if (c == '\a' || c == '\033') {
            text += c == '\a' ? "\\a" : "\\e";
        } else if (c == '\0') {
            text += "\\0";
        } else {
            text += '\\';
            for (const unsigned shift : {6U, 3U, 0U}) {
                text += static_cast<char>('0' + ((byte >> shift) & 7U));
            }
        }
    }
    return text;
}

} // namespace

std::string kernelName(const Page83Bytes& page) {
    if (!page.isPage83()) { // it keeps no such answer
        return {};
    }
    std::string name;
    unsigned best = 0;
    std::size_t bestLength =
        0; // of the designator named so far; a shorter text of equal rank does not replace it
    Designator designator;
    for (std::size_t at = Page83Bytes::kHeader; at < page.size(); at = designator.end()) {
        designator = Designator::read(page, at);
        const unsigned rank = priority(designator);
        if (rank == 0 || rank < best) {
            continue;
        }
        const std::size_t length =
            std::min(designator.length, page.size() - std::min(page.size(), designator.at));
        const bool isText = designator.type == Designator::kT10 || designator.type == Designator::kScsiName;
        if (isText && designator.length < bestLength) {
            continue;
        }
        best = rank;
        bestLength = designator.length;
        if (designator.type == Designator::kT10) {
            name = "t10." + escaped(page.text(designator.at, length));
        } else if (designator.type == Designator::kScsiName) {
            name = upToNul(page.text(designator.at, length));
        } else if (designator.type == Designator::kEui64) {
            name = "eui." + page.hex(designator.at, length);
        } else if (designator.length == 8 || designator.length == 16) {
            name = "naa." + page.hex(designator.at, length);
        }
    }
    return name;
}

} // namespace view
