#include "foundation/zeb_string.hpp"

#include <map>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "foundation/exceptions.hpp"
#include "tests/foundation/failing_calls.hpp"
#include "tests/support/fatal.hpp"
#include "tests/support/thrown.hpp"

namespace {

const std::string kNoText = "Assertion [ mString != 0 ] failed\n";

TEST(ZebString, HoldsACopyOfItsText) {
    char text[] = "sda";
    const ZebString string(text);
    text[2] = 'b';
    EXPECT_STREQ(string.c_str(), "sda");
    EXPECT_EQ(string.size(), 3U);
    EXPECT_FALSE(string.empty());
}

TEST(ZebString, MayHoldAnEmptyText) {
    const ZebString string("");
    EXPECT_STREQ(string.c_str(), "");
    EXPECT_EQ(string.size(), 0U);
    EXPECT_TRUE(string.empty());
}

TEST(ZebString, IsFatalToUseWithoutAText) {
    ZebString none;
    const ZebString some("text");
    EXPECT_FATAL(none.c_str(), kNoText);
    EXPECT_FATAL(none.size(), kNoText);
    EXPECT_FATAL(static_cast<void>(none.empty()), kNoText);
    EXPECT_FATAL(none.clear(), kNoText);
    EXPECT_FATAL(none.find("t"), kNoText);
    EXPECT_FATAL(none.find_first_of('t'), kNoText);
    EXPECT_FATAL(none.find_last_not_of("t"), kNoText);
    EXPECT_FATAL(none.substr(0, 1), kNoText);
    EXPECT_FATAL(static_cast<void>(none == "text"), kNoText);
    EXPECT_FATAL(static_cast<void>(none == some), kNoText);
    EXPECT_FATAL(static_cast<void>(none != some), kNoText);
    EXPECT_FATAL(static_cast<void>(none < some), kNoText);
    EXPECT_FATAL(none += some, kNoText);
    EXPECT_FATAL(none += "text", kNoText);
}

TEST(ZebString, IsFatalToPassWithoutAText) {
    ZebString some("text");
    const ZebString none;
    EXPECT_FATAL(static_cast<void>(some == none), "Assertion [ acrString.mString != 0 ] failed\n");
    EXPECT_FATAL(static_cast<void>(some != none), kNoText);
    EXPECT_FATAL(static_cast<void>(some < none), "Assertion [ 0 != mPointer ] failed\n");
    EXPECT_FATAL(some += none, "Assertion [ acrString.mString != 0 ] failed\n");
}

TEST(ZebString, IsFatalToPassANullText) {
    ZebString some("text");
    const char* const null = nullptr;
    EXPECT_FATAL(static_cast<void>(some == null), "Assertion [ 0 != acpString ] failed\n");
    EXPECT_FATAL(some += null, "Assertion [ acpString != 0 ] failed\n");
}

TEST(ZebString, ChecksItsOwnTextBeforeThatOfTheOther) {
    ZebString none;
    const ZebString other;
    const char* const null = nullptr;
    EXPECT_FATAL(static_cast<void>(none == other), kNoText);
    EXPECT_FATAL(static_cast<void>(none == null), kNoText);
    EXPECT_FATAL(none += other, kNoText);
    EXPECT_FATAL(none += null, kNoText);
}

TEST(ZebString, IsFatalToCopyWithoutAText) {
    const ZebString none;
    EXPECT_FATAL(ZebString{none}, "Assertion [ acrCopy.mString != 0 ] failed\n");
}

TEST(ZebString, IsFatalToAssignFromWithoutAText) {
    const ZebString none;
    ZebString some("text");
    EXPECT_FATAL(some = none, "Assertion [ 0 != mPointer ] failed\n");
}

TEST(ZebString, TakesAnAssignmentWithoutAText) {
    ZebString string;
    string = ZebString("text");
    EXPECT_STREQ(string.c_str(), "text");
}

TEST(ZebString, IsUnchangedByAssignmentToItself) {
    ZebString string("text");
    const ZebString& self = string;
    const char* const before = string.c_str();
    string = self;
    EXPECT_EQ(string.c_str(), before);
    EXPECT_STREQ(string.c_str(), "text");
}

TEST(ZebString, AcceptsAssignmentToItselfWithoutAText) {
    ZebString string;
    const ZebString& self = string;
    string = self;
    EXPECT_FATAL(string.size(), kNoText);
}

TEST(ZebString, KeepsTheSourceOfAnAssignmentApart) {
    const ZebString source("text");
    ZebString target("old");
    target = source;
    target += " and more";
    EXPECT_STREQ(target.c_str(), "text and more");
    EXPECT_STREQ(source.c_str(), "text");
}

TEST(ZebString, KeepsTheSourceOfACopyApart) {
    const ZebString source("text");
    ZebString copy(source);
    copy.clear();
    EXPECT_TRUE(copy.empty());
    EXPECT_STREQ(source.c_str(), "text");
}

TEST(ZebString, ComparesForEquality) {
    const ZebString string("sda");
    EXPECT_TRUE(string == "sda");
    EXPECT_FALSE(string == "sdb");
    EXPECT_TRUE(string == ZebString("sda"));
    EXPECT_FALSE(string == ZebString("SDA"));
    EXPECT_FALSE(string != ZebString("sda"));
    EXPECT_TRUE(string != ZebString("sda1"));
}

TEST(ZebString, OrdersUpperCaseBeforeLowerCase) {
    EXPECT_TRUE(ZebString("Z") < ZebString("a"));
    EXPECT_FALSE(ZebString("a") < ZebString("Z"));
    EXPECT_TRUE(ZebString("SDA") < ZebString("sda"));
}

TEST(ZebString, OrdersByteByByte) {
    EXPECT_TRUE(ZebString("sda") < ZebString("sda1"));
    EXPECT_TRUE(ZebString("sda10") < ZebString("sda2"));
    EXPECT_TRUE(ZebString("z") < ZebString("\x80")); // bytes are unsigned
    EXPECT_FALSE(ZebString("sda") < ZebString("sda"));
}

TEST(ZebString, OrdersTheKeysOfAMap) {
    const std::map<ZebString, int> map = {{"b", 1}, {"a", 2}, {"B", 3}};
    std::vector<std::string> keys;
    for (const auto& [key, value] : map) {
        keys.emplace_back(key.c_str());
    }
    EXPECT_EQ(keys, (std::vector<std::string>{"B", "a", "b"}));
}

TEST(ZebString, Appends) {
    ZebString string("iqn");
    const ZebString part(".2001");
    ((string += part) += "-04") += "";
    EXPECT_STREQ(string.c_str(), "iqn.2001-04");
}

TEST(ZebString, AppendsItself) {
    ZebString string("ab");
    string += string;
    EXPECT_STREQ(string.c_str(), "abab");
}

TEST(ZebString, Finds) {
    const ZebString string("sd sda sd");
    EXPECT_EQ(string.find("sd", 0), 0U);
    EXPECT_EQ(string.find("sd", 1), 3U);
    EXPECT_EQ(string.find("sdx", 0), ZebString::npos);
    EXPECT_EQ(string.find("sd", 100), ZebString::npos);
    EXPECT_EQ(string.find_first_of('d', 0), 1U);
    EXPECT_EQ(string.find_first_of('d', 2), 4U);
    EXPECT_EQ(string.find_first_of('x', 0), ZebString::npos);
}

TEST(ZebString, FindsTheLastCharacterOutsideASet) {
    EXPECT_EQ(ZebString("text \n ").find_last_not_of(" \n"), 3U);
    EXPECT_EQ(ZebString(" \n").find_last_not_of(" \n"), ZebString::npos);
    EXPECT_EQ(ZebString("").find_last_not_of(" "), ZebString::npos);
}

TEST(ZebString, HasTheStandardLibrarysNpos) {
    EXPECT_EQ(ZebString::npos, std::string::npos);
}

TEST(ZebString, CutsOutAPart) {
    const ZebString string("powerpath");
    EXPECT_STREQ(string.substr(0, 5).c_str(), "power");
    EXPECT_STREQ(string.substr(5, 100).c_str(), "path");
    EXPECT_STREQ(string.substr(5, ZebString::npos).c_str(), "path");
    EXPECT_STREQ(string.c_str(), "powerpath");
}

TEST(ZebString, CutsOutNothingAtItsEnd) {
    const ZebString string("text");
    EXPECT_STREQ(string.substr(string.size(), 5).c_str(), "");
}

TEST(ZebString, IsFatalToCutBehindItsEnd) {
    const ZebString string("text");
    EXPECT_FATAL(string.substr(string.size() + 1, 1), "Assertion [ pos <= mString->size() ] failed\n");
}

TEST(ZebString, ThrowsNoMemoryExWhereverItNeedsATextOfItsOwn) {
    const ZebString source("text");
    ZebString target("old");
    const ScopedFailures failures({.nothrowNews = 0});
    EXPECT_EQ(messageOf<NoMemoryEx>([] { const ZebString string("text"); }), "No Memory\n");
    EXPECT_EQ(messageOf<NoMemoryEx>([&] { const ZebString copy(source); }), "No Memory\n");
    EXPECT_EQ(messageOf<NoMemoryEx>([&] { target = source; }), "No Memory\n");
    EXPECT_EQ(messageOf<NoMemoryEx>([&] { source.substr(0, 1); }), "No Memory\n");
    EXPECT_STREQ(target.c_str(), "old");
}

} // namespace
