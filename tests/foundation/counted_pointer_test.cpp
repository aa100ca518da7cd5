#include "foundation/counted_pointer.hpp"

#include <cstring>
#include <new>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "foundation/exceptions.hpp"
#include "tests/foundation/failing_calls.hpp"
#include "tests/support/fatal.hpp"
#include "tests/support/thrown.hpp"

namespace {

// Notes the end of each of its objects.
struct Probe {
    Probe() = default;
    Probe(std::vector<int>& list, int value) : endings(&list), number(value) {}
    Probe(const Probe&) = delete;
    Probe& operator=(const Probe&) = delete;
    ~Probe() {
        if (endings != nullptr) {
            endings->push_back(number);
        }
    }

    std::vector<int>* endings = nullptr;
    int number = 0;
};

struct Base {
    Base() = default;
    Base(const Base&) = delete;
    Base& operator=(const Base&) = delete;
    virtual ~Base() = default;
};

struct Derived : Base {
    explicit Derived(bool& flag) : ended(flag) {}
    Derived(const Derived&) = delete;
    Derived& operator=(const Derived&) = delete;
    ~Derived() override { ended = true; }

    bool& ended;
    std::string heapMember = std::string(100, 'x'); // lost if only the base were destroyed
};

using Endings = std::vector<int>;

ZebCountedPointer<Probe> probe(Endings& endings, int number) {
    ZebCountedPointer<Probe> pointer;
    pointer.create(new (std::nothrow) Probe(endings, number), ZebPST_Individual, ZebPAT_New);
    return pointer;
}

ZebCountedPointer<int> mallocedInts(std::size_t count, ZebPointerSizeType sizeType) {
    ZebCountedPointer<int> pointer;
    pointer.create(static_cast<int*>(std::calloc(count, sizeof(int))), sizeType, ZebPAT_Malloc);
    return pointer;
}

template <typename T>
bool allFieldsAreZero(const ZebCountedPointer<T>& pointer) {
    static_assert(sizeof pointer == 2 * sizeof(void*) + 2 * sizeof(uint32));
    const char zeros[sizeof pointer] = {};
    return std::memcmp(zeros, static_cast<const void*>(&pointer), sizeof pointer) == 0;
}

TEST(CountedPointer, IsEmptyFromTheStart) {
    const ZebCountedPointer<int> pointer;
    EXPECT_FALSE(pointer != nullptr);
    EXPECT_TRUE(allFieldsAreZero(pointer));
}

TEST(CountedPointer, IsSetOnceItOwnsAnObject) {
    Endings endings;
    const auto pointer = probe(endings, 7);
    EXPECT_TRUE(pointer != nullptr);
    EXPECT_EQ(pointer->number, 7);
}

TEST(CountedPointer, ComparesWithTheObjectsAddress) {
    Endings endings;
    auto* const object = new Probe(endings, 1);
    ZebCountedPointer<Probe> pointer;
    pointer.create(object, ZebPST_Individual, ZebPAT_New);
    EXPECT_FALSE(pointer != object);
}

TEST(CountedPointer, DestroysTheObjectOnceWithTheLastOfThreeCopies) {
    Endings endings;
    auto first = probe(endings, 1);
    auto second = first;
    auto third = second;
    second.release();
    first.release();
    EXPECT_TRUE(endings.empty());
    EXPECT_EQ(third->number, 1);
    third.release();
    EXPECT_EQ(endings, Endings{1});
}

TEST(CountedPointer, LetsGoAtTheEndOfItsLife) {
    Endings endings;
    {
        const auto first = probe(endings, 1);
        {
            // NOLINTNEXTLINE(performance-unnecessary-copy-initialization): the copy is the test
            const auto second = first;
            EXPECT_EQ(second.get(), first.get());
        }
        EXPECT_TRUE(endings.empty());
    }
    EXPECT_EQ(endings, Endings{1});
}

TEST(CountedPointer, IsEmptyAfterARelease) {
    Endings endings;
    auto first = probe(endings, 1);
    auto second = first;
    first.release();
    EXPECT_TRUE(allFieldsAreZero(first));
    second.release();
    EXPECT_TRUE(allFieldsAreZero(second));
}

TEST(CountedPointer, MayBeReleasedTwice) {
    Endings endings;
    auto pointer = probe(endings, 1);
    pointer.release();
    pointer.release();
    EXPECT_EQ(endings, Endings{1});
}

TEST(CountedPointer, CanOwnAnotherObjectAfterARelease) {
    Endings endings;
    auto pointer = probe(endings, 1);
    pointer.release();
    pointer.create(new Probe(endings, 2), ZebPST_Individual, ZebPAT_New);
    EXPECT_EQ(pointer->number, 2);
    EXPECT_EQ(endings, Endings{1});
}

TEST(CountedPointer, LetsGoOfItsObjectWhenAssignedAnother) {
    Endings endings;
    auto first = probe(endings, 1);
    auto second = probe(endings, 2);
    first = second;
    EXPECT_EQ(endings, Endings{1});
    EXPECT_EQ(first.get(), second.get());
    second.release();
    EXPECT_EQ(endings, Endings{1});
    first.release();
    EXPECT_EQ(endings, (Endings{1, 2}));
}

TEST(CountedPointer, KeepsASharedObjectWhenOneCopyIsAssignedAnother) {
    Endings endings;
    auto first = probe(endings, 1);
    const auto copy = first;
    first = probe(endings, 2);
    EXPECT_TRUE(endings.empty());
    EXPECT_EQ(copy->number, 1);
    EXPECT_EQ(first->number, 2);
}

TEST(CountedPointer, TakesAnAssignmentWhileEmpty) {
    Endings endings;
    ZebCountedPointer<Probe> pointer;
    pointer = probe(endings, 1);
    EXPECT_EQ(pointer->number, 1);
    EXPECT_TRUE(endings.empty());
}

TEST(CountedPointer, IsUnchangedByAssignmentOfACopyOfItself) {
    Endings endings;
    auto first = probe(endings, 1);
    auto second = first;
    first = second;
    EXPECT_EQ(first->number, 1);
    first.release();
    EXPECT_TRUE(endings.empty());
    second.release();
    EXPECT_EQ(endings, Endings{1});
}

TEST(CountedPointer, IsUnchangedByAssignmentToItself) {
    Endings endings;
    auto pointer = probe(endings, 1);
    const auto& self = pointer;
    pointer = self;
    EXPECT_TRUE(endings.empty());
    EXPECT_EQ(pointer->number, 1);
    pointer.release();
    EXPECT_EQ(endings, Endings{1});
}

TEST(CountedPointer, IsFatalToAssignToItselfWhileEmpty) {
    ZebCountedPointer<int> pointer;
    const auto& self = pointer;
    EXPECT_FATAL(pointer = self, "Assertion [ 0 != acrCopy.mPointer ] failed\n");
}

TEST(CountedPointer, IsFatalToCopyWhileEmpty) {
    const ZebCountedPointer<int> empty;
    EXPECT_FATAL(ZebCountedPointer<int>{empty}, "Assertion [ 0 != acrCopy.mPointer ] failed\n");
}

TEST(CountedPointer, IsFatalToAssignFromWhileEmpty) {
    const ZebCountedPointer<int> empty;
    auto pointer = mallocedInts(1, ZebPST_Individual);
    EXPECT_FATAL(pointer = empty, "Assertion [ 0 != acrCopy.mPointer ] failed\n");
}

TEST(CountedPointer, IsFatalToAccessWhileEmpty) {
    ZebCountedPointer<Probe> pointer;
    const auto& constant = pointer;
    const std::string line = "Assertion [ 0 != mPointer ] failed\n";
    EXPECT_FATAL(static_cast<void>(*pointer), line);
    EXPECT_FATAL(static_cast<void>(*constant), line);
    EXPECT_FATAL(pointer->number = 1, line);
    EXPECT_FATAL(static_cast<void>(constant->number), line);
    EXPECT_FATAL(pointer.pointer(), line);
    EXPECT_FATAL(pointer.get(), line);
}

TEST(CountedPointer, GivesTheObjectInEveryForm) {
    Endings endings;
    auto* const object = new Probe(endings, 1);
    ZebCountedPointer<Probe> pointer;
    pointer.create(object, ZebPST_Individual, ZebPAT_New);
    const auto& constant = pointer;
    EXPECT_EQ(&*pointer, object);
    EXPECT_EQ(&*constant, object);
    EXPECT_EQ(pointer.operator->(), object);
    EXPECT_EQ(constant.operator->(), object);
    EXPECT_EQ(pointer.pointer(), object);
    EXPECT_EQ(pointer.get(), object);
}

TEST(CountedPointer, IsFatalToDereferenceAsAnArray) {
    auto pointer = mallocedInts(3, ZebPST_Array);
    EXPECT_FATAL(*pointer = 1, "Assertion [ ZebPST_Individual == mSizeType ] failed\n");
}

TEST(CountedPointer, GivesTheFirstElementOfAnArrayAndEveryOtherByItsNumber) {
    auto pointer = mallocedInts(3, ZebPST_Array);
    pointer[2] = 5;
    EXPECT_EQ(pointer.pointer()[2], 5);
    EXPECT_EQ(pointer.get()[2], 5);
    EXPECT_EQ(&pointer[0], pointer.get());
}

TEST(CountedPointer, FreesAMallocedArray) {
    auto pointer = mallocedInts(3, ZebPST_Array);
    auto copy = pointer;
    pointer.release();
    copy[2] = 1;
    copy.release();
    EXPECT_TRUE(allFieldsAreZero(copy));
}

TEST(CountedPointer, FreesAMallocedObjectWithoutItsDestructor) {
    Endings endings;
    ZebCountedPointer<Probe> pointer;
    pointer.create(new (std::malloc(sizeof(Probe))) Probe(endings, 1), ZebPST_Individual, ZebPAT_Malloc);
    EXPECT_EQ(pointer->number, 1);
    pointer.release();
    EXPECT_TRUE(endings.empty());
    EXPECT_TRUE(allFieldsAreZero(pointer));
}

TEST(CountedPointer, FreesAMallocedObjectOfAnUnknownSizeType) {
    auto pointer = mallocedInts(1, static_cast<ZebPointerSizeType>(3));
    pointer.release();
    EXPECT_TRUE(allFieldsAreZero(pointer));
}

TEST(CountedPointer, DestroysTheElementsOfAnArrayFromLastToFirst) {
    Endings endings;
    auto* const array = new Probe[3];
    for (int i = 0; i < 3; ++i) {
        array[i].endings = &endings;
        array[i].number = i;
    }
    ZebCountedPointer<Probe> pointer;
    pointer.create(array, ZebPST_Array, ZebPAT_New);
    auto copy = pointer;
    pointer.release();
    EXPECT_TRUE(endings.empty());
    copy.release();
    EXPECT_EQ(endings, (Endings{2, 1, 0}));
}

TEST(CountedPointer, DestroysAPolymorphicObjectWhole) {
    bool ended = false;
    ZebCountedPointer<Base> pointer;
    pointer.create(new (std::nothrow) Derived(ended), ZebPST_Individual, ZebPAT_New);
    pointer.release();
    EXPECT_TRUE(ended);
}

TEST(CountedPointer, IsFatalToReleaseWithAnUnknownSizeType) {
    EXPECT_FATAL(
        {
            ZebCountedPointer<int> pointer;
            pointer.create(new int, static_cast<ZebPointerSizeType>(3), ZebPAT_New);
            pointer.release();
        },
        "Assertion [ false ] failed\n");
}

TEST(CountedPointer, IsFatalToReleaseWithAnUnknownAllocationType) {
    EXPECT_FATAL(
        {
            ZebCountedPointer<int> pointer;
            pointer.create(new int, ZebPST_Individual, static_cast<ZebPointerAllocationType>(3));
            pointer.release();
        },
        "Assertion [ false ] failed\n");
}

TEST(CountedPointer, IsFatalToAccessRawWithAnUnknownSizeType) {
    auto pointer = mallocedInts(1, static_cast<ZebPointerSizeType>(3));
    EXPECT_FATAL(pointer.pointer(), "Assertion [ false ] failed\n");
    EXPECT_NE(pointer.get(), nullptr);
}

TEST(CountedPointer, ThrowsNoMemoryExForANullObjectAndStaysEmpty) {
    ZebCountedPointer<int> pointer;
    EXPECT_EQ(messageOf<NoMemoryEx>([&] { pointer.create(nullptr, ZebPST_Individual, ZebPAT_New); }),
              "No Memory\n");
    EXPECT_TRUE(allFieldsAreZero(pointer));
}

TEST(CountedPointer, LeavesTheObjectToTheCallerWhenThereIsNoMemoryForTheCounter) {
    Endings endings;
    auto* const object = new Probe(endings, 1);
    ZebCountedPointer<Probe> pointer;
    {
        const ScopedFailures failures({.nothrowNews = 0});
        EXPECT_EQ(messageOf<NoMemoryEx>([&] { pointer.create(object, ZebPST_Individual, ZebPAT_New); }),
                  "No Memory\n");
    }
    EXPECT_TRUE(allFieldsAreZero(pointer));
    EXPECT_TRUE(endings.empty());
    delete object;
}

TEST(ReferenceCounter, StartsAtOneAndReportsTheNewValueOfADecrement) {
    ZebReferenceCounter counter;
    counter.increment();
    counter.increment();
    EXPECT_EQ(counter.decrement(), 2);
    EXPECT_EQ(counter.decrement(), 1);
    EXPECT_EQ(counter.decrement(), 0);
}

// An element of a list that each element holds the rest of.
struct ListElement {
    ZebCountedPointer<ListElement> next;
    int value = 0;
};

TEST(CountedPointer, TakesAPointerThatTheObjectItLetsGoOfHolds) {
    ZebCountedPointer<ListElement> head;
    head.create(new (std::nothrow) ListElement, ZebPST_Individual, ZebPAT_New);
    head->next.create(new (std::nothrow) ListElement, ZebPST_Individual, ZebPAT_New);
    head->next->value = 2;
    head = head->next;
    EXPECT_EQ(head->value, 2);
}

} // namespace
