#include "host/das_tree.hpp"

#include <algorithm>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "foundation/exceptions.hpp"
#include "main/shared/device_register.hpp"
#include "main/shared/run_state.hpp"
#include "tests/support/fake_identity.hpp"
#include "tests/support/host_files.hpp"
#include "tests/support/log_capture.hpp"
#include "tests/support/thrown.hpp"

namespace {

const std::string kEntered = "Entered Function gatherDasInfo Line #\n";
const std::string kLeft = "Left Function gatherDasInfo Line #\n";
const std::string kDiskOnPci = "../devices/pci0000:00/0000:00:1f.2/host0/target0:0:0/0:0:0:0/block/sda";
const std::string kVirtual = "../devices/virtual/block/";

// What the report leaves in the log of a disk with this identifier.
std::string reported(const std::string& name, const std::string& identifier) {
    return "Entered Function printDeviceTree Line #\n"
           "Entered Function getDeviceType Line #\n"
           "Left Function getDeviceType Line #\n"
           "Entered Function reconfirmDAS Line #\n"
           "Entered Function addDeviceNameMap Line #\n"
           "Added to DevMap " +
           std::to_string(EmulexHash(("/dev/" + name).c_str())) + " --> /dev/" + name +
           " --> 2\n"
           "Left Function addDeviceNameMap Line #\n"
           "\n--------> Device Name: |/dev/" +
           name + "| LunId: |" + identifier + "|\n\n";
}

std::string ofNoInterest(const std::string& name) {
    return "|" + name + "| is of no interest to us. Ignoring";
}

class DasTree : public testing::Test {
protected:
    DasTree() {
        DevMap.clear();
        mFiles.directory("/sys/block");
    }
    void TearDown() override { DevMap.clear(); }

    // The log of the gathering without its two traces.
    static std::string gathered() {
        const LogCapture log;
        EXPECT_EQ(gatherDasInfo(), 0U);
        const std::string text = log.text();
        EXPECT_EQ(text.substr(0, kEntered.size()), kEntered);
        EXPECT_TRUE(text.ends_with(kLeft)) << text;
        return text.substr(kEntered.size(), text.size() - kEntered.size() - kLeft.size());
    }

    HostFiles mFiles;
    FakeIdentity mIdentity;
};

TEST_F(DasTree, ReportsNothingOfAnEmptyDirectory) {
    EXPECT_EQ(gathered(), "");
}

TEST_F(DasTree, ReportsALinkThatLeadsToHardware) {
    mFiles.link("/sys/block/sda", kDiskOnPci);
    mIdentity.identifier("/dev/sda", "6006");
    EXPECT_EQ(gathered(), reported("sda", "6006"));
    EXPECT_EQ(mIdentity.questions(), std::vector<std::string>{"identifier /dev/sda 2"});
    const LogCapture quiet;
    EXPECT_EQ(getDeviceType("/dev/sda"), TREE_DAS);
}

TEST_F(DasTree, LeavesOutLinksToVirtualDevices) {
    mFiles.link("/sys/block/loop0", kVirtual + "loop0");
    mFiles.link("/sys/block/ram0", kVirtual + "ram0");
    EXPECT_EQ(gathered(), "");
}

TEST_F(DasTree, ComparesTheWholePrefixOfAVirtualDevice) {
    // A 'v' in the prefix's place is not enough, and neither is a link of exactly the prefix but its end.
    mFiles.link("/sys/block/sda", "../devices/vio/block/sda");
    mIdentity.identifier("/dev/sda", "6006");
    EXPECT_EQ(gathered(), reported("sda", "6006"));
}

TEST_F(DasTree, TakesALinkOfTheVirtualPrefixAloneForVirtual) {
    mFiles.link("/sys/block/sda", "../devices/virtual/");
    EXPECT_EQ(gathered(), "");
}

TEST_F(DasTree, ReportsADirectoryWhoseDeviceLeadsToHardware) {
    mFiles.link("/sys/block/sda/device", "../../devices/pci0000:00/host0/target0:0:0/0:0:0:0");
    mIdentity.identifier("/dev/sda", "6006");
    EXPECT_EQ(gathered(), reported("sda", "6006"));
}

TEST_F(DasTree, LeavesOutADirectoryWhoseDeviceIsVirtual) {
    mFiles.link("/sys/block/sda/device", "../../devices/virtual/host0");
    EXPECT_EQ(gathered(), "");
}

TEST_F(DasTree, LeavesOutADirectoryWithoutDevice) {
    mFiles.directory("/sys/block/loop0");
    EXPECT_EQ(gathered(), "");
}

TEST_F(DasTree, LeavesOutALinkOfNoLength) {
    // A directory whose "device" is no link: its target cannot be read.
    mFiles.file("/sys/block/sda/device", "");
    EXPECT_EQ(gathered(), "");
}

TEST_F(DasTree, IgnoresOtherEntriesWithAMessage) {
    mFiles.file("/sys/block/notes", "");
    EXPECT_EQ(gathered(), ofNoInterest("notes"));
    mFiles.pipe("/sys/block/pipe");
    const std::string both = gathered();
    EXPECT_TRUE(both == ofNoInterest("notes") + ofNoInterest("pipe") ||
                both == ofNoInterest("pipe") + ofNoInterest("notes"))
        << both;
}

TEST_F(DasTree, IgnoresAnEntryWhoseTypeTheFileSystemDoesNotTell) {
    mFiles.link("/sys/block/sda", kDiskOnPci);
    mFiles.hideType("sda");
    EXPECT_EQ(gathered(), ofNoInterest("sda"));
}

TEST_F(DasTree, ReportsInDirectoryOrder) {
    for (const std::string name : {"sda", "sdb", "sdc", "sdd"}) {
        mFiles.link("/sys/block/" + name, kDiskOnPci);
        mIdentity.identifier("/dev/" + name, "id of " + name);
    }
    std::string expected;
    for (const std::string& name : mFiles.entries("/sys/block")) {
        if (name[0] != '.') {
            expected += reported(name, "id of " + name);
        }
    }
    EXPECT_EQ(gathered(), expected);
}

TEST_F(DasTree, HandsTheReportANameToChange) {
    mFiles.link("/sys/block/cciss!c0d0", "../devices/pci0000:00/cciss0/block/cciss!c0d0");
    mIdentity.identifier("/dev/cciss/c0d0", "6006");
    EXPECT_EQ(gathered(), reported("cciss/c0d0", "6006"));
}

TEST_F(DasTree, SkipsADiskThatAnotherTreeHasClaimed) {
    mFiles.link("/sys/block/sda", kDiskOnPci);
    {
        const LogCapture log;
        addDeviceNameMap(TREE_FC, "/dev/sda");
    }
    EXPECT_EQ(gathered(), "Entered Function printDeviceTree Line #\n"
                          "Entered Function getDeviceType Line #\n");
    EXPECT_TRUE(mIdentity.questions().empty());
}

TEST_F(DasTree, ReadsALinkOfMoreThan1023Bytes) {
    const std::string longTarget = "../devices/" + std::string(1500, 'p');
    mFiles.link("/sys/block/sda", longTarget);
    mIdentity.identifier("/dev/sda", "6006");
    EXPECT_EQ(gathered(), reported("sda", "6006"));
}

const std::string kBanner = "Entered Function BuildDasTree_Linux Line #\n"
                            "\n================================================\n"
                            "============== DAS DEVICE DETAILS =============="
                            "\n================================================\n";

TEST_F(DasTree, IsBuiltUnderItsBanner) {
    mFiles.link("/sys/block/sda", kDiskOnPci);
    mIdentity.identifier("/dev/sda", "6006");
    const LogCapture log;
    BuildDasTree_Linux();
    EXPECT_EQ(log.text(), kBanner + kEntered + reported("sda", "6006") + kLeft +
                              "Left Function BuildDasTree_Linux Line #\n");
}

TEST(DasTreeWithoutDirectory, SaysThatItCannotBeBuilt) {
    const HostFiles files;
    const LogCapture log;
    BuildDasTree_Linux();
    EXPECT_EQ(log.text(), kBanner + kEntered + "Failed to open path '/sys/block/' can not get DAS info" +
                              kLeft +
                              "Error occured while fetching DAS devices. Failed to build DAS tree.\n"
                              "Left Function BuildDasTree_Linux Line #\n");
}

TEST(DasTreeWithoutDirectory, GathersWithResult5) {
    const HostFiles files;
    const LogCapture log;
    EXPECT_EQ(gatherDasInfo(), 5U);
}

} // namespace
