#include "foundation/trace.hpp"

#include <new>
#include <string>

#include <gtest/gtest.h>

#include "foundation/exceptions.hpp"
#include "tests/support/log_capture.hpp"
#include "tests/support/refusing_log.hpp"
#include "tests/support/thrown.hpp"

namespace {

constexpr const char* kRefused = "File write failed\n";

TEST(Trace, GoesToStandardErrorWhileThereIsNoLogStream) {
    ASSERT_EQ(gLogStream, nullptr);
    testing::internal::CaptureStderr();
    TRACE_ENTRY("main");
    EXPECT_EQ(withoutLineNumbers(testing::internal::GetCapturedStderr()), "Entered Function main Line #\n");
}

TEST(Trace, GoesOnlyToTheLogStreamOnceThereIsOne) {
    testing::internal::CaptureStderr();
    testing::internal::CaptureStdout();
    const LogCapture log;
    TRACE_ENTRY("main");
    TRACE_EXIT("main");
    EXPECT_EQ(log.text(), "Entered Function main Line #\nLeft Function main Line #\n");
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "");
    EXPECT_EQ(testing::internal::GetCapturedStdout(), "");
}

TEST(Trace, ShowsTheLineOfItsOwnStatement) {
    const LogCapture log;
    const int line = __LINE__;
    TRACE_ENTRY("setLength");
    TRACE_EXIT("setLength");
    EXPECT_EQ(log.exactText(), "Entered Function setLength Line " + std::to_string(line + 1) +
                                   "\nLeft Function setLength Line " + std::to_string(line + 2) + "\n");
}

TEST(Trace, ShowsTheLineItIsGiven) {
    const LogCapture log;
    TRACE_ENTRY("execute", 168);
    TRACE_EXIT("execute", 4294967295U);
    EXPECT_EQ(log.exactText(), "Entered Function execute Line 168\nLeft Function execute Line 4294967295\n");
}

TEST(Trace, TravelsAsWriteFailedExWhenTheStreamRefusesIt) {
    const RefusingLog log;
    EXPECT_EQ(messageOf<WriteFailedEx>([] { TRACE_ENTRY("main"); }), kRefused);
    EXPECT_EQ(messageOf<WriteFailedEx>([] { TRACE_EXIT("main"); }), kRefused);
}

TEST(TraceOfADestructor, WritesTheSameLines) {
    const LogCapture log;
    const FunctionTrace trace(std::nothrow, "~ZebBuffer");
    trace.log("Freeing 100% of it\n");
    trace.exit();
    EXPECT_EQ(log.text(),
              "Entered Function ~ZebBuffer Line #\nFreeing 100% of it\nLeft Function ~ZebBuffer Line #\n");
}

TEST(TraceOfADestructor, ShowsTheLineOfItsOwnStatement) {
    const LogCapture log;
    const int line = __LINE__;
    const FunctionTrace trace(std::nothrow, "~ZebBuffer");
    trace.exit();
    EXPECT_EQ(log.exactText(), "Entered Function ~ZebBuffer Line " + std::to_string(line + 1) +
                                   "\nLeft Function ~ZebBuffer Line " + std::to_string(line + 2) + "\n");
}

TEST(TraceOfADestructor, IsLostWhenTheStreamRefusesIt) {
    const RefusingLog log;
    const FunctionTrace trace(std::nothrow, "~ZebBuffer");
    trace.log("Freeing\n");
    trace.exit();
    EXPECT_EQ(log.refusals(), 1); // it is offered no line behind the first that it refuses
}

TEST(FunctionTrace, LogsItsEntryAndWhatItIsToldButNoExitOfItsOwn) {
    const LogCapture log;
    {
        const FunctionTrace trace("sense");
        trace.log("Getting 100% of it\n");
    }
    EXPECT_EQ(log.text(), "Entered Function sense Line #\nGetting 100% of it\n");
}

TEST(FunctionTrace, LogsTheExitBeforeItThrows) {
    const LogCapture log;
    const int line = __LINE__;
    const FunctionTrace trace("lookup");
    const auto fail = [&] { trace.fail<NotFoundEx>("Element not found\n"); };
    EXPECT_EQ(messageOf<NotFoundEx>(fail), "Element not found\n");
    EXPECT_EQ(log.exactText(), "Entered Function lookup Line " + std::to_string(line + 1) +
                                   "\nLeft Function lookup Line " + std::to_string(line + 2) + "\n");
}

TEST(FunctionTrace, LogsALastLineBeforeTheExit) {
    const LogCapture log;
    const FunctionTrace trace("lookup");
    EXPECT_EQ(messageOf<InvalidEx>([&] { trace.logAndFail<InvalidEx>("No %s here\n"); }), "No %s here\n");
    EXPECT_EQ(messageOf<InvalidEx>([&] { trace.logAndFail<InvalidEx>("Too short\n", "Invalid\n"); }),
              "Invalid\n");
    EXPECT_EQ(log.text(), "Entered Function lookup Line #\nNo %s here\nLeft Function lookup Line #\n"
                          "Too short\nLeft Function lookup Line #\n");
}

TEST(FunctionTrace, TravelsAsWriteFailedExWhenTheStreamRefusesIt) {
    EXPECT_EQ(messageOf<WriteFailedEx>([] {
                  const RefusingLog log;
                  const FunctionTrace trace("main");
              }),
              kRefused);
    const RefusingLog log(1);
    const FunctionTrace trace("main");
    EXPECT_EQ(messageOf<WriteFailedEx>([&] { trace.log("line\n"); }), kRefused);
    EXPECT_EQ(messageOf<WriteFailedEx>([&] { trace.exit(); }), kRefused);
    EXPECT_EQ(messageOf<WriteFailedEx>([&] { trace.fail<NotFoundEx>("Element not found\n"); }), kRefused);
}

} // namespace
