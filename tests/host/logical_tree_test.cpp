#include "host/logical_tree.hpp"

#include <string>

#include <gtest/gtest.h>

#include "foundation/exceptions.hpp"
#include "main/shared/device_register.hpp"
#include "main/shared/run_state.hpp"
#include "tests/support/host_files.hpp"
#include "tests/support/log_capture.hpp"
#include "tests/support/refusing_log.hpp"
#include "tests/support/thrown.hpp"

namespace {

const std::string kHeading = "major minor  #blocks  name\n\n";
const std::string kEntered = "Entered Function gatherLogicalInfo Line #\n";
const std::string kLeft = "Left Function gatherLogicalInfo Line #\n";
const std::string kAsked = "Entered Function printDeviceTree Line #\nEntered Function getDeviceType Line #\n";

std::string reported(const std::string& name) {
    return kAsked + "Left Function getDeviceType Line #\n\n--------> Device Name: |/dev/" + name +
           "| LunId: |hostA :: /dev/" + name + "| \n";
}

std::string invalid(const std::string& line) {
    return "Invalid /proc/pratitions entry: " + line;
}

class LogicalTree : public testing::Test {
protected:
    LogicalTree() {
        DevMap.clear();
        gHostName = mHostName;
    }
    void TearDown() override {
        DevMap.clear();
        gHostName = nullptr;
    }

    // The log of the gathering with these partitions, without its two traces.
    std::string gathered(const std::string& partitions) {
        mFiles.file("/proc/partitions", partitions);
        const LogCapture log;
        EXPECT_EQ(gatherLogicalInfo(), 0U);
        const std::string text = log.text();
        EXPECT_EQ(text.substr(0, kEntered.size()), kEntered);
        EXPECT_TRUE(text.ends_with(kLeft)) << text;
        return text.substr(kEntered.size(), text.size() - kEntered.size() - kLeft.size());
    }

    HostFiles mFiles;
    char mHostName[kHostNameSize] = "hostA";
};

TEST_F(LogicalTree, ReportsThePartitionBehindTheLastSpaceOfItsLine) {
    EXPECT_EQ(gathered(kHeading + "   8        1   20480000 sda1\n"), reported("sda1"));
}

TEST_F(LogicalTree, WritesNothingForADiskThatATreeHasClaimed) {
    {
        const LogCapture log;
        addDeviceNameMap(TREE_DAS, "/dev/sda");
    }
    EXPECT_EQ(gathered(kHeading + "   8        0   20480000 sda\n   8        1   20480000 sda1\n"),
              kAsked + reported("sda1"));
}

TEST_F(LogicalTree, ReportsOpticalDrivesAndMappedDevicesToo) {
    EXPECT_EQ(gathered(kHeading + "  11        0    1048575 sr0\n 253        0   20480000 dm-0\n"),
              reported("sr0") + reported("dm-0"));
}

TEST_F(LogicalTree, DoesNotTranslateTheBangOfAName) {
    EXPECT_EQ(gathered(" 104        0   20480000 cciss!c0d0\n"), reported("cciss!c0d0"));
}

TEST_F(LogicalTree, SkipsLinesThatDoNotBeginWithASpace) {
    EXPECT_EQ(gathered(kHeading + "8 0 100 sda\n\t8 0 100 sdb\n"), "");
}

TEST_F(LogicalTree, CallsALineOfSpacesInvalid) {
    EXPECT_EQ(gathered("     \n"), invalid("     "));
    EXPECT_EQ(gathered(" \n"), invalid(" "));
}

TEST_F(LogicalTree, CallsALineWhoseOnlySpaceIsItsFirstInvalid) {
    EXPECT_EQ(gathered(" sda\n"), invalid(" sda"));
}

TEST_F(LogicalTree, TakesAnEmptyNameBehindASpaceAtTheEnd) {
    EXPECT_EQ(gathered("   8        0   20480000 sda \n"), reported(""));
}

TEST_F(LogicalTree, EndsALineWithoutLineFeedWhereItsTextEnds) {
    EXPECT_EQ(gathered("   8        0   20480000 sda"), reported("sda"));
    EXPECT_EQ(gathered(" "), invalid(" "));
    EXPECT_EQ(gathered("   "), invalid("   "));
}

TEST_F(LogicalTree, ReadsALineOf300CharactersInTwoParts) {
    // 255 characters a read: the name's first part ends the first, and the rest does not begin with a space.
    const std::string name(275, 'n');
    EXPECT_EQ(gathered("   8        0   20480000 " + name + "\n"),
              kAsked + "Left Function getDeviceType Line #\n\n--------> Device Name: |/dev/" +
                  std::string(58, 'n') + "| LunId: |hostA :: /dev/" + std::string(58, 'n') + "| \n");
}

TEST_F(LogicalTree, TakesTheRestOfALongLineForALineWhenItBeginsWithASpace) {
    const std::string blanks(255, ' ');
    EXPECT_EQ(gathered(blanks + "   8 0 1 sda\n"), invalid(blanks) + reported("sda"));
}

TEST_F(LogicalTree, HandlesALineOf300Spaces) {
    EXPECT_EQ(gathered(std::string(300, ' ') + "\n"),
              invalid(std::string(255, ' ')) + invalid(std::string(45, ' ')));
}

TEST_F(LogicalTree, EndsALineAtANul) {
    EXPECT_EQ(gathered(std::string("   8 0 1 sda\0 sdb\n", 18)), reported("sda"));
    EXPECT_EQ(gathered(std::string(" \0 sdb\n", 7)), invalid(" "));
}

TEST_F(LogicalTree, ReportsNothingOfAnEmptyList) {
    EXPECT_EQ(gathered(""), "");
    EXPECT_EQ(gathered(kHeading), "");
}

TEST_F(LogicalTree, SaysWhenThePartitionsCannotBeOpened) {
    const LogCapture log;
    EXPECT_EQ(gatherLogicalInfo(), 7U);
    EXPECT_EQ(log.text(), kEntered + "Could not open /proc/partitions for read!");
}

TEST_F(LogicalTree, SaysTheSameWhenTheyCannotBeRead) {
    mFiles.directory("/proc/partitions");
    const LogCapture log;
    EXPECT_EQ(gatherLogicalInfo(), 7U);
    EXPECT_EQ(log.text(), kEntered + "Could not open /proc/partitions for read!");
}

TEST_F(LogicalTree, LetsALogThatIsFullOut) {
    mFiles.file("/proc/partitions", "   8 0 1 sda\n");
    const RefusingLog log;
    EXPECT_EQ(messageOf<WriteFailedEx>([] { gatherLogicalInfo(); }), "File write failed");
}

const std::string kBanner = "Entered Function BuildLogicalTree_Linux Line #\n"
                            "\n================================================\n"
                            "============ LOGICAL DEVICE DETAILS ============"
                            "\n================================================\n";

TEST_F(LogicalTree, IsBuiltUnderItsBanner) {
    mFiles.file("/proc/partitions", kHeading + "   8        0   20480000 sda\n");
    const LogCapture log;
    BuildLogicalTree_Linux();
    EXPECT_EQ(log.text(),
              kBanner + kEntered + reported("sda") + kLeft + "Left Function BuildLogicalTree_Linux Line #\n");
}

TEST_F(LogicalTree, SaysWhenItCannotBeBuilt) {
    const LogCapture log;
    BuildLogicalTree_Linux();
    EXPECT_EQ(log.text(), kBanner + kEntered +
                              "Could not open /proc/partitions for read!"
                              "Error occured while reading Logical devices. Failed to build Logical tree.\n"
                              "Left Function BuildLogicalTree_Linux Line #\n");
}

} // namespace
