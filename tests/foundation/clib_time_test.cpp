#include "foundation/clib_time.hpp"

#include <sys/time.h>

#include <cerrno>
#include <csignal>
#include <cstdlib>
#include <ctime>

#include <gtest/gtest.h>

#include "foundation/exceptions.hpp"
#include "tests/foundation/failing_calls.hpp"
#include "tests/support/thrown.hpp"

namespace {

struct ClibLocalTime : testing::Test {
    ClibLocalTime() {
        setenv("TZ", "MRV-2", 1); // two hours east
        tzset();
    }
    ClibLocalTime(const ClibLocalTime&) = delete;
    ClibLocalTime& operator=(const ClibLocalTime&) = delete;
    ~ClibLocalTime() override {
        unsetenv("TZ");
        tzset();
    }
};

double secondsSince(const timespec& start) {
    timespec now{};
    clock_gettime(CLOCK_MONOTONIC, &now);
    return static_cast<double>(now.tv_sec - start.tv_sec) +
           static_cast<double>(now.tv_nsec - start.tv_nsec) / 1e9;
}

timespec monotonic() {
    timespec now{};
    clock_gettime(CLOCK_MONOTONIC, &now);
    return now;
}

// A signal in 20 ms that only interrupts.
void interruptSoon() {
    struct sigaction action {};
    action.sa_handler = [](int) {};
    sigaction(SIGALRM, &action, nullptr);
    const itimerval soon = {{0, 0}, {0, 20000}};
    setitimer(ITIMER_REAL, &soon, nullptr);
}

TEST(ClibTime, GivesTheTimeInBothPlaces) {
    std::time_t stored = 0;
    const std::time_t before = std::time(nullptr);
    const std::time_t now = Clib_time(&stored);
    EXPECT_GE(now, before);
    EXPECT_LE(now, before + 60);
    EXPECT_EQ(stored, now);
}

TEST(ClibTime, ThrowsClibGetTimeFailedEx) {
    const ScopedFailures failures({.time = EFAULT});
    EXPECT_EQ(messageOf<ClibGetTimeFailedEx>([] { Clib_time(nullptr); }), "Time() failed");
}

TEST_F(ClibLocalTime, IsWrittenByCtime) {
    const std::time_t time = 0;
    char text[26] = "";
    EXPECT_EQ(Clib_ctime(&time, text, 0), text);
    EXPECT_STREQ(text, "Thu Jan  1 02:00:00 1970\n");
}

TEST(ClibCtime, ThrowsClibGetTimeFailedEx) {
    const ScopedFailures failures({.ctime_r = EOVERFLOW});
    const std::time_t time = 0;
    char text[26] = "";
    EXPECT_EQ(messageOf<ClibGetTimeFailedEx>([&] { Clib_ctime(&time, text, sizeof text); }),
              "Ctime() failed");
}

TEST_F(ClibLocalTime, IsReadByMktime) {
    std::tm parts{};
    parts.tm_year = 70;
    parts.tm_mday = 2;
    EXPECT_EQ(Clib_mktime(&parts), 22 * 3600);
}

TEST_F(ClibLocalTime, IsNotReadByMktimeWhenItsResultIsMinusOne) {
    std::tm parts{};
    parts.tm_year = 70;
    parts.tm_mday = 1;
    parts.tm_hour = 2;
    parts.tm_sec = -1;
    EXPECT_EQ(messageOf<ClibGetTimeFailedEx>([&] { Clib_mktime(&parts); }), "mktime() failed\n");
}

TEST_F(ClibLocalTime, IsTakenApartByLocaltime) {
    const std::time_t time = 86400;
    std::tm parts{};
    EXPECT_EQ(Clib_localtime(&time, &parts), &parts);
    EXPECT_EQ(parts.tm_mday, 2);
    EXPECT_EQ(parts.tm_hour, 2);
}

TEST(ClibLocaltime, ThrowsClibGetTimeFailedEx) {
    const ScopedFailures failures({.localtime_r = EOVERFLOW});
    const std::time_t time = 0;
    std::tm parts{};
    EXPECT_EQ(messageOf<ClibGetTimeFailedEx>([&] { Clib_localtime(&time, &parts); }), "Localtime() failed\n");
}

TEST_F(ClibLocalTime, DoesNotMatterToGmtime) {
    const std::time_t time = 86400;
    std::tm parts{};
    EXPECT_EQ(Clib_gmtime(&time, &parts), &parts);
    EXPECT_EQ(parts.tm_mday, 2);
    EXPECT_EQ(parts.tm_hour, 0);
}

TEST(ClibGmtime, ThrowsClibGetTimeFailedEx) {
    const ScopedFailures failures({.gmtime_r = EOVERFLOW});
    const std::time_t time = 0;
    std::tm parts{};
    EXPECT_EQ(messageOf<ClibGetTimeFailedEx>([&] { Clib_gmtime(&time, &parts); }), "Gmtime() failed\n");
}

// The milliseconds that a wall clock at 5 s and this many microseconds shows.
unsigned millisecondsAt(int microseconds) {
    const ScopedFailures clock({.now = timeval{5, microseconds}});
    uint32 seconds = 0;
    uint16 milliseconds = 0xffff;
    Clib_gettimeofday(seconds, milliseconds);
    EXPECT_EQ(seconds, 5U);
    return milliseconds;
}

TEST(ClibGettimeofday, CutsMicrosecondsBelowAMillisecondOff) {
    EXPECT_EQ(millisecondsAt(0), 0U);
    EXPECT_EQ(millisecondsAt(999), 0U);
}

TEST(ClibGettimeofday, CountsAMillisecondFromAThousandMicroseconds) {
    EXPECT_EQ(millisecondsAt(1000), 1U);
    EXPECT_EQ(millisecondsAt(1999), 1U);
    EXPECT_EQ(millisecondsAt(999999), 999U);
}

TEST(ClibGettimeofday, TellsTheTime) {
    uint32 seconds = 0;
    uint16 milliseconds = 0xffff;
    const std::time_t before = std::time(nullptr);
    Clib_gettimeofday(seconds, milliseconds);
    EXPECT_GE(seconds + 1, before); // std::time's clock is a coarse one
    EXPECT_LE(seconds, before + 60);
    EXPECT_LT(milliseconds, 1000);
}

TEST(ClibGettimeofday, ThrowsClibGetTimeFailedExWithTheSystemsText) {
    const ScopedFailures failures({.gettimeofday = EFAULT});
    uint32 seconds = 0;
    uint16 milliseconds = 0;
    EXPECT_EQ(messageOf<ClibGetTimeFailedEx>([&] { Clib_gettimeofday(seconds, milliseconds); }),
              "Bad address");
}

TEST(ClibMsleep, SleepsMilliseconds) {
    const timespec start = monotonic();
    EXPECT_EQ(Clib_msleep(20), 0);
    EXPECT_GE(secondsSince(start), 0.020);
}

TEST(ClibMsleep, ThrowsClibSleepFailedExWithTheSystemsText) {
    interruptSoon();
    EXPECT_EQ(messageOf<ClibSleepFailedEx>([] { Clib_msleep(60000); }), "Interrupted system call");
}

TEST(ClibUsleep, SleepsMicroseconds) {
    const timespec start = monotonic();
    EXPECT_EQ(Clib_usleep(2000), 0);
    EXPECT_GE(secondsSince(start), 0.002);
    EXPECT_LT(secondsSince(start), 1.9);
}

TEST(ClibUsleep, ThrowsClibSleepFailedExWithTheSystemsText) {
    interruptSoon();
    EXPECT_EQ(messageOf<ClibSleepFailedEx>([] { Clib_usleep(60000000); }), "Interrupted system call");
}

TEST(ClibSleep, GivesTheSecondsLeftWhenASignalComes) {
    EXPECT_EQ(Clib_sleep(0), 0U);
    interruptSoon();
    const unsigned left = Clib_sleep(60);
    EXPECT_GE(left, 59U); // rounded either way
    EXPECT_LE(left, 60U);
}

} // namespace
