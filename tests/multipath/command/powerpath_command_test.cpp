// PowerPath's commands as a shell runs them.
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "multipath/powerpath.hpp"
#include "tests/multipath/command_log.hpp"
#include "tests/support/log_capture.hpp"

namespace {

using Handler = ZebSensorLinuxPowerPathHandler;

constexpr const char* kDeviceListing =
    "/sbin/powermt display latency dev=all | grep -E '^Pseudo|^Logical' | sed 's/ \\[.*$//g'";

TEST(PowerPathCommand, RunsInTheShell) {
    Handler::LineList::List lines;
    const LogCapture log;
    Handler::sExecuteCommand("for name in one two; do echo \"$name\"; done; exit 3", lines);
    EXPECT_EQ(texts(lines), (std::vector<std::string>{"one", "two"}));
    EXPECT_EQ(log.text(), commandLog({"one", "two"}, 2));
}

TEST(PowerPathCommand, PrintsNothingWhenItDoesNotExist) {
    Handler::LineList::List lines;
    const LogCapture log;
    Handler::sExecuteCommand("/nowhere/powermt display 2>/dev/null", lines);
    EXPECT_EQ(texts(lines), std::vector<std::string>{});
    EXPECT_EQ(log.text(), commandLog({}, 0));
}

// The listing as powermt prints it, through the pipeline that sense() runs it in.
TEST(PowerPathCommand, KeepsTheNamesAndIdentifiersOfTheListing) {
    std::string pipeline(kDeviceListing);
    const std::string powermt = "/sbin/powermt display latency dev=all";
    ASSERT_EQ(pipeline.substr(0, powermt.size()), powermt);
    pipeline.replace(0, powermt.size(),
                     "printf '%s\\n' 'Pseudo name=emcpowera' 'CLARiiON ID=APM00 [host]' "
                     "'Logical device ID=600601604B2A1E00 [LUN 0]' 'state=alive; Pseudo' ''");
    Handler::LineList::List lines;
    const LogCapture log;
    Handler::sExecuteCommand(pipeline.c_str(), lines);
    EXPECT_EQ(texts(lines),
              (std::vector<std::string>{"Pseudo name=emcpowera", "Logical device ID=600601604B2A1E00"}));
    Handler handler;
    handler.__parse(lines);
    EXPECT_STREQ(handler.getPseudoDevice("600601604B2A1E00").c_str(), "emcpowera");
}

} // namespace
