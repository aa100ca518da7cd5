// Shared ownership of a heap object through a separately allocated reference counter.
#pragma once

#include <atomic>
#include <cstddef>
#include <cstdlib>
#include <new>
#include <utility>

#include "foundation/assertion.hpp"
#include "foundation/exceptions.hpp"
#include "foundation/integers.hpp"

// The assertions spell null pointers as the log shows them, and the analyzer cannot count references.
// NOLINTBEGIN(modernize-use-nullptr,clang-analyzer-cplusplus.NewDelete*,clang-analyzer-unix.Malloc)

// What the owned pointer leads to. 0 in an empty pointer.
enum ZebPointerSizeType : uint32 {
    ZebPST_Individual = 1, // one object
    ZebPST_Array = 2       // the first element of an array
};

// How the owned memory was made. 0 in an empty pointer.
enum ZebPointerAllocationType : uint32 {
    ZebPAT_New = 1,   // new or new[]
    ZebPAT_Malloc = 2 // malloc; no destructor runs
};

// The counter that all copies of one pointer share.
class ZebReferenceCounter {
public:
    ZebReferenceCounter() = default;
    ZebReferenceCounter(const ZebReferenceCounter&) = delete;
    ZebReferenceCounter& operator=(const ZebReferenceCounter&) = delete;
    ~ZebReferenceCounter() { mCount = 0; }

    void increment() { mCount.fetch_add(1); }
    int32 decrement() { return mCount.fetch_sub(1) - 1; } // the new value

private:
    std::atomic<int32> mCount{1};
};

// A value that owns a `T` (or an array of them) together with every copy of itself. Either all four fields
// are zero (empty), or both pointers are set and both types are 1 or 2. Copying an empty pointer is fatal.
template <typename T>
class ZebCountedPointer {
public:
    ZebCountedPointer() = default;

    ZebCountedPointer(const ZebCountedPointer& acrCopy) {
        ASSERT_OR_EXIT(0 != acrCopy.mPointer);
        ASSERT_OR_EXIT(0 != acrCopy.mReferenceCount);
        mPointer = acrCopy.mPointer;
        mReferenceCount = acrCopy.mReferenceCount;
        mSizeType = acrCopy.mSizeType;
        mAllocationType = acrCopy.mAllocationType;
        mReferenceCount->increment();
    }

    ZebCountedPointer& operator=(const ZebCountedPointer& acrCopy) {
        ASSERT_OR_EXIT(0 != acrCopy.mPointer);
        ASSERT_OR_EXIT(0 != acrCopy.mReferenceCount);
        if (this != &acrCopy) {
            // Shared first: the object that is let go of may hold `acrCopy` itself, as the head of a list
            // does its next element.
            ZebCountedPointer copy(acrCopy);
            std::swap(mPointer, copy.mPointer);
            std::swap(mReferenceCount, copy.mReferenceCount);
            std::swap(mSizeType, copy.mSizeType);
            std::swap(mAllocationType, copy.mAllocationType);
        }
        return *this;
    }

    ~ZebCountedPointer() { release(); }

    // Takes ownership of `acpObject`, the result of a non-throwing allocation of the kind that the two types
    // tell, into an empty pointer. Throws NoMemoryEx "No Memory\n" when it is null, or when there is no
    // memory for the counter (the object then stays the caller's).
    void create(T* acpObject, ZebPointerSizeType acSizeType, ZebPointerAllocationType acAllocationType) {
        if (acpObject == nullptr) {
            throw NoMemoryEx("No Memory\n");
        }
        auto* counter = new (std::nothrow) ZebReferenceCounter;
        if (counter == nullptr) {
            throw NoMemoryEx("No Memory\n");
        }
        mPointer = acpObject;
        mReferenceCount = counter;
        mSizeType = acSizeType;
        mAllocationType = acAllocationType;
    }

    // Gives up this copy's share, destroying the object when it was the last, and leaves the pointer empty.
    void release() {
        if (mPointer != nullptr && mReferenceCount != nullptr && mReferenceCount->decrement() == 0) {
            destroy();
        }
        mPointer = nullptr;
        mReferenceCount = nullptr;
        mSizeType = {};
        mAllocationType = {};
    }

    // The object. Fatal on an empty pointer and on an array.
    T& operator*() { return *individual(); }
    const T& operator*() const { return *individual(); }
    T* operator->() { return individual(); }
    const T* operator->() const { return individual(); }

    // The object or the first element, for either size type. Fatal on an empty pointer.
    T* pointer() const {
        ASSERT_OR_EXIT(0 != mPointer);
        ASSERT_OR_EXIT(0 != mReferenceCount);
        if (mSizeType != ZebPST_Individual && mSizeType != ZebPST_Array) {
            ASSERT_OR_EXIT(false);
        }
        return mPointer;
    }

    // The same without a look at the size type.
    T* get() const {
        ASSERT_OR_EXIT(0 != mPointer);
        ASSERT_OR_EXIT(0 != mReferenceCount);
        return mPointer;
    }

    // Element `index` of an array. Nothing is tested: the caller knows the length.
    T& operator[](std::size_t index) const { return mPointer[index]; }

    // `pointer != 0` tells whether anything is owned.
    bool operator!=(const T* acpOther) const { return mPointer != acpOther; }

private:
    T* individual() const {
        ASSERT_OR_EXIT(0 != mPointer);
        ASSERT_OR_EXIT(0 != mReferenceCount);
        ASSERT_OR_EXIT(ZebPST_Individual == mSizeType);
        return mPointer;
    }

    void destroy() {
        delete mReferenceCount;
        mReferenceCount = nullptr;
        if (mAllocationType == ZebPAT_Malloc) {
            std::free(mPointer);
        } else if (mAllocationType == ZebPAT_New && mSizeType == ZebPST_Individual) {
            delete mPointer;
        } else if (mAllocationType == ZebPAT_New && mSizeType == ZebPST_Array) {
            delete[] mPointer;
        } else {
            ASSERT_OR_EXIT(false);
        }
        mPointer = nullptr;
    }

    T* mPointer = nullptr;
    ZebReferenceCounter* mReferenceCount = nullptr;
    ZebPointerSizeType mSizeType{};
    ZebPointerAllocationType mAllocationType{};
};

// NOLINTEND(modernize-use-nullptr,clang-analyzer-cplusplus.NewDelete*,clang-analyzer-unix.Malloc)
