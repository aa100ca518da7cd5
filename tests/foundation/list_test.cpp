#include "foundation/list.hpp"

#include <new>

#include <gtest/gtest.h>

#include "foundation/counted_pointer.hpp"
#include "foundation/exceptions.hpp"
#include "foundation/zeb_string.hpp"
#include "tests/support/log_capture.hpp"
#include "tests/support/thrown.hpp"

namespace {

using Strings = ZebList<ZebString>;
using Pointers = ZebList<ZebCountedPointer<int>>;

// An element that there is no memory to copy.
struct Uncopyable {
    Uncopyable() = default;
    Uncopyable(const Uncopyable& /*other*/) { throw std::bad_alloc(); }
    Uncopyable& operator=(const Uncopyable&) = delete;
    ~Uncopyable() = default;
};

TEST(List, GivesAndRemovesItsOnlyElementAndThenHasNoneToRemove) {
    const LogCapture log;
    Strings::List list;
    Strings::push_back(list, "element");
    EXPECT_STREQ(Strings::front(list).c_str(), "element");
    Strings::pop_front(list);
    EXPECT_TRUE(list.empty());
    EXPECT_EQ(messageOf<NotFoundEx>([&] { Strings::pop_front(list); }), "Element Not Found\n");
    EXPECT_EQ(log.exactText(), "");
}

TEST(List, HasNoFirstElementWhileEmpty) {
    const LogCapture log;
    Strings::List list;
    EXPECT_EQ(messageOf<NotFoundEx>([&] { Strings::front(list); }), "Element not found\n");
    EXPECT_EQ(log.exactText(), "");
}

TEST(List, AppendsAtTheEnd) {
    Strings::List list;
    Strings::push_back(list, "first");
    Strings::push_back(list, "second");
    EXPECT_STREQ(Strings::front(list).c_str(), "first");
    Strings::pop_front(list);
    EXPECT_STREQ(Strings::front(list).c_str(), "second");
}

TEST(List, GivesAReferenceToItsFirstElement) {
    Strings::List list;
    Strings::push_back(list, "first");
    Strings::front(list) += " and more";
    EXPECT_STREQ(Strings::front(list).c_str(), "first and more");
}

TEST(List, HoldsDeepCopiesOfStrings) {
    Strings::List list;
    ZebString element("element");
    Strings::push_back(list, element);
    element += "2";
    EXPECT_STREQ(Strings::front(list).c_str(), "element");
}

TEST(List, SharesTheObjectsOfCountedPointers) {
    Pointers::List list;
    ZebCountedPointer<int> pointer;
    pointer.create(new int(5), ZebPST_Individual, ZebPAT_New);
    Pointers::push_back(list, pointer);
    EXPECT_EQ(Pointers::front(list).get(), pointer.get());
    Pointers::pop_front(list);
    EXPECT_EQ(*pointer, 5);
}

TEST(List, ThrowsNoMemoryExWhenMemoryRunsOut) {
    ZebList<Uncopyable>::List list;
    EXPECT_EQ(messageOf<NoMemoryEx>([&] { ZebList<Uncopyable>::push_back(list, Uncopyable()); }),
              "No Memory\n");
    EXPECT_TRUE(list.empty());
}

} // namespace
