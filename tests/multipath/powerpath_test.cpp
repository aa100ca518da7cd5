#include "multipath/powerpath.hpp"

#include <unistd.h>

#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "foundation/exceptions.hpp"
#include "tests/multipath/command_log.hpp"
#include "tests/support/fake_commands.hpp"
#include "tests/support/fatal.hpp"
#include "tests/support/log_capture.hpp"
#include "tests/support/refusing_log.hpp"
#include "tests/support/thrown.hpp"

namespace {

using Handler = ZebSensorLinuxPowerPathHandler;

constexpr const char* kDaemonCheck = "/usr/bin/pgrep -l emcpd";
constexpr const char* kDeviceListing =
    "/sbin/powermt display latency dev=all | grep -E '^Pseudo|^Logical' | sed 's/ \\[.*$//g'";
constexpr const char* kRunningDaemon = "812 emcpd\n813 emcpd\n";
constexpr std::size_t kMostBytesOfARead = 3999;

std::vector<useconds_t> gPauses; // as asked of usleep since the test's start

Handler::LineList::List lineList(const std::vector<std::string>& texts) {
    Handler::LineList::List lines;
    for (const std::string& text : texts) {
        lines.emplace_back(text.c_str());
    }
    return lines;
}

const std::string kDaemonLog = "Checking if emcpd is running\n" + commandLog({"812 emcpd", "813 emcpd"}, 2) +
                               "Getting the output of powermt command\n";

// What __parse leaves in the log for these pairs of pseudo device and identifier.
std::string parseLog(const std::vector<std::pair<std::string, std::string>>& pairs) {
    const std::string trace =
        "Entered Function sParseOutputLine Line #\nLeft Function sParseOutputLine Line #\n";
    std::string log = "Entered Function __parse Line #\n";
    for (const auto& [pseudoDevice, ulid] : pairs) {
        log.append(trace).append("pseudo device - ").append(pseudoDevice).append("\n");
        log.append(trace).append("ulid - ").append(ulid).append("\n");
    }
    return log + "Left Function __parse Line #\n";
}

class PowerPath : public testing::Test {
protected:
    PowerPath() { gPauses.clear(); }

    // Runs sense() on a host whose daemon runs and whose listing is `listing`.
    void senseListing(const std::string& listing) {
        mCommands.answer(kDaemonCheck, kRunningDaemon);
        mCommands.answer(kDeviceListing, listing);
        const LogCapture log;
        mHandler.sense();
    }

    bool isRunning() const {
        const LogCapture log;
        return mHandler.isRunning();
    }

    std::string pseudoDevice(const char* ulid) const {
        const LogCapture log;
        return mHandler.getPseudoDevice(ulid).c_str();
    }

    FakeCommands mCommands;
    Handler mHandler;
};

TEST_F(PowerPath, DoesNotRunBeforeTheFirstSense) {
    EXPECT_FALSE(isRunning());
    EXPECT_THROW(pseudoDevice("6006"), NotFoundEx);
}

TEST_F(PowerPath, DoesNotRunWithoutADaemon) {
    const LogCapture log;
    mHandler.sense();
    EXPECT_EQ(log.text(), "Entered Function sense Line #\n"
                          "Checking if emcpd is running\n"
                          "Entered Function sExecuteCommand Line #\n"
                          "Calling popen\n"
                          "Fread returned ERROR\n"
                          "Number of lines in output: 0\n"
                          "Left Function sExecuteCommand Line #\n"
                          "Left Function sense Line #\n");
    EXPECT_FALSE(isRunning());
    EXPECT_EQ(mCommands.runs(), std::vector<std::string>{kDaemonCheck});
}

TEST_F(PowerPath, DoesNotRunWhenTheDaemonCheckPrintsOneLine) {
    mCommands.answer(kDaemonCheck, "812 emcpd\n");
    const LogCapture log;
    mHandler.sense();
    EXPECT_EQ(log.text(), "Entered Function sense Line #\n"
                          "Checking if emcpd is running\n"
                          "Entered Function sExecuteCommand Line #\n"
                          "Calling popen\n"
                          "Buffer got = 812 emcpd\n\n"
                          "Entered Function sBreakOutput Line #\n"
                          "Line: 812 emcpdEnd of popened Buffer\n"
                          "Left Function sBreakOutput Line #\n"
                          "Fread returned ERROR\n"
                          "Number of lines in output: 1\n"
                          "Left Function sExecuteCommand Line #\n"
                          "Left Function sense Line #\n");
    EXPECT_FALSE(isRunning());
    EXPECT_EQ(mCommands.runs(), std::vector<std::string>{kDaemonCheck});
}

TEST_F(PowerPath, RunsWithTheDevicesOfItsListing) {
    mCommands.answer(kDaemonCheck, kRunningDaemon);
    mCommands.answer(kDeviceListing, "Pseudo name=emcpowera\nLogical device ID=600601604B2A1E00\n"
                                     "Pseudo name=emcpowerb\nLogical device ID=600601604B2A1E01\n");
    const LogCapture log;
    mHandler.sense();
    EXPECT_EQ(log.text(),
              "Entered Function sense Line #\n" + kDaemonLog +
                  commandLog({"Pseudo name=emcpowera", "Logical device ID=600601604B2A1E00",
                              "Pseudo name=emcpowerb", "Logical device ID=600601604B2A1E01"},
                             4) +
                  parseLog({{"emcpowera", "600601604B2A1E00"}, {"emcpowerb", "600601604B2A1E01"}}) +
                  "Left Function sense Line #\n");
    EXPECT_TRUE(isRunning());
    EXPECT_EQ(pseudoDevice("600601604B2A1E00"), "emcpowera");
    EXPECT_EQ(pseudoDevice("600601604B2A1E01"), "emcpowerb");
    EXPECT_EQ(gPauses, std::vector<useconds_t>{});
    EXPECT_EQ(FakeCommands::openStreams(), 0U);
}

TEST_F(PowerPath, GivesUpOnAListingThatStaysAtOneLineAfterFivePauses) {
    mCommands.answer(kDaemonCheck, kRunningDaemon);
    mCommands.answer(kDeviceListing, "Pseudo name=emcpowera\n");
    const LogCapture log;
    mHandler.sense();
    std::string attempts = commandLog({"Pseudo name=emcpowera"}, 1);
    for (int later = 0; later < 4; ++later) {
        attempts += commandLog({}, 1);
    }
    EXPECT_EQ(log.text(),
              "Entered Function sense Line #\n" + kDaemonLog + attempts + "Left Function sense Line #\n");
    EXPECT_FALSE(isRunning());
    EXPECT_EQ(gPauses, std::vector<useconds_t>(5, 20000));
    EXPECT_EQ(mCommands.runs().size(), 6U);
}

TEST_F(PowerPath, GivesUpOnAnEmptyListingAfterFivePauses) {
    mCommands.answer(kDaemonCheck, kRunningDaemon);
    const LogCapture log;
    mHandler.sense();
    std::string attempts;
    for (int attempt = 0; attempt < 5; ++attempt) {
        attempts += commandLog({}, 0);
    }
    EXPECT_EQ(log.text(),
              "Entered Function sense Line #\n" + kDaemonLog + attempts + "Left Function sense Line #\n");
    EXPECT_FALSE(isRunning());
    EXPECT_EQ(gPauses, std::vector<useconds_t>(5, 20000));
}

TEST_F(PowerPath, CollectsTheLinesOfItsAttemptsInOneList) {
    mCommands.answer(kDaemonCheck, kRunningDaemon);
    mCommands.answer(kDeviceListing, "Pseudo name=emcpowera\n");
    mCommands.answer(kDeviceListing, "");
    mCommands.answer(kDeviceListing, "Logical device ID=6006\n");
    const LogCapture log;
    mHandler.sense();
    EXPECT_EQ(log.text(), "Entered Function sense Line #\n" + kDaemonLog +
                              commandLog({"Pseudo name=emcpowera"}, 1) + commandLog({}, 1) +
                              commandLog({"Logical device ID=6006"}, 2) + parseLog({{"emcpowera", "6006"}}) +
                              "Left Function sense Line #\n");
    EXPECT_TRUE(isRunning());
    EXPECT_EQ(pseudoDevice("6006"), "emcpowera");
    EXPECT_EQ(gPauses, std::vector<useconds_t>(2, 20000));
}

TEST_F(PowerPath, DropsTheLastLineOfAnOddListing) {
    senseListing("Pseudo name=emcpowera\nLogical device ID=6006\nPseudo name=emcpowerb\n");
    EXPECT_TRUE(isRunning());
    EXPECT_EQ(pseudoDevice("6006"), "emcpowera");
    const LogCapture log;
    mCommands.answer(kDaemonCheck, kRunningDaemon);
    mCommands.answer(kDeviceListing, "Pseudo name=emcpowera\nLogical device ID=6006\nno value\n");
    mHandler.sense(); // not even looked at
    EXPECT_TRUE(isRunning());
}

TEST_F(PowerPath, KeepsTheLaterPseudoDeviceOfAnIdentifierListedTwice) {
    senseListing(
        "Pseudo name=emcpowera\nLogical device ID=6006\nPseudo name=emcpowerb\nLogical device ID=6006\n");
    EXPECT_EQ(pseudoDevice("6006"), "emcpowerb");
}

TEST_F(PowerPath, KeepsAPairThatIsListedTwice) {
    senseListing(
        "Pseudo name=emcpowera\nLogical device ID=6006\nPseudo name=emcpowera\nLogical device ID=6006\n");
    EXPECT_EQ(pseudoDevice("6006"), "emcpowera");
}

TEST_F(PowerPath, ForgetsItsDevicesWhenTheDaemonIsGone) {
    senseListing("Pseudo name=emcpowera\nLogical device ID=6006\n");
    const LogCapture log;
    mHandler.sense();
    EXPECT_FALSE(isRunning());
    EXPECT_THROW(pseudoDevice("6006"), NotFoundEx);
}

TEST_F(PowerPath, ForgetsItsDevicesWhenTheListingIsGone) {
    senseListing("Pseudo name=emcpowera\nLogical device ID=6006\n");
    mCommands.answer(kDaemonCheck, kRunningDaemon);
    const LogCapture log;
    mHandler.sense();
    EXPECT_FALSE(isRunning());
    EXPECT_THROW(pseudoDevice("6006"), NotFoundEx);
}

TEST_F(PowerPath, KeepsEarlierDevicesWhileItRuns) {
    senseListing(
        "Pseudo name=emcpowera\nLogical device ID=6006\nPseudo name=emcpowerb\nLogical device ID=6007\n");
    senseListing(
        "Pseudo name=emcpowerc\nLogical device ID=6007\nPseudo name=emcpowerd\nLogical device ID=6008\n");
    EXPECT_EQ(pseudoDevice("6006"), "emcpowera");
    EXPECT_EQ(pseudoDevice("6007"), "emcpowerc");
    EXPECT_EQ(pseudoDevice("6008"), "emcpowerd");
}

TEST_F(PowerPath, IsNotRunningWhenPopenFails) {
    mCommands.answer(kDaemonCheck, FakeRun{.output = "", .canStart = false});
    const LogCapture log;
    mHandler.sense();
    EXPECT_EQ(log.text(), "Entered Function sense Line #\n"
                          "Checking if emcpd is running\n"
                          "Entered Function sExecuteCommand Line #\n"
                          "Calling popen\n"
                          "Failed in popen\n"
                          "Left Function sExecuteCommand Line #\n"
                          "Left Function sense Line #\n");
    EXPECT_FALSE(isRunning());
}

TEST_F(PowerPath, TracesTheQuestionWhetherItRuns) {
    const LogCapture log;
    EXPECT_FALSE(mHandler.isRunning());
    EXPECT_EQ(log.text(), "Entered Function isRunning Line #\nLeft Function isRunning Line #\n");
}

TEST_F(PowerPath, ListsItsDevicesByIdentifierOnOneLineAfterSensingAgain) {
    senseListing(
        "Pseudo name=emcpowera\nLogical device ID=6006B\nPseudo name=emcpowerb\nLogical device ID=6006A\n");
    mCommands.answer(kDaemonCheck, kRunningDaemon);
    mCommands.answer(kDeviceListing, "Pseudo name=emcpowerc\nLogical device ID=6006a\n");
    const LogCapture log;
    mHandler.printData();
    EXPECT_EQ(log.text(), "Entered Function printData Line #\n"
                          "Entered Function sense Line #\n" +
                              kDaemonLog +
                              commandLog({"Pseudo name=emcpowerc", "Logical device ID=6006a"}, 2) +
                              parseLog({{"emcpowerc", "6006a"}}) +
                              "Left Function sense Line #\n"
                              "PowerPath Data : Ulid  Pseudo Name\n"
                              "               6006A emcpowerb"
                              "               6006B emcpowera"
                              "               6006a emcpowerc"
                              "Left Function printData Line #\n");
}

TEST_F(PowerPath, ListsNothingWhenItHasStopped) {
    senseListing("Pseudo name=emcpowera\nLogical device ID=6006\n");
    const LogCapture log;
    mHandler.printData();
    EXPECT_EQ(log.text(), "Entered Function printData Line #\n"
                          "Entered Function sense Line #\n"
                          "Checking if emcpd is running\n" +
                              commandLog({}, 0) +
                              "Left Function sense Line #\n"
                              "Left Function printData Line #\n");
}

TEST_F(PowerPath, FindsThePseudoDeviceOfAnIdentifier) {
    senseListing("Pseudo name=emcpowera\nLogical device ID=6006\n");
    const LogCapture log;
    EXPECT_STREQ(mHandler.getPseudoDevice("6006").c_str(), "emcpowera");
    EXPECT_EQ(log.text(), "Entered Function getPseudoDevice Line #\nLeft Function getPseudoDevice Line #\n");
}

TEST_F(PowerPath, ThrowsWithoutALogLineForAnIdentifierItDoesNotKnow) {
    senseListing("Pseudo name=emcpowera\nLogical device ID=6006\n");
    const LogCapture log;
    EXPECT_EQ(messageOf<NotFoundEx>([&] { mHandler.getPseudoDevice("60060"); }), "Element not found\n");
    EXPECT_EQ(log.text(), "Entered Function getPseudoDevice Line #\nLeft Function getPseudoDevice Line #\n");
}

TEST_F(PowerPath, TellsIdentifiersOfDifferentCaseApart) {
    senseListing("Pseudo name=emcpowera\nLogical device ID=600601604B2A1E00\n");
    EXPECT_THROW(pseudoDevice("600601604b2a1e00"), NotFoundEx);
}

TEST_F(PowerPath, LetsAReadFailureOut) {
    mCommands.answer(kDaemonCheck, FakeRun{.output = "812 emcpd\n", .readFails = true});
    const LogCapture log;
    EXPECT_EQ(messageOf<ReadFailedEx>([&] { mHandler.sense(); }), "File read failed");
    EXPECT_EQ(log.text(), "Entered Function sense Line #\n"
                          "Checking if emcpd is running\n"
                          "Entered Function sExecuteCommand Line #\n"
                          "Calling popen\n"
                          "Failed to read - File read failed\n"
                          "Left Function sExecuteCommand Line #\n");
    EXPECT_EQ(FakeCommands::openStreams(), 0U);
}

TEST_F(PowerPath, ClosesTheCommandWhenTheLogRefusesALine) {
    mCommands.answer("anything", "line\n");
    constexpr int kLinesBeforeTheBuffer = 2;
    const RefusingLog log(kLinesBeforeTheBuffer);
    Handler::LineList::List lines;
    EXPECT_EQ(messageOf<WriteFailedEx>([&] { Handler::sExecuteCommand("anything", lines); }),
              "File write failed\n");
    EXPECT_EQ(FakeCommands::openStreams(), 0U);
}

TEST_F(PowerPath, ReadsLongOutputInPieces) {
    // 400 lines of 11 bytes: the first read ends within line 363, whose first six bytes are carried over.
    std::string output;
    std::vector<std::string> expected;
    for (int number = 1000; number < 1400; ++number) {
        expected.push_back("Pseudo" + std::to_string(number));
        output += expected.back() + "\n";
    }
    mCommands.answer("listing", output);
    Handler::LineList::List lines;
    const LogCapture log;
    Handler::sExecuteCommand("listing", lines);
    EXPECT_EQ(texts(lines), expected);

    std::string firstLines;
    for (int number = 0; number < 363; ++number) {
        firstLines += "Line: " + expected[static_cast<std::size_t>(number)];
    }
    std::string lastLines;
    for (int number = 363; number < 400; ++number) {
        lastLines += "Line: " + expected[static_cast<std::size_t>(number)];
    }
    EXPECT_EQ(log.text(), "Entered Function sExecuteCommand Line #\n"
                          "Calling popen\n"
                          "Buffer got = " +
                              output.substr(0, kMostBytesOfARead) +
                              "\nEntered Function sBreakOutput Line #\n" + firstLines +
                              "Incomplete line: Pseudo\n"
                              "Left Function sBreakOutput Line #\n"
                              "Buffer got = " +
                              output.substr(kMostBytesOfARead - 6) +
                              "\nEntered Function sBreakOutput Line #\n" + lastLines +
                              "End of popened Buffer\n"
                              "Left Function sBreakOutput Line #\n"
                              "Fread returned ERROR\n"
                              "Number of lines in output: 400\n"
                              "Left Function sExecuteCommand Line #\n");
}

TEST_F(PowerPath, AsksForNoMoreThanTheCarriedPartLeavesRoomFor) {
    // The carried part of the first read is 3000 bytes, so the second takes 999 of the 1500 that follow.
    const std::string head(998, 'h');
    const std::string carried(3000, 'c');
    const std::string tail(1500, 't');
    mCommands.answer("listing", head + "\n" + carried + tail + "\n");
    Handler::LineList::List lines;
    const LogCapture log;
    Handler::sExecuteCommand("listing", lines);
    const std::string full = carried + std::string(999, 't');
    EXPECT_EQ(texts(lines), std::vector<std::string>{head});
    EXPECT_EQ(log.text(), "Entered Function sExecuteCommand Line #\n"
                          "Calling popen\n"
                          "Buffer got = " +
                              head + "\n" + carried + "\nEntered Function sBreakOutput Line #\nLine: " +
                              head + "Incomplete line: " + carried +
                              "\nLeft Function sBreakOutput Line #\n"
                              "Buffer got = " +
                              full + "\nEntered Function sBreakOutput Line #\nIncomplete line: " + full +
                              "\nLeft Function sBreakOutput Line #\n"
                              "Fread returned ERROR\n"
                              "Number of lines in output: 1\n"
                              "Left Function sExecuteCommand Line #\n");
}

TEST_F(PowerPath, EndsTheReadingAtALineThatFillsTheBuffer) {
    mCommands.answer("listing", std::string(5000, 'x') + "\nnever seen\n");
    Handler::LineList::List lines;
    const LogCapture log;
    Handler::sExecuteCommand("listing", lines);
    const std::string full(kMostBytesOfARead, 'x');
    EXPECT_EQ(texts(lines), std::vector<std::string>{});
    EXPECT_EQ(log.text(), "Entered Function sExecuteCommand Line #\n"
                          "Calling popen\n"
                          "Buffer got = " +
                              full + "\nEntered Function sBreakOutput Line #\nIncomplete line: " + full +
                              "\nLeft Function sBreakOutput Line #\n"
                              "Fread returned ERROR\n"
                              "Number of lines in output: 0\n"
                              "Left Function sExecuteCommand Line #\n");
    EXPECT_EQ(FakeCommands::openStreams(), 0U);
}

TEST_F(PowerPath, TakesTheLongestLineThatFitsWithItsLineFeed) {
    const std::string longest(kMostBytesOfARead - 1, 'x');
    mCommands.answer("listing", longest + "\n");
    Handler::LineList::List lines;
    const LogCapture log;
    Handler::sExecuteCommand("listing", lines);
    EXPECT_EQ(texts(lines), std::vector<std::string>{longest});
}

TEST_F(PowerPath, LeavesOutALineThatTheOutputDoesNotEnd) {
    mCommands.answer("listing", "whole\npart");
    Handler::LineList::List lines;
    const LogCapture log;
    Handler::sExecuteCommand("listing", lines);
    EXPECT_EQ(texts(lines), std::vector<std::string>{"whole"});
    EXPECT_EQ(log.text(), "Entered Function sExecuteCommand Line #\n"
                          "Calling popen\n"
                          "Buffer got = whole\npart\n"
                          "Entered Function sBreakOutput Line #\n"
                          "Line: wholeIncomplete line: part\n"
                          "Left Function sBreakOutput Line #\n"
                          "Fread returned ERROR\n"
                          "Number of lines in output: 1\n"
                          "Left Function sExecuteCommand Line #\n");
}

TEST_F(PowerPath, SurvivesOutputThatIsNotText) {
    std::string output;
    for (int round = 0; round < 64; ++round) {
        for (int byte = 0; byte < 256; ++byte) {
            output += static_cast<char>(byte);
        }
    }
    mCommands.answer("listing", output);
    Handler::LineList::List lines;
    const LogCapture log;
    Handler::sExecuteCommand("listing", lines);
    EXPECT_TRUE(log.text().ends_with("Fread returned ERROR\n"
                                     "Number of lines in output: 0\n"
                                     "Left Function sExecuteCommand Line #\n"));
    EXPECT_EQ(FakeCommands::openStreams(), 0U);
}

TEST_F(PowerPath, TakesANulBehindALineForTheEndOfTheBuffer) {
    mCommands.answer("listing", std::string("one\n\0two\n", 9));
    Handler::LineList::List lines;
    const LogCapture log;
    Handler::sExecuteCommand("listing", lines);
    EXPECT_EQ(texts(lines), std::vector<std::string>{"one"});
    EXPECT_EQ(log.text(), commandLog({"one"}, 1));
}

TEST_F(PowerPath, AppendsToLinesThatAreThere) {
    mCommands.answer("listing", "two\n");
    Handler::LineList::List lines = lineList({"one"});
    const LogCapture log;
    Handler::sExecuteCommand("listing", lines);
    EXPECT_EQ(texts(lines), (std::vector<std::string>{"one", "two"}));
    EXPECT_EQ(log.text(), commandLog({"two"}, 2));
}

TEST_F(PowerPath, LeavesTheLinesAloneWhenPopenFails) {
    mCommands.answer("listing", FakeRun{.output = "two\n", .canStart = false});
    Handler::LineList::List lines = lineList({"one"});
    const LogCapture log;
    Handler::sExecuteCommand("listing", lines);
    EXPECT_EQ(texts(lines), std::vector<std::string>{"one"});
}

// A buffer as sExecuteCommand has it.
struct OutputBuffer {
    explicit OutputBuffer(const std::string& content) { content.copy(text, sizeof text - 1); }
    char text[Handler::kOutputSize] = {};
};

TEST(PowerPathBreakOutput, TakesCompleteLinesAndStartsOver) {
    OutputBuffer buffer("one\n\nthree\n");
    Handler::LineList::List lines;
    const LogCapture log;
    EXPECT_EQ(Handler::sBreakOutput(buffer.text, lines), buffer.text);
    EXPECT_EQ(texts(lines), (std::vector<std::string>{"one", "", "three"}));
    EXPECT_EQ(log.text(), "Entered Function sBreakOutput Line #\n"
                          "Line: oneLine: Line: threeEnd of popened Buffer\n"
                          "Left Function sBreakOutput Line #\n");
}

TEST(PowerPathBreakOutput, MovesAnIncompleteLineToTheStart) {
    OutputBuffer buffer("one\ntw");
    Handler::LineList::List lines;
    const LogCapture log;
    EXPECT_EQ(Handler::sBreakOutput(buffer.text, lines), buffer.text + 2);
    EXPECT_EQ(std::string(buffer.text, 2), "tw");
    EXPECT_EQ(texts(lines), std::vector<std::string>{"one"});
    EXPECT_EQ(log.text(), "Entered Function sBreakOutput Line #\n"
                          "Line: oneIncomplete line: tw\n"
                          "Left Function sBreakOutput Line #\n");
}

TEST(PowerPathBreakOutput, KeepsALineWithoutLineFeedWhereItIs) {
    OutputBuffer buffer("one");
    Handler::LineList::List lines;
    const LogCapture log;
    EXPECT_EQ(Handler::sBreakOutput(buffer.text, lines), buffer.text + 3);
    EXPECT_STREQ(buffer.text, "one");
    EXPECT_EQ(texts(lines), std::vector<std::string>{});
    EXPECT_EQ(log.text(), "Entered Function sBreakOutput Line #\n"
                          "Incomplete line: one\n"
                          "Left Function sBreakOutput Line #\n");
}

TEST(PowerPathParse, PairsLinesByPositionWithoutALookAtTheirKeys) {
    Handler handler;
    auto lines = lineList({"Logical device ID=first", "anything=second"});
    const LogCapture log;
    handler.__parse(lines);
    EXPECT_TRUE(lines.empty());
    EXPECT_EQ(log.text(), parseLog({{"first", "second"}}));
    EXPECT_STREQ(handler.getPseudoDevice("second").c_str(), "first");
}

TEST(PowerPathParse, HasNothingToDoWithoutLines) {
    Handler handler;
    Handler::LineList::List lines;
    const LogCapture log;
    handler.__parse(lines);
    EXPECT_EQ(log.text(), parseLog({}));
}

TEST(PowerPathParse, EndsTheProcessAtALineWithoutAPartner) {
    Handler handler;
    auto lines = lineList({"Pseudo name=emcpowera"});
    EXPECT_FATAL(handler.__parse(lines), "Entered Function __parse Line #\n"
                                         "Entered Function sParseOutputLine Line #\n"
                                         "Left Function sParseOutputLine Line #\n"
                                         "pseudo device - emcpowera\n"
                                         "Assertion [ 0 != arOutput.size() ] failed\n");
}

TEST(PowerPathParseLine, TakesTheFrontLineAndGivesTheTextBehindItsFirstEqualsSign) {
    auto lines = lineList({"Logical device ID= a=b \r", "next=line"});
    ZebString value("old");
    const LogCapture log;
    Handler::sParseOutputLine(lines, value);
    EXPECT_STREQ(value.c_str(), " a=b \r");
    EXPECT_EQ(texts(lines), std::vector<std::string>{"next=line"});
    EXPECT_EQ(log.text(),
              "Entered Function sParseOutputLine Line #\nLeft Function sParseOutputLine Line #\n");
}

TEST(PowerPathParseLine, GivesAnEmptyTextBehindAnEqualsSignAtTheEnd) {
    auto lines = lineList({"Pseudo name="});
    ZebString value("old");
    const LogCapture log;
    Handler::sParseOutputLine(lines, value);
    EXPECT_STREQ(value.c_str(), "");
}

TEST(PowerPathParseLine, EndsTheProcessAtALineWithoutAnEqualsSign) {
    auto lines = lineList({"Pseudo name emcpowera"});
    ZebString value("");
    EXPECT_FATAL(Handler::sParseOutputLine(lines, value), "Entered Function sParseOutputLine Line #\n"
                                                          "Assertion [ lPos != ZebString::npos ] failed\n");
}

TEST(PowerPathParseLine, EndsTheProcessWithoutLines) {
    Handler::LineList::List lines;
    ZebString value("");
    EXPECT_FATAL(Handler::sParseOutputLine(lines, value), "Entered Function sParseOutputLine Line #\n"
                                                          "Assertion [ 0 != arOutput.size() ] failed\n");
}

} // namespace

// Pauses are counted, not taken.
extern "C" int usleep(useconds_t useconds) {
    gPauses.push_back(useconds);
    return 0;
}
