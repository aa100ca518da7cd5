#include "foundation/map.hpp"

#include <iterator>
#include <new>
#include <stdexcept>

#include <gtest/gtest.h>

#include "foundation/counted_pointer.hpp"
#include "foundation/exceptions.hpp"
#include "foundation/zeb_string.hpp"
#include "tests/support/log_capture.hpp"
#include "tests/support/thrown.hpp"

namespace {

using Strings = ZebStringMap<ZebString>;
using Pointers = ZebStringMap<ZebCountedPointer<int>>;
using TwoLevels = ZebTwoLevelMap<ZebString>;

// A value that there is no memory to copy.
struct Uncopyable {
    Uncopyable() = default;
    Uncopyable(const Uncopyable& /*other*/) { throw std::bad_alloc(); }
    Uncopyable& operator=(const Uncopyable&) = delete;
    ~Uncopyable() = default;
};

struct Stubborn {
    Stubborn() = default;
    Stubborn(const Stubborn& /*other*/) { throw std::runtime_error("stubborn"); }
    Stubborn& operator=(const Stubborn&) = delete;
    ~Stubborn() = default;
};

TEST(StringMap, FindsWhatWasInserted) {
    const LogCapture log;
    Strings::Map map;
    Strings::insert(map, "key", "value");
    EXPECT_STREQ(Strings::lookup(map, "key").c_str(), "value");
    EXPECT_TRUE(Strings::contains(map, "key"));
    EXPECT_EQ(log.exactText(), "");
}

TEST(StringMap, KeepsTheFirstValueOfAKeyInsertedTwice) {
    const LogCapture log;
    Strings::Map map;
    Strings::insert(map, "key", "first");
    EXPECT_EQ(messageOf<ExistsEx>([&] { Strings::insert(map, "key", "second"); }),
              "Element already exists in map.. can't insert\n");
    EXPECT_EQ(log.exactText(), "Element already existed in the map\n");
    EXPECT_EQ(map.size(), 1U);
    EXPECT_STREQ(Strings::lookup(map, "key").c_str(), "first");
}

TEST(StringMap, TellsTheCaseOfKeysApart) {
    const LogCapture log;
    Strings::Map map;
    Strings::insert(map, "KEY", "value");
    EXPECT_EQ(messageOf<NotFoundEx>([&] { Strings::lookup(map, "key"); }),
              "No element for the key exists in map\n");
    EXPECT_EQ(log.exactText(), "Element does not exist in the map\n");
    EXPECT_FALSE(Strings::contains(map, "key"));
    EXPECT_TRUE(Strings::contains(map, "KEY"));
}

TEST(StringMap, IsUnchangedByAFailedLookup) {
    const LogCapture log;
    Strings::Map map;
    EXPECT_EQ(messageOf<NotFoundEx>([&] { Strings::lookup(map, "key"); }),
              "No element for the key exists in map\n");
    EXPECT_TRUE(map.empty());
}

TEST(StringMap, LogsNothingWhenAskedWhatItContains) {
    const LogCapture log;
    const Strings::Map map;
    EXPECT_FALSE(Strings::contains(map, "key"));
    EXPECT_EQ(log.exactText(), "");
}

TEST(StringMap, GivesAReferenceToTheStoredValue) {
    Strings::Map map;
    Strings::insert(map, "key", "value");
    Strings::lookup(map, "key") += " and more";
    EXPECT_STREQ(Strings::lookup(map, "key").c_str(), "value and more");
}

TEST(StringMap, HoldsDeepCopiesOfStrings) {
    Strings::Map map;
    ZebString key("key");
    ZebString value("value");
    Strings::insert(map, key, value);
    key += "2";
    value += "2";
    EXPECT_STREQ(Strings::lookup(map, "key").c_str(), "value");
}

TEST(StringMap, SharesTheObjectsOfCountedPointers) {
    Pointers::Map map;
    ZebCountedPointer<int> pointer;
    pointer.create(new int(5), ZebPST_Individual, ZebPAT_New);
    Pointers::insert(map, "key", pointer);
    EXPECT_EQ(Pointers::lookup(map, "key").get(), pointer.get());
    pointer.release();
    EXPECT_EQ(*Pointers::lookup(map, "key"), 5);
}

TEST(StringMap, ThrowsNoMemoryExWhenMemoryRunsOut) {
    const LogCapture log;
    using Map = ZebStringMap<Uncopyable>;
    Map::Map map;
    EXPECT_EQ(messageOf<NoMemoryEx>([&] { Map::insert(map, "key", Uncopyable()); }), "No Memory\n");
    EXPECT_TRUE(map.empty());
    EXPECT_EQ(log.exactText(), "");
}

TEST(StringMap, PassesOtherExceptionsThrough) {
    using Map = ZebStringMap<Stubborn>;
    Map::Map map;
    EXPECT_EQ(messageOf<std::runtime_error>([&] { Map::insert(map, "key", Stubborn()); }), "stubborn");
    EXPECT_TRUE(map.empty());
}

TEST(TwoLevelMap, FindsWhatWasInserted) {
    const LogCapture log;
    TwoLevels::Map map;
    TwoLevels::insert(map, 1, "key", "value");
    TwoLevels::insert(map, 0xffffffff, "key", "other");
    EXPECT_STREQ(TwoLevels::lookup(map, 1, "key").c_str(), "value");
    EXPECT_STREQ(TwoLevels::lookup(map, 0xffffffff, "key").c_str(), "other");
    EXPECT_EQ(log.exactText(), "");
}

TEST(TwoLevelMap, KeepsTheInnerMapOfAnOuterKeyItHas) {
    TwoLevels::Map map;
    TwoLevels::insert(map, 1, "first", "1");
    TwoLevels::insert(map, 1, "second", "2");
    EXPECT_EQ(map.size(), 1U);
    EXPECT_STREQ(TwoLevels::lookup(map, 1, "first").c_str(), "1");
    EXPECT_STREQ(TwoLevels::lookup(map, 1, "second").c_str(), "2");
}

TEST(TwoLevelMap, KeepsTheFirstValueWithoutAWord) {
    const LogCapture log;
    TwoLevels::Map map;
    TwoLevels::insert(map, 1, "key", "first");
    TwoLevels::insert(map, 1, "key", "second");
    EXPECT_STREQ(TwoLevels::lookup(map, 1, "key").c_str(), "first");
    EXPECT_EQ(log.exactText(), "");
}

TEST(TwoLevelMap, GivesAReferenceToTheStoredValue) {
    TwoLevels::Map map;
    TwoLevels::insert(map, 1, "key", "value");
    TwoLevels::lookup(map, 1, "key") += " and more";
    EXPECT_STREQ(TwoLevels::lookup(map, 1, "key").c_str(), "value and more");
}

TEST(TwoLevelMap, MissesAnOuterKeyWithThePlainTexts) {
    const LogCapture log;
    TwoLevels::Map map;
    TwoLevels::insert(map, 1, "key", "value");
    EXPECT_EQ(messageOf<ZebNotFoundEx>([&] { TwoLevels::lookup(map, 2, "key"); }),
              "No element for the key exists in map");
    EXPECT_EQ(log.exactText(), "Element does not exist in the map");
    EXPECT_EQ(map.size(), 1U);
}

TEST(TwoLevelMap, MissesAnInnerKeyWithTheNumberedTexts) {
    const LogCapture log;
    TwoLevels::Map map;
    TwoLevels::insert(map, 1, "key", "value");
    EXPECT_EQ(messageOf<ZebNotFoundEx>([&] { TwoLevels::lookup(map, 1, "KEY"); }),
              "No element for the key exists in map2");
    EXPECT_EQ(log.exactText(), "Element does not exist in the map2");
    EXPECT_EQ(map.at(1).size(), 1U);
}

TEST(TwoLevelMap, TellsWhatItContainsWithoutAWord) {
    const LogCapture log;
    TwoLevels::Map map;
    TwoLevels::insert(map, 1, "key", "value");
    EXPECT_TRUE(TwoLevels::contains(map, 1, "key"));
    EXPECT_FALSE(TwoLevels::contains(map, 1, "KEY"));
    EXPECT_FALSE(TwoLevels::contains(map, 2, "key"));
    EXPECT_EQ(log.exactText(), "");
}

TEST(TwoLevelMap, ReportsAFailedAllocationAsZebNotFoundExAndIsUnchanged) {
    const LogCapture log;
    using Map = ZebTwoLevelMap<Uncopyable>;
    Map::Map map;
    map[1]; // an outer key it has; 2 is one it has not
    EXPECT_EQ(messageOf<ZebNotFoundEx>([&] { Map::insert(map, 1, "key", Uncopyable()); }), "No Memory");
    EXPECT_EQ(messageOf<ZebNotFoundEx>([&] { Map::insert(map, 2, "key", Uncopyable()); }), "No Memory");
    EXPECT_EQ(map.size(), 1U);
    EXPECT_TRUE(map.at(1).empty());
    EXPECT_EQ(log.exactText(), "");
}

TEST(TwoLevelMap, PassesOtherExceptionsThrough) {
    using Map = ZebTwoLevelMap<Stubborn>;
    Map::Map map;
    EXPECT_EQ(messageOf<std::runtime_error>([&] { Map::insert(map, 1, "key", Stubborn()); }), "stubborn");
    EXPECT_TRUE(map.empty());
}

} // namespace
