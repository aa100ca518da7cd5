#include <cctype>

#include "view/identity/namers.hpp"

namespace view {

namespace {

constexpr std::size_t kLongestName = 127;
constexpr std::size_t kLongestDesignator = 128; // of a longer one the beginning counts
constexpr std::size_t kPrefix = 4;              // eui., naa. and iqn. of a SCSI name string

// How much multipath prefers a designator; 0: it is not to be used.
unsigned priority(const Page83Bytes& page, const Designator& designator) {
    if (designator.association != 0) {
        return 0;
    }
    switch (designator.type) {
    case Designator::kNaa:
        if (designator.length != (designator.naaFormat == 6 ? 16 : 8)) {
            return 0;
        }
        switch (designator.naaFormat) {
        case 6:
            return 8;
        case 5:
            return 7;
        case 2:
            return 6;
        case 3:
            return 1;
        default:
            return 0;
        }
    case Designator::kEui64:
        return designator.length == 8 || designator.length == 12 || designator.length == 16 ? 4 : 0;
    case Designator::kScsiName: {
        const std::string prefix = page.text(designator.at, std::min(designator.length, kPrefix));
        return prefix == "eui." || prefix == "naa." || prefix == "iqn." ? 3 : 0;
    }
    case Designator::kT10:
        return designator.length >= 8 ? 2 : 0;
    default:
        return 0;
    }
}

std::string lowerCase(std::string text) {
    for (char& c : text) {
        c = c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c;
    }
    return text;
}

// A text with each run of blanks as one underscore, and none at its end.
std::string withoutBlanks(std::string_view text) {
    text = text.substr(0, text.find_last_not_of(' ') + 1);
    std::string result;
    for (std::size_t i = 0; i < text.size(); ++i) {
        if (text[i] != ' ') {
            result += text[i];
        } else if (i == 0 || text[i - 1] != ' ') {
            result += '_';
        }
    }
    return result;
}

std::string nameOf(const Page83Bytes& page, const Designator& designator) {
    const std::string text = page.text(designator.at, std::min(designator.length, kLongestDesignator));
    switch (designator.type) {
    case Designator::kScsiName:
        if (text.starts_with("iqn.")) {
            return '8' + text.substr(kPrefix);
        }
        return (text.starts_with("eui.") ? '2' : '3') + lowerCase(text.substr(kPrefix));
    case Designator::kT10:
        return '1' + withoutBlanks(text);
    default:
        return std::to_string(designator.type) + page.hex(designator.at, designator.length);
    }
}

} // namespace

std::string multipathName(const Page83Bytes& page) {
    if (!page.isPage83()) {
        return {};
    }
    Designator best;
    unsigned bestRank = 0;
    Designator designator;
    for (std::size_t at = Page83Bytes::kHeader; at + Page83Bytes::kDesignatorHeader <= page.size();
         at = designator.end()) {
        designator = Designator::read(page, at);
        if (designator.end() > page.size()) {
            break;
        }
        const unsigned rank = priority(page, designator);
        if (rank > bestRank) {
            best = designator;
            bestRank = rank;
        }
    }
    return bestRank == 0 ? std::string() : upToNul(nameOf(page, best)).substr(0, kLongestName);
}

} // namespace view
