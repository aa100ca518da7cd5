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
    logPrintf("%s", "next\n");
    EXPECT_EQ(size, 0U);
    passLog();
    EXPECT_EQ(size, 0U);
    static_cast<void>(std::fclose(gLogStream));
    gLogStream = nullptr;
    EXPECT_EQ(std::string(text, size), "line\nnext\n");
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

TEST(LogText, WritesTextsAndNumbersAsPrintfDoes) {
    const LogCapture log;
    LogText text;
    text.text("Entered Function ").string("sense").text(" Line ").decimal(168).text("\n");
    for (const uint32 number : {0U, 9U, 10U, 4294967295U}) {
        text.decimal(number).text(" ");
    }
    for (const uint8 byte : std::initializer_list<uint8>{0, 0x0f, 0x10, 0xff}) {
        text.hex(byte).text(" ");
    }
    text.write();
    EXPECT_EQ(log.exactText(), "Entered Function sense Line 168\n0 9 10 4294967295 0 f 10 ff ");
}

TEST(LogText, TakesTextsOfAnyLength) {
    for (const std::size_t length : {0U, 1U, 510U, 511U, 512U, 513U, 1023U, 1024U, 100000U}) {
        const LogCapture log;
        const std::string string(length, 'x');
        LogText text;
        text.text("a").string(string.c_str()).text("b").string(string.c_str()).text("c").write();
        EXPECT_EQ(log.exactText(), std::string("a").append(string).append("b").append(string).append("c"));
    }
}

TEST(Log, TakesNothingBehindTheFirstTextThatWasRefused) {
    const RefusingLog log(1);
    logPrintf("one\n");
    EXPECT_EQ(messageOf<WriteFailedEx>([] { logPrintf("two\n"); }), kRefused);
    EXPECT_EQ(logError(), ENOSPC);
    EXPECT_EQ(messageOf<WriteFailedEx>([] { logPrintf("three\n"); }), kRefused);
    EXPECT_EQ(messageOf<WriteFailedEx>([] { reportPrintf("four\n"); }), "File write failed");
    EXPECT_EQ(messageOf<WriteFailedEx>([] { LogText().text("five\n").write(); }), kRefused);
    LogText().text("six\n").writeNoThrow();
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

TEST(Log, KeepsTheOrderOfLinesThatAreFormattedAndOnesThatAreNot) {
    const LogCapture log;
    LogText().text("one\n").write();
    logPrintf("%s\n", "two");
    logPrintf("three\n");
    reportPrintf("four\n");
    LogText().text("five\n").writeNoThrow();
    passLog();
    static_cast<void>(std::fputs("six\n", gLogStream));
    logPrintf("seven\n");
    EXPECT_EQ(log.exactText(), "one\ntwo\nthree\nfour\nfive\nsix\nseven\n");
}

TEST(Log, GoesAtOnceToAStreamWithoutABuffer) {
    testing::internal::CaptureStderr();
    ASSERT_EQ(gLogStream, nullptr);
    logPrintf("line\n");
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "line\n");
}

} // namespace
