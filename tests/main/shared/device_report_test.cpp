#include "main/shared/device_report.hpp"

#include <new>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "fc/identity/unique_lun_id.hpp"
#include "foundation/exceptions.hpp"
#include "main/shared/device_register.hpp"
#include "main/shared/iscsi_model.hpp"
#include "main/shared/run_state.hpp"
#include "scsi/scsi_exceptions.hpp"
#include "tests/support/fake_identity.hpp"
#include "tests/support/log_capture.hpp"
#include "tests/support/refusing_log.hpp"
#include "tests/support/thrown.hpp"

namespace {

const std::string kEntered = "Entered Function printDeviceTree Line #\n";
const std::string kClaimed = "Entered Function getDeviceType Line #\n";
const std::string kUnclaimed = kClaimed + "Left Function getDeviceType Line #\n";
const std::string kConfirmed = "Entered Function reconfirmDAS Line #\n";

std::string claimLog(const std::string& devName) {
    return "Entered Function addDeviceNameMap Line #\nAdded to DevMap " +
           std::to_string(EmulexHash(devName.c_str())) + " --> " + devName +
           " --> 2\nLeft Function addDeviceNameMap Line #\n";
}

// A device that is accepted without an identifier.
FakeAnswer directAttached() {
    return [] {
        gDirectAttachedFlag = true;
        return std::string();
    };
}

// One that fails after it was accepted so.
FakeAnswer directAttachedThenFailing() {
    return []() -> std::string {
        gDirectAttachedFlag = true;
        throw CloseFailedEx("Input/output error");
    };
}

class DeviceReport : public testing::Test {
protected:
    DeviceReport() {
        DevMap.clear();
        gIscsiPortList.clear();
        gDirectAttachedFlag = false;
        gHostName = mHostName;
    }
    void TearDown() override {
        DevMap.clear();
        gIscsiPortList.clear();
        gDirectAttachedFlag = false;
        gHostName = nullptr;
    }

    static std::string logOf(int32 type, std::string name) {
        const LogCapture log;
        printDeviceTree(type, name.data());
        return log.text();
    }

    static void claim(uint32 type, const char* devName) {
        const LogCapture log;
        addDeviceNameMap(type, devName);
    }

    char mHostName[kHostNameSize] = "hostA";
    FakeIdentity mIdentity;
};

TEST_F(DeviceReport, ShowsADirectlyAttachedDiskAndClaimsIt) {
    mIdentity.identifier("/dev/sda", "6006");
    EXPECT_EQ(logOf(TREE_DAS, "sda"), kEntered + kUnclaimed + kConfirmed + claimLog("/dev/sda") +
                                          "\n--------> Device Name: |/dev/sda| LunId: |6006|\n\n");
    const LogCapture quiet;
    EXPECT_EQ(getDeviceType("/dev/sda"), TREE_DAS);
    EXPECT_EQ(mIdentity.questions(), std::vector<std::string>{"identifier /dev/sda 2"});
}

TEST_F(DeviceReport, SkipsADiskOfTheFcTreeInTheDasAndLogicalTrees) {
    claim(TREE_FC, "/dev/sdb");
    EXPECT_EQ(logOf(TREE_DAS, "sdb"), kEntered + kClaimed);
    EXPECT_EQ(logOf(TREE_LOGICAL, "sdb"), kEntered + kClaimed);
    EXPECT_TRUE(mIdentity.questions().empty());
}

TEST_F(DeviceReport, SkipsADasDiskInTheLogicalTreeButNotItsPartitions) {
    mIdentity.identifier("/dev/sdb", "6006");
    logOf(TREE_DAS, "sdb");
    EXPECT_EQ(logOf(TREE_LOGICAL, "sdb"), kEntered + kClaimed);
    EXPECT_EQ(logOf(TREE_LOGICAL, "sdb1"),
              kEntered + kUnclaimed + "\n--------> Device Name: |/dev/sdb1| LunId: |hostA :: /dev/sdb1| \n");
}

TEST_F(DeviceReport, DoesNotClaimALogicalDevice) {
    const std::string first = logOf(TREE_LOGICAL, "sdb1");
    EXPECT_EQ(logOf(TREE_LOGICAL, "sdb1"), first);
    EXPECT_TRUE(DevMap.empty());
}

TEST_F(DeviceReport, TurnsTheFirstBangOfADasNameIntoASlashInPlace) {
    mIdentity.identifier("/dev/cciss/c0d0!p1", "6006");
    std::string name = "cciss!c0d0!p1";
    const LogCapture log;
    printDeviceTree(TREE_DAS, name.data());
    EXPECT_EQ(name, "cciss/c0d0!p1");
    EXPECT_EQ(log.text(), kEntered + kUnclaimed + kConfirmed + claimLog("/dev/cciss/c0d0!p1") +
                              "\n--------> Device Name: |/dev/cciss/c0d0!p1| LunId: |6006|\n\n");
}

TEST_F(DeviceReport, KeepsTheBangsOfALogicalName) {
    EXPECT_EQ(logOf(TREE_LOGICAL, "cciss!c0d0"),
              kEntered + kUnclaimed +
                  "\n--------> Device Name: |/dev/cciss!c0d0| LunId: |hostA :: /dev/cciss!c0d0| \n");
}

TEST_F(DeviceReport, CutsDevicePathsAt63Characters) {
    const std::string devName = "/dev/" + std::string(58, 'd');
    mIdentity.identifier(devName, "6006");
    EXPECT_EQ(logOf(TREE_LOGICAL, std::string(59, 'd')), kEntered + kUnclaimed +
                                                             "\n--------> Device Name: |" + devName +
                                                             "| LunId: |hostA :: " + devName + "| \n");
    EXPECT_EQ(logOf(TREE_DAS, std::string(200, 'd')), kEntered + kUnclaimed + kConfirmed + claimLog(devName) +
                                                          "\n--------> Device Name: |" + devName +
                                                          "| LunId: |6006|\n\n");
}

TEST_F(DeviceReport, GivesADiskWithoutIdentifierTheHostsName) {
    mIdentity.identifier("/dev/sda", directAttached());
    EXPECT_EQ(logOf(TREE_DAS, "sda"), kEntered + kUnclaimed + kConfirmed + claimLog("/dev/sda") +
                                          "\n--------> Device Name: |/dev/sda| LunId: |hostA::/dev/sda|\n\n");
    EXPECT_FALSE(gDirectAttachedFlag);
}

TEST_F(DeviceReport, GivesTheNextDiskItsOwnIdentifierAgain) {
    mIdentity.identifier("/dev/sda", directAttached());
    mIdentity.identifier("/dev/sdb", "6006");
    logOf(TREE_DAS, "sda");
    EXPECT_EQ(logOf(TREE_DAS, "sdb"), kEntered + kUnclaimed + kConfirmed + claimLog("/dev/sdb") +
                                          "\n--------> Device Name: |/dev/sdb| LunId: |6006|\n\n");
}

TEST_F(DeviceReport, CallsADiskUnsupportedThatCannotBeAsked) {
    mIdentity.identifier("/dev/sda", throws<NotSupportedEx>());
    EXPECT_EQ(logOf(TREE_DAS, "sda"), kEntered + kUnclaimed + kConfirmed +
                                          "Exception occured while getting LUN ID for device /dev/sda\n"
                                          "\n--------> Device Name: |/dev/sda| is not supported\n\n");
    const LogCapture quiet;
    EXPECT_EQ(getDeviceType("/dev/sda"), 0U);
}

TEST_F(DeviceReport, CatchesEveryExceptionOfTheStandardFamily) {
    mIdentity.identifier("/dev/sda", []() -> std::string { throw std::bad_alloc(); });
    EXPECT_EQ(logOf(TREE_DAS, "sda"), kEntered + kUnclaimed + kConfirmed +
                                          "Exception occured while getting LUN ID for device /dev/sda\n"
                                          "\n--------> Device Name: |/dev/sda| is not supported\n\n");
}

TEST_F(DeviceReport, ShowsADiskThatFailsAfterItWasAcceptedWithoutIdentifier) {
    mIdentity.identifier("/dev/sda", directAttachedThenFailing());
    EXPECT_EQ(logOf(TREE_DAS, "sda"), kEntered + kUnclaimed + kConfirmed +
                                          "Exception occured while getting LUN ID for device /dev/sda\n" +
                                          claimLog("/dev/sda") +
                                          "\n--------> Device Name: |/dev/sda| LunId: |hostA::/dev/sda|\n\n");
    EXPECT_FALSE(gDirectAttachedFlag);
}

TEST_F(DeviceReport, ReportsALogicalDeviceThatDasCouldNot) {
    logOf(TREE_DAS, "sda");
    EXPECT_EQ(logOf(TREE_LOGICAL, "sda"),
              kEntered + kUnclaimed + "\n--------> Device Name: |/dev/sda| LunId: |hostA :: /dev/sda| \n");
}

TEST_F(DeviceReport, DoesNothingForOtherTypes) {
    for (const int32 type : {int32{0}, int32{TREE_FC}, int32{3}, int32{16}, int32{-1}}) {
        EXPECT_EQ(logOf(type, "sda"), kEntered) << type;
    }
}

// A port, and paths of it in the list of ports.
ZebCountedPointer<IscsiInitiatorPort> addPort(const char* initiator, const char* port) {
    ZebCountedPointer<IscsiInitiatorPort> added;
    added.create(new (std::nothrow) IscsiInitiatorPort, ZebPST_Individual, ZebPAT_New);
    added->init_wwnn = initiator;
    added->init_wwpn = port;
    gIscsiPortList.push_back(added);
    return added;
}

void addPath(ZebCountedPointer<IscsiInitiatorPort> port, const char* target, const char* address,
             const std::string& disk, int32 lun, const char* identifier) {
    ZebCountedPointer<IscsiLunPath> path;
    path.create(new (std::nothrow) IscsiLunPath, ZebPST_Individual, ZebPAT_New);
    path->tgt_wwnn = target;
    path->tgt_wwpn = address;
    path->uniqueLunId = identifier;
    disk.copy(path->deviceName, sizeof path->deviceName - 1);
    path->sScsiOSLun = lun;
    port->paths.push_back(path);
}

TEST_F(DeviceReport, ShowsNothingOfAnEmptyIscsiTree) {
    EXPECT_EQ(logOf(TREE_ISCSI, "FAKEDEV"), kEntered);
}

TEST_F(DeviceReport, RepeatsTheInitiatorForEveryPath) {
    const auto port = addPort("iqn.host", "192.168.1.5");
    addPath(port, "iqn.disk", "192.168.1.10", "/dev/sdb", 0, "6006");
    addPath(port, "iqn.disk", "192.168.1.10", "/dev/sdc", 12, ":-( SCSI_Inquiry_Failed");
    EXPECT_EQ(logOf(TREE_ISCSI, "FAKEDEV"),
              kEntered + "\n"
                         "|_ Initiator IQN  iqn.host\n"
                         "|  |_ Target IQN iqn.disk\n"
                         "|  |  |_ Initiator_IP/MAC <--------> Target_IP\n"
                         "         192.168.1.5 <---> 192.168.1.10\n"
                         "|  |  |  |_ Device_Name: /dev/sdb sScsiOSLun: 0 LunId: 6006\n"
                         "\n"
                         "|_ Initiator IQN  iqn.host\n"
                         "|  |_ Target IQN iqn.disk\n"
                         "|  |  |_ Initiator_IP/MAC <--------> Target_IP\n"
                         "         192.168.1.5 <---> 192.168.1.10\n"
                         "|  |  |  |_ Device_Name: /dev/sdc sScsiOSLun: 12 LunId: "
                         ":-( SCSI_Inquiry_Failed\n"
                         "\n");
}

TEST_F(DeviceReport, ShowsPortsInTheOrderOfTheList) {
    addPath(addPort("iqn.host", "b"), "iqn.disk", "t", "/dev/sdb", 0, "6006");
    addPath(addPort("iqn.host", "a"), "iqn.disk", "t", "/dev/sdc", 0, "6007");
    const std::string text = logOf(TREE_ISCSI, "FAKEDEV");
    EXPECT_LT(text.find("         b <---> t\n"), text.find("         a <---> t\n"));
    EXPECT_NE(text.find("LunId: 6006\n\n\n|_ Initiator IQN"), std::string::npos);
}

TEST_F(DeviceReport, ShowsOnlyALineForAPortWithoutPaths) {
    addPort("iqn.host", "192.168.1.5");
    EXPECT_EQ(logOf(TREE_ISCSI, "FAKEDEV"), kEntered + "No target mappings for port");
}

TEST_F(DeviceReport, ThrowsWhenTheLogRefusesAReportLine) {
    addPath(addPort("iqn.host", "192.168.1.5"), "iqn.disk", "t", "/dev/sdb", 0, "6006");
    constexpr int kTrace = 1;
    const RefusingLog log(kTrace);
    char name[] = "FAKEDEV";
    EXPECT_EQ(messageOf<WriteFailedEx>([&] { printDeviceTree(TREE_ISCSI, name); }), "File write failed");
}

TEST(IscsiLunPath, BeginsEmpty) {
    const IscsiLunPath path;
    EXPECT_TRUE(path.tgt_wwnn.empty());
    EXPECT_TRUE(path.tgt_wwpn.empty());
    EXPECT_TRUE(path.uniqueLunId.empty());
    EXPECT_EQ(std::string(path.deviceName, sizeof path.deviceName), std::string(256, '\0'));
    EXPECT_EQ(path.sScsiOSLun, 0);
}

} // namespace
