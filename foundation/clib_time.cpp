#include "foundation/clib_time.hpp"

#include <sys/time.h>
#include <unistd.h>

#include "foundation/clib_error.hpp"
#include "foundation/exceptions.hpp"

namespace {

template <typename Pointer>
Pointer unlessNull(Pointer result, const char* message) {
    if (result == nullptr) {
        throw ClibGetTimeFailedEx(message);
    }
    return result;
}

std::time_t unlessMinusOne(std::time_t result, const char* message) {
    if (result == -1) {
        throw ClibGetTimeFailedEx(message);
    }
    return result;
}

} // namespace

std::time_t Clib_time(std::time_t* time) {
    return unlessMinusOne(std::time(time), "Time() failed");
}

char* Clib_ctime(const std::time_t* time, char* buffer, std::size_t /*length*/) {
    return unlessNull(ctime_r(time, buffer), "Ctime() failed");
}

std::time_t Clib_mktime(std::tm* parts) {
    return unlessMinusOne(std::mktime(parts), "mktime() failed\n");
}

std::tm* Clib_gmtime(const std::time_t* time, std::tm* parts) {
    return unlessNull(gmtime_r(time, parts), "Gmtime() failed\n");
}

std::tm* Clib_localtime(const std::time_t* time, std::tm* parts) {
    return unlessNull(localtime_r(time, parts), "Localtime() failed\n");
}

void Clib_gettimeofday(uint32& seconds, uint16& milliseconds) {
    struct timeval now {};
    if (gettimeofday(&now, nullptr) == -1) {
        throwErrno<ClibGetTimeFailedEx>();
    }
    seconds = static_cast<uint32>(now.tv_sec);
    milliseconds = static_cast<uint16>(now.tv_usec / 1000);
}

int Clib_msleep(uint32 milliseconds) {
    return Clib_usleep(milliseconds * 1000);
}

int Clib_usleep(uint32 microseconds) {
    const int result = usleep(microseconds);
    if (result == -1) {
        throwErrno<ClibSleepFailedEx>();
    }
    return result;
}

unsigned Clib_sleep(unsigned seconds) {
    return sleep(seconds);
}
