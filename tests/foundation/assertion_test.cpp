#include "foundation/assertion.hpp"

#include <cstdio>

#include <gtest/gtest.h>

#include "foundation/log.hpp"
#include "foundation/trace.hpp"
#include "tests/support/fatal.hpp"
#include "tests/support/log_capture.hpp"
#include "tests/support/refusing_log.hpp"
#include "tests/support/temporary_directory.hpp"

namespace {

struct Lengths {
    unsigned mUseLength = 4;

    void check(unsigned acOffset) const {
        TRACE_ENTRY("check");
        ASSERT_OR_EXIT(acOffset < this->mUseLength);
        TRACE_EXIT("check");
    }
};

TEST(Assertion, LogsItsConditionAndEndsTheProcessWithStatusOne) {
    EXPECT_FATAL(Lengths().check(4), "Entered Function check Line #\n"
                                     "Assertion [ acOffset < this->mUseLength ] failed\n");
}

TEST(Assertion, SaysNothingWhenItHolds) {
    const LogCapture log;
    Lengths().check(3);
    EXPECT_EQ(log.text(), "Entered Function check Line #\nLeft Function check Line #\n");
}

TEST(Assertion, ShowsTheConditionAsItIsWritten) {
    const char* const pointer = nullptr;
    EXPECT_FATAL(ASSERT_OR_EXIT(__null != pointer), "Assertion [ __null != pointer ] failed\n");
    EXPECT_FATAL(ASSERT_OR_EXIT((1 == 2 || 0 != pointer)), "Assertion [ (1 == 2 || 0 != pointer) ] failed\n");
    EXPECT_FATAL(ASSERT_OR_EXIT(5 % 5), "Assertion [ 5 % 5 ] failed\n");
}

TEST(Assertion, LogsOneLineToTheLogStreamAndNoneElsewhere) {
    const TemporaryDirectory directory;
    const std::string path = directory.path("log");
    EXPECT_EXIT(
        {
            gLogStream = std::fopen(path.c_str(), "w+");
            assertionFailed("false");
        },
        testing::ExitedWithCode(1), testing::StrEq(""));
    EXPECT_EQ(directory.textOf("log"), "Assertion [ false ] failed\n");
}

TEST(Assertion, FlushesWhatTheLogHeldBefore) {
    const TemporaryDirectory directory;
    const std::string path = directory.path("log");
    EXPECT_EXIT(
        {
            gLogStream = std::fopen(path.c_str(), "w+");
            logPrintf("line\n");
            assertionFailed("mString != 0");
        },
        testing::ExitedWithCode(1), testing::StrEq(""));
    EXPECT_EQ(directory.textOf("log"), "line\nAssertion [ mString != 0 ] failed\n");
}

TEST(Assertion, EndsTheProcessEvenWhenTheLogRefusesItsLine) {
    EXPECT_EXIT(
        {
            const RefusingLog log;
            assertionFailed("false");
        },
        testing::ExitedWithCode(1), testing::StrEq("Assertion [ false ] failed\n"));
}

} // namespace
