#include "foundation/log.hpp"

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <string>

#include <gtest/gtest.h>

#include "foundation/exceptions.hpp"
#include "tests/support/log_capture.hpp"
#include "tests/support/refusing_log.hpp"
#include "tests/support/temporary_directory.hpp"
#include "tests/support/thrown.hpp"

namespace {

constexpr const char* kRefused = "File write failed\n";

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

TEST(ReportPrintf, WritesAsLogPrintfAndFailsWithAMessageOfItsOwn) {
    {
        const LogCapture log;
        EXPECT_EQ(reportPrintf("|_ %s %u\n", "port", 7U), 10);
        EXPECT_EQ(log.exactText(), "|_ port 7\n");
    }
    const RefusingLog log;
    EXPECT_EQ(messageOf<WriteFailedEx>([] { reportPrintf("line\n"); }), "File write failed");
}

TEST(LogLine, PutsTextsAndNumbersIntoTheirPlaces) {
    const LogCapture log;
    logLine("Entered Function %s Line %u\n", {"sense", 168U});
    logLine("Byte %u: 0x%x", {4294967295U, 255U});
    logLine("Byte %u: 0x%x", {0U, 0U});
    logLine("\n");
    EXPECT_EQ(log.exactText(), "Entered Function sense Line 168\nByte 4294967295: 0xffByte 0: 0x0\n");
}

TEST(LogLine, WritesAPercentSignOfAText) {
    const LogCapture log;
    logLine("%s", {"100% of %u\n"});
    EXPECT_EQ(log.exactText(), "100% of %u\n");
}

TEST(LogLine, TakesTextsOfAnyLength) {
    for (const std::size_t length : {0U, 1U, 254U, 255U, 256U, 257U, 511U, 512U, 100000U}) {
        const LogCapture log;
        const std::string text(length, 'x');
        logLine("a%sb%sc", {text.c_str(), text.c_str()});
        EXPECT_EQ(log.exactText(), "a" + text + "b" + text + "c");
    }
}

TEST(Log, TakesNothingBehindTheFirstTextThatWasRefused) {
    const RefusingLog log(1);
    logPrintf("one\n");
    EXPECT_EQ(messageOf<WriteFailedEx>([] { logPrintf("two\n"); }), kRefused);
    EXPECT_EQ(logError(), ENOSPC);
    EXPECT_EQ(messageOf<WriteFailedEx>([] { logPrintf("three\n"); }), kRefused);
    EXPECT_EQ(messageOf<WriteFailedEx>([] { reportPrintf("four\n"); }), "File write failed");
    EXPECT_EQ(messageOf<WriteFailedEx>([] { logLine("five\n"); }), kRefused);
    logLineNoThrow("six\n");
    EXPECT_EQ(messageOf<WriteFailedEx>([] { flushLog(); }), kRefused);
    EXPECT_EQ(log.refusals(), 1);
}

TEST(Log, IsWithTheKernelOnceItIsFlushed) {
    const TemporaryDirectory folder;
    const std::string file = folder.path("log");
    gLogStream = std::fopen(file.c_str(), "w");
    logPrintf("line\n");
    flushLog();
    std::ifstream reader(file);
    std::string text;
    std::getline(reader, text);
    EXPECT_EQ(text, "line");
    static_cast<void>(std::fclose(gLogStream));
    gLogStream = nullptr;
}

} // namespace
