#include "tests/foundation/failing_calls.hpp"

#include <dlfcn.h>

#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <ctime>
#include <new>

FailingCalls gFailingCalls;

namespace {

bool fails(const std::optional<int>& failure) {
    if (failure) {
        errno = *failure;
    }
    return failure.has_value();
}

// The next function of the name: the C library's, or the sanitizer's in front of it.
template <typename Function>
Function* next(const char* name) {
    return reinterpret_cast<Function*>(dlsym(RTLD_NEXT, name));
}

} // namespace

// NOLINTBEGIN(readability-inconsistent-declaration-parameter-name): the C library names its own with
// underscores
extern "C" {

int putenv(char* text) noexcept {
    static auto* const kReal = next<int(char*)>("putenv");
    return fails(gFailingCalls.putenv) ? -1 : kReal(text);
}

time_t time(time_t* result) noexcept {
    static auto* const kReal = next<time_t(time_t*)>("time");
    return fails(gFailingCalls.time) ? -1 : kReal(result);
}

char* ctime_r(const time_t* seconds, char* buffer) noexcept {
    static auto* const kReal = next<char*(const time_t*, char*)>("ctime_r");
    return fails(gFailingCalls.ctime_r) ? nullptr : kReal(seconds, buffer);
}

tm* gmtime_r(const time_t* seconds, tm* parts) noexcept {
    static auto* const kReal = next<tm*(const time_t*, tm*)>("gmtime_r");
    return fails(gFailingCalls.gmtime_r) ? nullptr : kReal(seconds, parts);
}

tm* localtime_r(const time_t* seconds, tm* parts) noexcept {
    static auto* const kReal = next<tm*(const time_t*, tm*)>("localtime_r");
    return fails(gFailingCalls.localtime_r) ? nullptr : kReal(seconds, parts);
}

int gettimeofday(timeval* result, void* zone) noexcept {
    static auto* const kReal = next<int(timeval*, void*)>("gettimeofday");
    if (fails(gFailingCalls.gettimeofday)) {
        return -1;
    }
    if (gFailingCalls.now) {
        *result = *gFailingCalls.now;
        return 0;
    }
    return kReal(result, zone);
}

char* strdup(const char* text) noexcept {
    static auto* const kReal = next<char*(const char*)>("strdup");
    return fails(gFailingCalls.strdup) ? nullptr : kReal(text);
}
}
// NOLINTEND(readability-inconsistent-declaration-parameter-name)

void* operator new(std::size_t size, const std::nothrow_t& /*tag*/) noexcept {
    if (gFailingCalls.nothrowNews) {
        if (*gFailingCalls.nothrowNews == 0) {
            return nullptr;
        }
        --*gFailingCalls.nothrowNews;
    }
    try {
        return ::operator new(size);
    } catch (const std::bad_alloc&) {
        return nullptr;
    }
}
