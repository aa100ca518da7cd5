#include "view/show/escape.hpp"

#include <string>

#include <gtest/gtest.h>

namespace {

using view::printable;

// A character in UTF-8, or what its code would be in UTF-8 if it were one.
std::string encoded(char32_t code) {
    const auto tail = [](char32_t bits) { return static_cast<char>(0x80 | (bits & 0x3f)); };
    if (code < 0x80) {
        return {static_cast<char>(code)};
    }
    if (code < 0x800) {
        return {static_cast<char>(0xc0 | (code >> 6)), tail(code)};
    }
    if (code < 0x10000) {
        return {static_cast<char>(0xe0 | (code >> 12)), tail(code >> 6), tail(code)};
    }
    return {static_cast<char>(0xf0 | (code >> 18)), tail(code >> 12), tail(code >> 6), tail(code)};
}

// The text with every byte as \xHH.
std::string escaped(const std::string& bytes) {
    static constexpr char kDigits[] = "0123456789ABCDEF";
    std::string text;
    for (const char c : bytes) {
        const auto byte = static_cast<unsigned char>(c);
        text += std::string("\\x") + kDigits[byte / 16] + kDigits[byte % 16];
    }
    return text;
}

TEST(Escape, LeavesPlainTextAsItIs) {
    EXPECT_EQ(printable(""), "");
    EXPECT_EQ(printable(" /dev/sda \"'<>&~"), " /dev/sda \"'<>&~");
}

TEST(Escape, DoublesABackslashSoThatNoTextLooksEscaped) {
    EXPECT_EQ(printable("\\x1B"), "\\\\x1B");
}

TEST(Escape, LeavesTheFirstAndLastCharactersOfEachLengthOfUtf8) {
    for (const char32_t code :
         {U'\u00a0', U'\u07ff', U'\u0800', U'\ud7ff', U'\ue000', U'\uffff', U'\U00010000', U'\U0010ffff'}) {
        EXPECT_EQ(printable(encoded(code)), encoded(code)) << static_cast<unsigned>(code);
    }
}

TEST(Escape, EscapesEveryControlCharacter) {
    for (char32_t code = 0; code < 0xa0; ++code) {
        if (code < 0x20 || code >= 0x7f) {
            EXPECT_EQ(printable(encoded(code)), escaped(encoded(code))) << static_cast<unsigned>(code);
        }
    }
}

TEST(Escape, EscapesWhatTurnsOrBreaksTheWriting) {
    for (const char32_t code : {U'\u061c', U'\u200e', U'\u200f', U'\u2028', U'\u2029', U'\u202a', U'\u202e',
                                U'\u2066', U'\u2069', U'\ufeff'}) {
        EXPECT_EQ(printable(encoded(code)), escaped(encoded(code))) << static_cast<unsigned>(code);
    }
    for (const char32_t code : {U'\u200d', U'\u2010', U'\u2027', U'\u202f', U'\u2065', U'\u206a'}) {
        EXPECT_EQ(printable(encoded(code)), encoded(code)) << static_cast<unsigned>(code);
    }
}

TEST(Escape, EscapesBytesThatAreNoUtf8) {
    for (const std::string bytes : {
             "\x80", "\xbf\xbf",     // nothing that they would go on with
             "\xc0\xaf", "\xc1\xbf", // longer than needed
             "\xe0\x9f\xbf", "\xf0\x8f\xbf\xbf", "\xed\xa0\x80", "\xed\xbf\xbf", // surrogates
             "\xf4\x90\x80\x80",                                                 // beyond the last character
             "\xf8\x88\x80\x80\x80", "\xfe", "\xff", "\xc3", "\xe2\x82", "\xf0\x9f\x98", // cut short
         }) {
        EXPECT_EQ(printable(bytes), escaped(bytes));
    }
}

TEST(Escape, TakesUpAgainRightBehindABrokenCharacter) {
    EXPECT_EQ(printable("\xe2\x82"
                        "A\xe2\x82\xac"),
              "\\xE2\\x82A\xe2\x82\xac");
    EXPECT_EQ(printable("\xc3\xc3\xa9"), "\\xC3\xc3\xa9");
}

TEST(Escape, KeepsBytesBehindANul) {
    EXPECT_EQ(printable(std::string("a\0b", 3)), "a\\x00b");
}

} // namespace
