#include "tests/support/failing_memory.hpp"

#include <cstddef>
#include <new>

// The name of the non-throwing operator new, whose size_t is another type on each word size.
#if __SIZEOF_SIZE_T__ == 8
#define NOTHROW_NEW "_ZnwmRKSt9nothrow_t"
#else
#define NOTHROW_NEW "_ZnwjRKSt9nothrow_t"
#endif

namespace {

constexpr int kUnlimited = -1;
int gGranted = kUnlimited;
bool gCallocFails = false;

} // namespace

FailingNew::FailingNew(int granted) {
    gGranted = granted;
}

FailingNew::~FailingNew() {
    gGranted = kUnlimited;
}

FailingCalloc::FailingCalloc() {
    gCallocFails = true;
}

FailingCalloc::~FailingCalloc() {
    gCallocFails = false;
}

// The linker's --wrap gives the code under test these for the library's functions, which keep the second
// names.
extern "C" {

void* realNew(std::size_t size, const std::nothrow_t& tag) noexcept asm("__real_" NOTHROW_NEW);
void* wrappedNew(std::size_t size, const std::nothrow_t& tag) noexcept asm("__wrap_" NOTHROW_NEW);
void* realCalloc(std::size_t count, std::size_t size) asm("__real_calloc");
void* wrappedCalloc(std::size_t count, std::size_t size) asm("__wrap_calloc");

void* wrappedNew(std::size_t size, const std::nothrow_t& tag) noexcept {
    if (gGranted == 0) {
        return nullptr;
    }
    if (gGranted > 0) {
        --gGranted;
    }
    return realNew(size, tag);
}

void* wrappedCalloc(std::size_t count, std::size_t size) {
    return gCallocFails ? nullptr : realCalloc(count, size);
}

} // extern "C"
