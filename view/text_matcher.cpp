#include "view/text_matcher.hpp"

#include <algorithm>

namespace view {

namespace {

// A text that ends in a field and has no line end runs up to whatever comes next on its line.
constexpr std::array<std::string_view, 5> followers = {
    "Entered Function ", "Left Function ", "Line: ", "End of popened Buffer", "Incomplete line: ",
};
constexpr std::string_view nextPowerPathEntry = "               ";

// Below this many leading bytes a text is too common to wait for its rest.
constexpr std::size_t shortestOpening = 8;

// Ends of text fields tried before a line is given up; the texts themselves need one or two.
constexpr int maximumAttempts = 256;

std::size_t findFollower(Text text, std::string_view bytes, std::size_t from) {
    for (std::size_t at = bytes.find_first_of("ELI ", from); at != std::string_view::npos;
         at = bytes.find_first_of("ELI ", at + 1)) {
        const std::string_view rest = bytes.substr(at);
        const auto begins = [rest](std::string_view follower) { return rest.starts_with(follower); };
        if (std::any_of(followers.begin(), followers.end(), begins) ||
            (text == Text::PowerPathEntry && begins(nextPowerPathEntry))) {
            return at;
        }
    }
    return bytes.size();
}

bool isDecimal(char c) {
    return c >= '0' && c <= '9';
}

bool isLowerHex(char c) {
    return isDecimal(c) || (c >= 'a' && c <= 'f');
}

bool isRealPart(char c) {
    return isDecimal(c) || c == '.' || c == '-';
}

template <typename Accepts>
std::size_t runEnd(std::string_view bytes, std::size_t from, Accepts accepts) {
    while (from < bytes.size() && accepts(bytes[from])) {
        ++from;
    }
    return from;
}

} // namespace

TextMatcher::TextMatcher(std::span<const KnownText> texts) : patternsByFirstByte_(256) {
    for (const KnownText& known : texts) {
        Pattern pattern = compile(known);
        const auto first = static_cast<unsigned char>(pattern.pieces.front().literal.front());
        patternsByFirstByte_[first].push_back(std::move(pattern));
    }
    // A text with a line end goes before the same text without one, a longer opening before a shorter one.
    for (std::vector<Pattern>& patterns : patternsByFirstByte_) {
        std::stable_sort(patterns.begin(), patterns.end(), [](const Pattern& a, const Pattern& b) {
            if (a.endsLine != b.endsLine) {
                return a.endsLine;
            }
            return a.pieces.front().literal.size() > b.pieces.front().literal.size();
        });
    }
}

TextMatcher::Pattern TextMatcher::compile(const KnownText& known) {
    Pattern pattern{known.text, false, false, {}};
    std::string_view format = known.format;
    if (format.ends_with('\n')) {
        pattern.endsLine = true;
        format.remove_suffix(1);
    }
    bool afterText = false;
    while (!format.empty()) {
        const Piece piece = takePiece(format);
        pattern.mayRunOver = pattern.mayRunOver || (afterText && !piece.literal.empty());
        afterText = afterText || piece.field == Field::Text;
        pattern.pieces.push_back(piece);
    }
    return pattern;
}

// Cuts the next literal and its field off the front of a format.
TextMatcher::Piece TextMatcher::takePiece(std::string_view& format) {
    const std::size_t percent = format.find('%');
    if (percent == std::string_view::npos) {
        const Piece piece{format, Field::None};
        format = {};
        return piece;
    }
    const std::size_t conversion = format.find_first_of("sduxfp", percent);
    Piece piece{format.substr(0, percent), Field::None};
    switch (format[conversion]) {
    case 's':
        piece.field = Field::Text;
        break;
    case 'x':
        piece.field = Field::Hex;
        break;
    case 'f':
        piece.field = Field::Real;
        break;
    case 'p':
        piece.field = Field::Pointer;
        break;
    default:
        piece.field = Field::Decimal;
        break;
    }
    format.remove_prefix(conversion + 1);
    return piece;
}

MatchResult TextMatcher::match(std::string_view bytes, TextMatch& match) const {
    if (bytes.empty()) {
        return MatchResult::None;
    }
    MatchResult result = MatchResult::None;
    for (const Pattern& pattern : patternsByFirstByte_[static_cast<unsigned char>(bytes.front())]) {
        const std::string_view opening = pattern.pieces.front().literal;
        if (!bytes.starts_with(opening)) {
            continue;
        }
        match.text = pattern.text;
        match.fieldCount = 0;
        int attempts = maximumAttempts;
        if (matchPieces(pattern, 0, bytes, 0, match, attempts)) {
            return MatchResult::Found;
        }
        if (pattern.mayRunOver && opening.size() >= shortestOpening) {
            result = MatchResult::Unending;
        }
    }
    return result;
}

// Matches the pieces from number `piece` on against `bytes` from `at` on; backs out of a text field that was
// taken too short.
bool TextMatcher::matchPieces(const Pattern& pattern, std::size_t piece, std::string_view bytes,
                              std::size_t at, TextMatch& match, int& attempts) {
    if (piece == pattern.pieces.size()) {
        match.length = at;
        return !pattern.endsLine || at == bytes.size();
    }
    const auto& [literal, field] = pattern.pieces[piece];
    if (!bytes.substr(at).starts_with(literal)) {
        return false;
    }
    at += literal.size();
    if (field == Field::None) {
        return matchPieces(pattern, piece + 1, bytes, at, match, attempts);
    }

    const std::size_t slot = match.fieldCount;
    const auto take = [&](std::size_t end) {
        match.fields.at(slot) = bytes.substr(at, end - at);
        match.fieldCount = slot + 1;
        return matchPieces(pattern, piece + 1, bytes, end, match, attempts);
    };
    if (field == Field::Text) {
        if (piece + 1 == pattern.pieces.size()) {
            return take(pattern.endsLine ? bytes.size() : findFollower(pattern.text, bytes, at));
        }
        const std::string_view next = pattern.pieces[piece + 1].literal;
        for (std::size_t end = bytes.find(next, at); end != std::string_view::npos && attempts > 0;
             --attempts, end = bytes.find(next, end + 1)) {
            if (take(end)) {
                return true;
            }
        }
        return false;
    }

    std::size_t end = at;
    switch (field) {
    case Field::Decimal:
        end = runEnd(bytes, at + (bytes.substr(at).starts_with('-') ? 1 : 0), isDecimal);
        break;
    case Field::Hex:
        end = runEnd(bytes, at, isLowerHex);
        break;
    case Field::Real:
        end = runEnd(bytes, at, isRealPart);
        break;
    default: // a pointer as printf writes it
        if (bytes.substr(at).starts_with("(nil)")) {
            end = at + 5;
        } else if (bytes.substr(at).starts_with("0x")) {
            end = runEnd(bytes, at + 2, isLowerHex);
        }
        break;
    }
    return end > at && take(end);
}

} // namespace view
