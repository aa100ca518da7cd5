#include "foundation/trace.hpp"

#include <cstdio>

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

TEST(LogPrintf, FormatsLikePrintfAndAddsNothing) {
    const LogCapture log;
    logPrintf("Element does not exist in the map");
    logPrintf("%s %d %#x%%\n", "text", -5, 255U);
    EXPECT_EQ(log.exactText(), "Element does not exist in the maptext -5 0xff%\n");
}

TEST(LogPrintf, ReturnsTheNumberOfCharactersWritten) {
    const LogCapture log;
    EXPECT_EQ(logPrintf("%s\n", "four"), 5);
    EXPECT_EQ(logPrintf("%s", ""), 0);
}

TEST(LogPrintf, TakesALineOfAnyLength) {
    const LogCapture log;
    const std::string text(100000, 'x');
    EXPECT_EQ(logPrintf("%s\n", text.c_str()), 100001);
    EXPECT_EQ(log.exactText(), text + "\n");
}

TEST(LogPrintf, ThrowsWriteFailedExOnAFullDisk) {
    gLogStream = std::fopen("/dev/full", "w");
    static_cast<void>(std::setvbuf(gLogStream, nullptr, _IONBF, 0));
    EXPECT_EQ(messageOf<WriteFailedEx>([] { logPrintf("Going to open HBAAPI library\n"); }), kRefused);
    static_cast<void>(std::fclose(gLogStream));
    gLogStream = nullptr;
}

TEST(LogPrintf, FlushesNothing) {
    char* text = nullptr;
    std::size_t size = 0;
    gLogStream = open_memstream(&text, &size);
    logPrintf("line\n");
    EXPECT_EQ(size, 0U);
    static_cast<void>(std::fclose(gLogStream));
    gLogStream = nullptr;
    EXPECT_EQ(std::string(text, size), "line\n");
    std::free(text);
}

TEST(TraceOfADestructor, WritesTheSameLines) {
    const LogCapture log;
    traceEntryNoThrow("~ZebBuffer");
    logPrintfNoThrow("Freeing %s\n", "buffer");
    traceExitNoThrow("~ZebBuffer");
    EXPECT_EQ(log.text(),
              "Entered Function ~ZebBuffer Line #\nFreeing buffer\nLeft Function ~ZebBuffer Line #\n");
}

TEST(TraceOfADestructor, ShowsTheLineOfItsOwnStatement) {
    const LogCapture log;
    const int line = __LINE__;
    traceEntryNoThrow("~ZebBuffer");
    EXPECT_EQ(log.exactText(), "Entered Function ~ZebBuffer Line " + std::to_string(line + 1) + "\n");
}

TEST(TraceOfADestructor, IsLostWhenTheStreamRefusesIt) {
    const RefusingLog log;
    traceEntryNoThrow("~ZebBuffer");
    logPrintfNoThrow("Freeing %s\n", "buffer");
    traceExitNoThrow("~ZebBuffer");
    EXPECT_EQ(log.refusals(), 3);
}

} // namespace
