#include "view/read/text_matcher.hpp"

#include <algorithm>

#include "view/read/foreign_texts.hpp"

namespace view {

namespace {

// A text that ends in a field and has no line end runs up to whatever comes next on its line.
constexpr std::array<std::string_view, 6> kFollowers = {
    "Entered Function ", "Left Function ", "Line: ", "End of popened Buffer", "Incomplete line: ", "\n",
};
constexpr std::string_view kNextPowerPathEntry = "               ";

// Below this many leading bytes a text is too common to wait for its rest.
constexpr std::size_t kShortestOpening = 8;

// The longest text field, in bytes: PATH_MAX, and more than the 3999 that the program reads of a command's
// output at once. What devices and libraries fill in is shorter: 510 hexadecimal digits of a designator, 256
// characters of an HBA's attribute, 223 of an iSCSI name. Without a limit, each text of a long line would
// search all of it.
constexpr std::size_t kLongestField = 4096;

std::size_t findFollower(Text text, std::string_view bytes, std::size_t from) {
    for (std::size_t at = bytes.find_first_of("ELI \n", from); at != std::string_view::npos;
         at = bytes.find_first_of("ELI \n", at + 1)) {
        const std::string_view rest = bytes.substr(at);
        const auto begins = [rest](std::string_view follower) { return rest.starts_with(follower); };
        if (std::any_of(kFollowers.begin(), kFollowers.end(), begins) ||
            (text == Text::PowerPathEntry && begins(kNextPowerPathEntry))) {
            return at;
        }
    }
    return bytes.size();
}

// The end of the line, as far as a field may reach.
std::size_t findLineEnd(std::string_view bytes, std::size_t from) {
    const std::string_view reach = bytes.substr(0, from + kLongestField + 1);
    return std::min(reach.find('\n', from), reach.size());
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

// The bytes in which a text may stand: up to a line end, which a foreign text moves behind itself.
class TextMatcher::Reach {
public:
    Reach(std::string_view all, std::size_t end, const ForeignTexts& foreign)
        : mAll(all), mEnd(std::min(end, all.size())), mForeign(foreign) {}

    [[nodiscard]] std::string_view bytes() const { return mAll.substr(0, mEnd); }

    // The place behind the foreign text that begins at `at`; `at` when there is none.
    std::size_t behindForeign(std::size_t at) {
        const std::size_t length = mForeign.lengthAt(mAll.substr(at));
        if (length == ForeignTexts::kUnending) {
            mIsCut = true;
            return at;
        }
        if (at + length > mEnd) {
            mEnd = std::min(mAll.find('\n', at + length), mAll.size());
        }
        return at + length;
    }

    // Whether a foreign text may go on behind the bytes.
    [[nodiscard]] bool isCut() const { return mIsCut; }

private:
    std::string_view mAll;
    std::size_t mEnd;
    const ForeignTexts& mForeign;
    bool mIsCut = false;
};

TextMatcher::TextMatcher(std::span<const KnownText> texts) : mPatternsByFirstByte(256) {
    for (const KnownText& known : texts) {
        Pattern pattern = compile(known);
        const auto first = static_cast<unsigned char>(pattern.pieces.front().literal.front());
        mPatternsByFirstByte[first].push_back(std::move(pattern));
    }
    // A longer opening goes before a shorter one, a text with a line end before the same text without one.
    for (std::vector<Pattern>& patterns : mPatternsByFirstByte) {
        std::stable_sort(patterns.begin(), patterns.end(), [](const Pattern& a, const Pattern& b) {
            const std::size_t openingOfA = a.pieces.front().literal.size();
            const std::size_t openingOfB = b.pieces.front().literal.size();
            return openingOfA != openingOfB ? openingOfA > openingOfB : a.endsLine && !b.endsLine;
        });
    }
}

TextMatcher::Pattern TextMatcher::compile(const KnownText& known) {
    Pattern pattern{known.text, known.section, false, false, {}};
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

MatchResult TextMatcher::match(std::string_view bytes, std::size_t reach, const ForeignTexts& foreign,
                               TextMatch& match) const {
    if (bytes.empty()) {
        return MatchResult::None;
    }
    MatchResult result = MatchResult::None;
    for (const Pattern& pattern : mPatternsByFirstByte[static_cast<unsigned char>(bytes.front())]) {
        const std::string_view opening = pattern.pieces.front().literal;
        if (!bytes.starts_with(opening)) {
            continue;
        }
        Reach attempt(bytes, reach, foreign);
        const bool isFound = matchPattern(pattern, attempt, match);
        if (isFound || attempt.isCut()) {
            return attempt.isCut() ? MatchResult::Cut : MatchResult::Found;
        }
        if (pattern.mayRunOver && opening.size() >= kShortestOpening) {
            result = MatchResult::Unending;
        }
    }
    return result;
}

// A text field ends at the first place behind which the pieces up to the next text field fit. No other end is
// tried when those behind them do not fit: what is not there behind one place is not there behind a later
// one. So the work grows with the bytes, whatever they are. What is known to be foreign at the beginning of a
// field is not searched.
bool TextMatcher::matchPattern(const Pattern& pattern, Reach& reach, TextMatch& match) {
    match.text = pattern.text;
    match.section = pattern.section;
    match.fieldCount = 0;
    Position position;
    if (!matchUpToText(pattern, reach, position, match)) {
        return false;
    }
    while (position.piece < pattern.pieces.size()) {
        const std::string_view next = pattern.pieces[position.piece].literal;
        const std::size_t start = position.at;
        const std::size_t slot = match.fieldCount;
        const std::size_t searched = reach.behindForeign(start);
        const std::string_view bytes = reach.bytes().substr(0, start + kLongestField + next.size());
        Position behind;
        for (std::size_t end = bytes.find(next, searched);; end = bytes.find(next, end + 1)) {
            if (end == std::string_view::npos) {
                return false;
            }
            match.fields.at(slot) = bytes.substr(start, end - start);
            match.fieldCount = slot + 1;
            behind = {position.piece, end};
            if (matchUpToText(pattern, reach, behind, match)) {
                break;
            }
        }
        position = behind;
    }
    match.length = position.at;
    return true;
}

// Matches the pieces at `position` and moves it behind them: to the start of the next text field that a piece
// follows, or to the end of the text.
bool TextMatcher::matchUpToText(const Pattern& pattern, Reach& reach, Position& position, TextMatch& match) {
    auto& [piece, at] = position;
    while (piece < pattern.pieces.size()) {
        const auto& [literal, field] = pattern.pieces[piece];
        if (!reach.bytes().substr(at).starts_with(literal)) {
            return false;
        }
        at += literal.size();
        ++piece;
        if (field == Field::Text && piece < pattern.pieces.size()) {
            return true;
        }
        if (field != Field::None) {
            const std::size_t end = fieldEnd(pattern, field, reach, at);
            if (end == std::string_view::npos) {
                return false;
            }
            match.fields.at(match.fieldCount++) = reach.bytes().substr(at, end - at);
            at = end;
        }
    }
    const std::string_view bytes = reach.bytes();
    return !pattern.endsLine || at == bytes.size() || bytes[at] == '\n';
}

// The end of the field at `at`, which is no text field that a piece follows; npos when there is no such
// field.
std::size_t TextMatcher::fieldEnd(const Pattern& pattern, Field field, Reach& reach, std::size_t at) {
    const std::size_t searched = field == Field::Text ? reach.behindForeign(at) : at;
    const std::string_view bytes = reach.bytes();
    std::size_t end = at;
    switch (field) {
    case Field::Text:
        end = pattern.endsLine ? findLineEnd(bytes, searched) : findFollower(pattern.text, bytes, searched);
        return end - at <= kLongestField ? end : std::string_view::npos;
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
    return end > at ? end : std::string_view::npos;
}

} // namespace view
