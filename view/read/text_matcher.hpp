#pragma once

#include <array>
#include <cstddef>
#include <span>
#include <string_view>
#include <vector>

#include "view/read/known_texts.hpp"

namespace view {

// A known text found at the start of some bytes of the log. The fields point into those bytes.
struct TextMatch {
    static constexpr std::size_t kMaximumFields = 5;

    Text text = Text::Progress;
    Section section = Section::Any;
    std::size_t length = 0; // bytes of the match, a line end not counted
    std::array<std::string_view, kMaximumFields> fields;
    std::size_t fieldCount = 0;
};

enum class MatchResult : unsigned char {
    None,     // no known text starts here
    Unending, // a text with a field of foreign bytes starts here, but its rest is missing: the field may hold
              // a line end, so the text may go on in the next line
    Cut,      // a text starts here whose field begins with a foreign text that goes on behind the bytes
    Found,
};

class ForeignTexts;

// Recognises Morvane's log texts by their printf formats.
class TextMatcher {
public:
    explicit TextMatcher(std::span<const KnownText> texts);

    // Looks for a known text at the start of `bytes`. It stands in their first `reach` bytes, which are a
    // line of the log, or several when a field may go over a line end; but a field that begins with one of
    // `foreign` holds all of it and goes on from there to the end of a line. Fills `match` when the result is
    // Found.
    MatchResult match(std::string_view bytes, std::size_t reach, const ForeignTexts& foreign,
                      TextMatch& match) const;

private:
    enum class Field : unsigned char { None, Text, Decimal, Hex, Real, Pointer };

    // A literal and the field after it.
    struct Piece {
        std::string_view literal;
        Field field;
    };

    struct Pattern {
        Text text;
        Section section;
        bool endsLine;
        bool mayRunOver; // a text field stands before a literal that must follow
        std::vector<Piece> pieces;
    };

    // How far a pattern has been matched.
    struct Position {
        std::size_t piece = 0;
        std::size_t at = 0; // in the bytes
    };

    class Reach;

    static Pattern compile(const KnownText& known);
    static Piece takePiece(std::string_view& format);
    static bool matchPattern(const Pattern& pattern, Reach& reach, TextMatch& match);
    static bool matchUpToText(const Pattern& pattern, Reach& reach, Position& position, TextMatch& match);
    static std::size_t fieldEnd(const Pattern& pattern, Field field, Reach& reach, std::size_t at);

    std::vector<std::vector<Pattern>> mPatternsByFirstByte;
};

} // namespace view
