#include "view/model/check.hpp"

#include <string>
#include <vector>

#include <gtest/gtest.h>

namespace {

// Those of the counts 0 to 6 that a range takes for an alarm.
std::string alarms(const std::string& text) {
    const auto range = view::countRange(text);
    std::string counts;
    for (std::uint64_t count = 0; range && count <= 6; ++count) {
        counts += range->isAlarm(count) ? std::to_string(count) : "";
    }
    return range ? counts : "no range";
}

TEST(CountRange, HoldsTheCountsThatAreNoAlarm) {
    EXPECT_EQ(alarms("0"), "123456");
    EXPECT_EQ(alarms("3"), "456");
    EXPECT_EQ(alarms("2:"), "01");
    EXPECT_EQ(alarms("~:3"), "456");
    EXPECT_EQ(alarms("2:4"), "0156");
    EXPECT_EQ(alarms("4:4"), "012356");
    EXPECT_EQ(alarms("~:"), "");
}

TEST(CountRange, IsTheOtherWayRoundBehindAnAt) {
    EXPECT_EQ(alarms("@3"), "0123");
    EXPECT_EQ(alarms("@2:"), "23456");
    EXPECT_EQ(alarms("@2:4"), "234");
}

TEST(CountRange, KeepsItsText) {
    EXPECT_EQ(view::countRange("@~:4")->text, "@~:4");
}

TEST(CountRange, OfAnythingElseIsNone) {
    for (const char* text : {"", "@", ":", ":3", "x", "3x", "3:x", "4:3", "-1", "1.5", " 1", "1 ", "~", "~3",
                             "@@1", "1:2:3", "18446744073709551616"}) {
        EXPECT_EQ(alarms(text), "no range") << text;
    }
    EXPECT_EQ(alarms(std::string("1\0", 2)), "no range");
}

TEST(CheckLimits, UnlessGivenWarnOfAnyLostPathAndAreCriticalOfNone) {
    const view::CheckLimits limits;
    EXPECT_FALSE(limits.warning.isAlarm(0));
    EXPECT_TRUE(limits.warning.isAlarm(1));
    EXPECT_FALSE(limits.critical.isAlarm(1000));
}

} // namespace
