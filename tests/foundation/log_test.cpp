#include "foundation/log.hpp"

#include <cstdio>
#include <cstdlib>
#include <string>

#include <gtest/gtest.h>

#include "foundation/exceptions.hpp"
#include "tests/support/log_capture.hpp"
#include "tests/support/refusing_log.hpp"
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

} // namespace
