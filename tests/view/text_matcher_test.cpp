#include "view/read/text_matcher.hpp"

#include <string>
#include <string_view>
#include <vector>

#include <gtest/gtest.h>

#include "view/read/foreign_texts.hpp"

namespace {

using view::KnownText;
using view::MatchResult;
using view::Text;
using view::TextMatch;
using view::TextMatcher;

// What a match found: the bytes of the text in front, then its fields.
using Found = std::vector<std::string>;

const Found kNone = {"none"};
const Found kUnending = {"unending"};

Found match(const std::vector<KnownText>& texts, std::string_view bytes) {
    TextMatch found;
    switch (TextMatcher(texts).match(bytes, bytes.size(), {}, found)) {
    case MatchResult::None:
        return kNone;
    case MatchResult::Unending:
        return kUnending;
    default:
        break;
    }
    Found parts = {std::string(bytes.substr(0, found.length))};
    for (std::size_t i = 0; i < found.fieldCount; ++i) {
        parts.emplace_back(found.fields.at(i));
    }
    return parts;
}

Found match(std::string_view format, std::string_view bytes) {
    return match({KnownText{Text::Progress, format}}, bytes);
}

// A text that a format writes.
std::string sample(std::string_view format) {
    std::string text;
    while (!format.empty()) {
        const std::size_t percent = std::min(format.find('%'), format.size());
        text += format.substr(0, percent);
        format.remove_prefix(percent);
        if (!format.empty()) {
            const std::size_t conversion = format.find_first_of("sduxfp");
            text += format[conversion] == 's' ? "ACME 9" : format[conversion] == 'p' ? "0x7f" : "12";
            format.remove_prefix(conversion + 1);
        }
    }
    return text.ends_with('\n') ? text.substr(0, text.size() - 1) : text;
}

TEST(TextMatcher, RecognisesEachKnownTextAsWhatItIs) {
    const TextMatcher matcher(view::knownTexts());
    for (const KnownText& known : view::knownTexts()) {
        const std::string text = sample(known.format);
        TextMatch found;
        ASSERT_EQ(matcher.match(text, text.size(), {}, found), MatchResult::Found) << text;
        EXPECT_EQ(found.text, known.text) << text;
        EXPECT_EQ(found.length, text.size()) << text;
    }
}

TEST(TextMatcher, ReadsEachKindOfField) {
    EXPECT_EQ(match("a%d b%u c%x d%lx\n", "a-5 b7 cff d0fe"),
              (Found{"a-5 b7 cff d0fe", "-5", "7", "ff", "0fe"}));
    EXPECT_EQ(match("a%.2f b%.64s\n", "a1.50 bx y"), (Found{"a1.50 bx y", "1.50", "x y"}));
    EXPECT_EQ(match("a%p b%p\n", "a0x7f b(nil)"), (Found{"a0x7f b(nil)", "0x7f", "(nil)"}));
}

TEST(TextMatcher, WantsAtLeastOneDigitInANumber) {
    EXPECT_EQ(match("a%d\n", "a"), kNone);
    EXPECT_EQ(match("a%x b\n", "a b"), kNone);
    EXPECT_EQ(match("a%p\n", "a7f"), kNone);
}

TEST(TextMatcher, FindsNothingWhereNoTextBegins) {
    EXPECT_EQ(match("ab\n", ""), kNone);
    EXPECT_EQ(match("ab\n", "a"), kNone);
    EXPECT_EQ(match("ab\n", "xab"), kNone);
}

TEST(TextMatcher, WantsATextWithALineEndToEndTheLine) {
    EXPECT_EQ(match("ab\n", "ab"), Found{"ab"});
    EXPECT_EQ(match("ab\n", "abc"), kNone);
    EXPECT_EQ(match("ab", "abc"), Found{"ab"});
}

TEST(TextMatcher, LetsATextFieldBeEmpty) {
    EXPECT_EQ(match("a %s b %s\n", "a  b "), (Found{"a  b ", "", ""}));
}

TEST(TextMatcher, EndsATextFieldAtTheFirstPlaceWhereTheRestFits) {
    EXPECT_EQ(match("id %s size = %u\n", "id a size = b size = 3 size = 4"),
              (Found{"id a size = b size = 3 size = 4", "a size = b size = 3", "4"}));
    EXPECT_EQ(match("[%s] to [%s]", "[a] to [b] to [c]"), (Found{"[a] to [b]", "a", "b"}));
    EXPECT_EQ(match("[%s] %u [%s]\n", "[a] x] 5 [b] c]"), (Found{"[a] x] 5 [b] c]", "a] x", "5", "b] c"}));
}

TEST(TextMatcher, TakesTextFieldsOfAtMost4096Bytes) {
    const std::string longest(4096, 'x');
    EXPECT_EQ(match("a %s b", "a " + longest + " b"), (Found{"a " + longest + " b", longest}));
    EXPECT_EQ(match("a %s b", "a " + longest + "x b"), kNone);
    EXPECT_EQ(match("a %s\n", "a " + longest), (Found{"a " + longest, longest}));
    EXPECT_EQ(match("a %s\n", "a " + longest + "x"), kNone);
    EXPECT_EQ(match("a %s", "a " + longest + "Line: "), (Found{"a " + longest, longest}));
    EXPECT_EQ(match("a %s", "a " + longest + "xLine: "), kNone);
}

TEST(TextMatcher, PrefersTheLongerOpening) {
    const std::vector<KnownText> texts = {{Text::Progress, "path %s"}, {Text::Progress, "path /sys"}};
    EXPECT_EQ(match(texts, "path /sysLine: "), Found{"path /sys"});
    EXPECT_EQ(match(texts, "path /syLine: "), (Found{"path /sy", "/sy"}));
}

TEST(TextMatcher, PrefersTheTextWithALineEnd) {
    const std::vector<KnownText> texts = {{Text::Progress, "bad"}, {Text::RunEnd, "bad\n"}};
    TextMatch found;
    EXPECT_EQ(TextMatcher(texts).match("bad", 3, {}, found), MatchResult::Found);
    EXPECT_EQ(found.text, Text::RunEnd);
    EXPECT_EQ(TextMatcher(texts).match("badly", 5, {}, found), MatchResult::Found);
    EXPECT_EQ(found.text, Text::Progress);
}

TEST(TextMatcher, EndsALastFieldWithoutALineEndBeforeWhatFollows) {
    for (const std::string follower : {"Entered Function f Line 1", "Left Function f Line 1", "Line: x",
                                       "End of popened Buffer", "Incomplete line: x", "\nx"}) {
        EXPECT_EQ(match("Line: %s", "Line: LEI " + follower), (Found{"Line: LEI ", "LEI "}));
    }
    EXPECT_EQ(match("Line: %s", "Line: LEI"), (Found{"Line: LEI", "LEI"}));
}

TEST(TextMatcher, EndsAPowerPathEntryBeforeTheNext) {
    const std::vector<KnownText> texts = {{Text::PowerPathEntry, "               %s %s"}};
    EXPECT_EQ(match(texts, "               6006 emcpowera               6007 emcpowerb"),
              (Found{"               6006 emcpowera", "6006", "emcpowera"}));
}

TEST(TextMatcher, TellsThatATextMayGoOnInTheNextLine) {
    EXPECT_EQ(match("Name of %s is\n", "Name of a"), kUnending);
    EXPECT_EQ(match("Name of %s is\n", "Name of a is not"), kUnending);
    EXPECT_EQ(match("Name of %s\n", "Name o"), kNone);
}

TEST(TextMatcher, DoesNotExpectARestBehindACommonOpening) {
    EXPECT_EQ(match("1234567%s is\n", "1234567a"), kNone);
    EXPECT_EQ(match("12345678%s is\n", "12345678a"), kUnending);
}

TEST(TextMatcher, FollowsAFieldOverLineEndsToTheEndOfALine) {
    EXPECT_EQ(match("Name of %s is\n", "Name of a\nb is\nmore is"), (Found{"Name of a\nb is", "a\nb"}));
    EXPECT_EQ(match("Name of %s is %s\n", "Name of a\nb is c\nmore"),
              (Found{"Name of a\nb is c", "a\nb", "c"}));
    EXPECT_EQ(match("Name of |%s| is", "Name of |a\nb| is more\n"), (Found{"Name of |a\nb| is", "a\nb"}));
    EXPECT_EQ(match("Name of %s is\n", "Name of a\nb is it\n"), kUnending);
}

} // namespace
