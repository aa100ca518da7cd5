#include "host/iscsi_tree.hpp"

#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "foundation/exceptions.hpp"
#include "host/iscsi_listing.hpp"
#include "main/shared/device_register.hpp"
#include "main/shared/iscsi_model.hpp"
#include "main/shared/run_state.hpp"
#include "scsi/scsi_exceptions.hpp"
#include "tests/support/fake_commands.hpp"
#include "tests/support/fake_identity.hpp"
#include "tests/support/host_files.hpp"
#include "tests/support/log_capture.hpp"
#include "tests/support/refusing_log.hpp"
#include "tests/support/thrown.hpp"

namespace {

constexpr const char* kSessionCommand = "/sbin/iscsiadm -m session --print=3 2>/dev/null";
constexpr const char* kInitiatorFile = "/etc/iscsi/initiatorname.iscsi";
constexpr const char* kInitiator = "iqn.1993-08.org.debian:01:host";
constexpr const char* kTarget = "iqn.2001-05.com.example:disk";

std::string traced(const std::string& function, const std::string& lines) {
    return "Entered Function " + function + " Line #\n" + lines + "Left Function " + function + " Line #\n";
}

// What one line of the listing leaves in the log.
std::string lineLog(const std::string& lines) {
    return traced("processCmdOutput", lines);
}

// What the claim of a disk leaves in the log.
std::string claimLog(const std::string& disk) {
    return traced("addDeviceNameMap", "Added to DevMap " + std::to_string(EmulexHash(disk.c_str())) +
                                          " --> " + disk + " --> 4\n");
}

std::string registerLog(const std::string& initiator, const std::string& port, const std::string& target,
                        const std::string& address, const std::string& lun) {
    return "Register new iSCSI path: init_wwnn=" + initiator + ", init_wwpn=" + port +
           ", tgt_wwnn=" + target + ", tgt_wwpn=" + address + ", lun=" + lun + "\n";
}

std::string ignoringLog(const std::string& disk) {
    return "Ignoring device " + disk + ", some param missing!\n";
}

// The five report lines of a path.
std::string pathReport(const std::string& initiator, const std::string& target, const std::string& port,
                       const std::string& address, const std::string& disk, const std::string& lun,
                       const std::string& identifier) {
    return "|_ Initiator IQN  " + initiator + "\n|  |_ Target IQN " + target +
           "\n|  |  |_ Initiator_IP/MAC <--------> Target_IP\n         " + port + " <---> " + address +
           "\n|  |  |  |_ Device_Name: " + disk + " sScsiOSLun: " + lun + " LunId: " + identifier + "\n\n";
}

class IscsiTree : public testing::Test {
protected:
    IscsiTree() {
        const LogCapture log;
        DevMap.clear();
        gHostName = mHostName;
        mFiles.file(kInitiatorFile, std::string("InitiatorName=") + kInitiator + "\n");
        mListing.readInitiatorIQN();
    }

    void TearDown() override {
        DevMap.clear();
        gHostName = nullptr;
    }

    void feed(std::string line) { mListing.processCmdOutput(line.data()); }

    std::string logOf(const std::string& line) {
        const LogCapture log;
        feed(line);
        return log.text();
    }

    // A session up to its device list.
    void startSession(const std::string& interfaceAddress = "192.168.1.5",
                      const std::string& interfaceMac = "<empty>") {
        const LogCapture log;
        feed(std::string("Target: ") + kTarget + " (non-flash)\n");
        feed("\tCurrent Portal: 192.168.1.10:3260,1\n");
        feed("\t\tIface IPaddress: " + interfaceAddress + "\n");
        feed("\t\tIface HWaddress: " + interfaceMac + "\n");
        feed("\t\tAttached SCSI devices:\n");
    }

    // The log of the disk line and the one of its LUN before it.
    std::string addDisk(const std::string& disk, const std::string& lun) {
        const LogCapture log;
        feed("\t\tscsi2 Channel 00 Id 0 Lun: " + lun + "\n");
        feed("\t\t\tAttached scsi disk " + disk + "\t\tState: running\n");
        return log.text();
    }

    // The log of the two lines for a disk that is added so.
    static std::string diskLog(const std::string& disk, const std::string& lun, const std::string& port,
                               const std::string& ignoring = "") {
        return lineLog("LUN '" + lun + "'\n") +
               lineLog(traced("addIscsiPath",
                              claimLog("/dev/" + disk) +
                                  registerLog(kInitiator, port, kTarget, "192.168.1.10", lun) + ignoring) +
                       "Disk name '/dev/" + disk + "'\n");
    }

    char mHostName[kHostNameSize] = "hostA";
    HostFiles mFiles;
    FakeCommands mCommands;
    FakeIdentity mIdentity;
    IscsiListing mListing;
};

TEST_F(IscsiTree, TakesTheTargetWithoutTheRemarkBehindIt) {
    EXPECT_EQ(logOf("Target: iqn.2001-05.com.example:disk (non-flash)\n"),
              lineLog("Target IQN 'iqn.2001-05.com.example:disk'\n"));
}

TEST_F(IscsiTree, TakesTheTargetBehindAnyBlanks) {
    EXPECT_EQ(logOf(" \t Target:iqn.a\r\n"), lineLog("Target IQN 'iqn.a'\n"));
    EXPECT_EQ(logOf("Target: \t iqn.b\n"), lineLog("Target IQN 'iqn.b'\n"));
}

TEST_F(IscsiTree, TakesThePortalAddressWithoutPortAndGroup) {
    EXPECT_EQ(logOf("\tCurrent Portal: 192.168.1.10:3260,1\n"), lineLog("Target IP '192.168.1.10'\n"));
}

TEST_F(IscsiTree, KeepsTheFirstGroupOfAnIpv6Address) {
    EXPECT_EQ(logOf("\tCurrent Portal: [2001:db8::1]:3260,1\n"), lineLog("Target IP '[2001'\n"));
    EXPECT_EQ(logOf("\t\tIface IPaddress: fe80::1\n"), lineLog("Initiator IP 'fe80'\n"));
}

TEST_F(IscsiTree, TakesTheInterfaceAddresses) {
    EXPECT_EQ(logOf("\t\tIface HWaddress: 00:11:22:33:44:55\n"),
              lineLog("Initiator MAC '00:11:22:33:44:55'\n"));
    EXPECT_EQ(logOf("\t\tIface IPaddress: 192.168.1.5\n"), lineLog("Initiator IP '192.168.1.5'\n"));
}

TEST_F(IscsiTree, StoresAnEmptyMarkAsAnyValue) {
    EXPECT_EQ(logOf("\t\tIface HWaddress: <empty>\n"), lineLog("Initiator MAC '<empty>'\n"));
    EXPECT_EQ(logOf("\t\tIface IPaddress: <empty>\n"), lineLog("Initiator IP '<empty>'\n"));
}

TEST_F(IscsiTree, MatchesKeysWithTheirExactLengthAndCase) {
    for (const char* const line : {"Target : iqn.a\n",
                                   "target: iqn.a\n",
                                   "Targets: iqn.a\n",
                                   "Target iqn.a\n",
                                   "T\n",
                                   "Persistent Portal: 192.168.1.10:3260,1\n",
                                   "Current portal: 192.168.1.10:3260,1\n",
                                   "Current  Portal: 192.168.1.10\n",
                                   "Current Portal\n",
                                   "Iface Netdev: eth0\n",
                                   "Iface HWaddress : 00\n",
                                   "Iface IPAddress: 1.2.3.4\n",
                                   "Iface HWaddresx: 00\n",
                                   "Iface Transport: tcp\n",
                                   "Attached SCSI device: 1\n",
                                   "Attached SCSI devices\n",
                                   "Host Number: 2\tState: running\n",
                                   "",
                                   "\n",
                                   "   \t",
                                   ":",
                                   "************\n"}) {
        EXPECT_EQ(logOf(line), lineLog("")) << line;
    }
}

TEST_F(IscsiTree, EntersADeviceListOnce) {
    EXPECT_EQ(logOf("\t\tAttached SCSI devices:\n"), lineLog("Got device list start\n"));
    EXPECT_EQ(logOf("\t\tAttached SCSI devices:\n"), lineLog(""));
}

TEST_F(IscsiTree, LeavesTheDeviceListAtAPortalButNotAtATarget) {
    startSession();
    EXPECT_EQ(logOf("Target: iqn.other\n"), lineLog("Target IQN 'iqn.other'\n"));
    EXPECT_EQ(logOf("\t\tAttached SCSI devices:\n"), lineLog(""));
    EXPECT_EQ(logOf("\tCurrent Portal: 192.168.1.11:3260,1\n"), lineLog("Target IP '192.168.1.11'\n"));
    EXPECT_EQ(logOf("\t\tAttached SCSI devices:\n"), lineLog("Got device list start\n"));
}

TEST_F(IscsiTree, LooksForLunsAndDisksOnlyWithinADeviceList) {
    EXPECT_EQ(logOf("\t\tscsi2 Channel 00 Id 0 Lun: 0\n"), lineLog(""));
    EXPECT_EQ(logOf("\t\t\tAttached scsi disk sdb\t\tState: running\n"), lineLog(""));
    const LogCapture quiet;
    EXPECT_EQ(getDeviceType("/dev/sdb"), 0U);
}

TEST_F(IscsiTree, TakesTheLunBehindItsKeyAnywhereInAnAddressLine) {
    startSession();
    EXPECT_EQ(logOf("\t\tscsi2 Channel 00 Id 0 Lun: 12\n"), lineLog("LUN '12'\n"));
    EXPECT_EQ(logOf("sLun:7 Lun: 8\n"), lineLog("LUN '7'\n"));
    EXPECT_EQ(logOf("scsi2 Channel 00 Id 0 lun: 12\n"), lineLog(""));
    EXPECT_EQ(logOf("Scsi2 Channel 00 Id 0 Lun: 12\n"), lineLog(""));
}

TEST_F(IscsiTree, AddsADiskOfTheSession) {
    startSession();
    mIdentity.identifier("/dev/sdb", "6006");
    EXPECT_EQ(addDisk("sdb", "3"), diskLog("sdb", "3", "192.168.1.5"));
    EXPECT_EQ(mIdentity.questions(), std::vector<std::string>{"identifier /dev/sdb 4"});
    const LogCapture quiet;
    EXPECT_EQ(getDeviceType("/dev/sdb"), TREE_ISCSI);
    const IscsiPorts::List ports = mListing.takePorts();
    ASSERT_EQ(ports.size(), 1U);
    const IscsiInitiatorPort& port = *ports.front();
    EXPECT_STREQ(port.init_wwnn.c_str(), kInitiator);
    EXPECT_STREQ(port.init_wwpn.c_str(), "192.168.1.5");
    ASSERT_EQ(port.paths.size(), 1U);
    const IscsiLunPath& path = *port.paths.front();
    EXPECT_STREQ(path.tgt_wwnn.c_str(), kTarget);
    EXPECT_STREQ(path.tgt_wwpn.c_str(), "192.168.1.10");
    EXPECT_STREQ(path.uniqueLunId.c_str(), "6006");
    EXPECT_STREQ(path.deviceName, "/dev/sdb");
    EXPECT_EQ(path.sScsiOSLun, 3);
    for (const uint32 unused : path.mUnusedBefore) {
        EXPECT_EQ(unused, 0U);
    }
    for (const uint32 unused : path.mUnusedAfter) {
        EXPECT_EQ(unused, 0U);
    }
}

TEST_F(IscsiTree, TakesTheMacWithoutAnAddress) {
    startSession("<empty>", "00:11:22:33:44:55");
    EXPECT_EQ(addDisk("sdb", "0"), diskLog("sdb", "0", "00:11:22:33:44:55"));
}

TEST_F(IscsiTree, TakesTheInitiatorForThePortWhenBothAddressesAreEmptyMarks) {
    startSession("<empty>", "<empty>");
    EXPECT_EQ(addDisk("sdb", "0"), diskLog("sdb", "0", std::string(kInitiator) + ":0"));
    const IscsiPorts::List ports = mListing.takePorts();
    EXPECT_EQ(ports.size(), 1U);
}

TEST_F(IscsiTree, TakesTheInitiatorForThePortOfAnAddressOfZeros) {
    startSession("0.0.0.0", "00:11:22:33:44:55");
    EXPECT_EQ(addDisk("sdb", "0"), diskLog("sdb", "0", std::string(kInitiator) + ":0"));
}

TEST_F(IscsiTree, TakesTheInitiatorForThePortWithoutAddresses) {
    startSession("", "");
    EXPECT_EQ(addDisk("sdb", "0"), diskLog("sdb", "0", std::string(kInitiator) + ":0"));
}

TEST_F(IscsiTree, GivesTwoDisksOfOneInterfaceOnePort) {
    startSession();
    addDisk("sdb", "0");
    addDisk("sdc", "1");
    const IscsiPorts::List ports = mListing.takePorts();
    ASSERT_EQ(ports.size(), 1U);
    EXPECT_EQ(ports.front()->paths.size(), 2U);
}

TEST_F(IscsiTree, GivesEachInterfaceItsPort) {
    startSession("192.168.2.5");
    addDisk("sdb", "0");
    startSession("192.168.1.5");
    addDisk("sdc", "0");
    startSession("192.168.2.5");
    addDisk("sdd", "0");
    const IscsiPorts::List ports = mListing.takePorts();
    ASSERT_EQ(ports.size(), 2U);
    EXPECT_STREQ(ports.front()->init_wwpn.c_str(), "192.168.2.5");
    EXPECT_EQ(ports.front()->paths.size(), 2U);
    EXPECT_STREQ(ports.back()->init_wwpn.c_str(), "192.168.1.5");
}

TEST_F(IscsiTree, ClaimsButIgnoresADiskBeforeItsLun) {
    startSession();
    EXPECT_EQ(logOf("\t\t\tAttached scsi disk sdb\t\tState: running\n"),
              lineLog(traced("addIscsiPath",
                             claimLog("/dev/sdb") +
                                 registerLog(kInitiator, "192.168.1.5", kTarget, "192.168.1.10", "-1") +
                                 ignoringLog("/dev/sdb")) +
                      "Disk name '/dev/sdb'\n"));
    const IscsiPorts::List ports = mListing.takePorts();
    EXPECT_TRUE(ports.empty());
    const LogCapture quiet;
    EXPECT_EQ(getDeviceType("/dev/sdb"), TREE_ISCSI);
}

TEST_F(IscsiTree, ForgetsTheLunAfterEachDisk) {
    startSession();
    addDisk("sdb", "0");
    EXPECT_EQ(logOf("\t\t\tAttached scsi disk sdc\t\tState: running\n"),
              lineLog(traced("addIscsiPath",
                             claimLog("/dev/sdc") +
                                 registerLog(kInitiator, "192.168.1.5", kTarget, "192.168.1.10", "-1") +
                                 ignoringLog("/dev/sdc")) +
                      "Disk name '/dev/sdc'\n"));
}

TEST_F(IscsiTree, IgnoresADiskOfANegativeLun) {
    startSession();
    EXPECT_EQ(addDisk("sdb", "-5"), diskLog("sdb", "-5", "192.168.1.5", ignoringLog("/dev/sdb")));
}

TEST_F(IscsiTree, ReadsALunThatIsNoNumberAsZero) {
    startSession();
    const LogCapture log;
    feed("scsi2 Lun: x\n");
    feed("Attached scsi disk sdb\n");
    EXPECT_EQ(log.text(), lineLog("LUN 'x'\n") +
                              lineLog(traced("addIscsiPath", claimLog("/dev/sdb") +
                                                                 registerLog(kInitiator, "192.168.1.5",
                                                                             kTarget, "192.168.1.10", "0")) +
                                      "Disk name '/dev/sdb'\n"));
}

TEST_F(IscsiTree, ClampsALunBeyond32Bits) {
    startSession();
    for (const std::string lun : {"2147483648", "99999999999999999999999"}) {
        const std::string text = addDisk("sdb", lun);
        EXPECT_NE(text.find("tgt_wwpn=192.168.1.10, lun=2147483647\n"), std::string::npos) << text;
    }
    const std::string text = addDisk("sdb", "-99999999999");
    EXPECT_NE(text.find("tgt_wwpn=192.168.1.10, lun=-2147483648\n"), std::string::npos) << text;
}

TEST_F(IscsiTree, IgnoresADiskWithoutTarget) {
    startSession();
    {
        const LogCapture log;
        feed("Target: <empty>\n");
        feed("Current Portal: 192.168.1.10:3260,1\n");
        feed("Attached SCSI devices:\n");
    }
    const std::string port = std::string(kInitiator) + ":0";
    EXPECT_EQ(
        addDisk("sdb", "0"),
        lineLog("LUN '0'\n") +
            lineLog(traced("addIscsiPath", claimLog("/dev/sdb") +
                                               registerLog(kInitiator, port, "<empty>", "192.168.1.10", "0") +
                                               ignoringLog("/dev/sdb")) +
                    "Disk name '/dev/sdb'\n"));
}

TEST_F(IscsiTree, IgnoresADiskWithoutPortal) {
    startSession();
    {
        const LogCapture log;
        feed(std::string("Target: ") + kTarget + "\n"); // stays in the device list, forgets the portal
    }
    EXPECT_EQ(addDisk("sdb", "0"),
              lineLog("LUN '0'\n") +
                  lineLog(traced("addIscsiPath", claimLog("/dev/sdb") +
                                                     registerLog(kInitiator, std::string(kInitiator) + ":0",
                                                                 kTarget, "", "0") +
                                                     ignoringLog("/dev/sdb")) +
                          "Disk name '/dev/sdb'\n"));
}

TEST_F(IscsiTree, IgnoresADiskOfAnInitiatorThatIsAnEmptyMark) {
    {
        const LogCapture log;
        mFiles.file(kInitiatorFile, "InitiatorName=<empty>\n");
        mListing.readInitiatorIQN();
    }
    startSession();
    EXPECT_EQ(addDisk("sdb", "0"),
              lineLog("LUN '0'\n") +
                  lineLog(traced("addIscsiPath",
                                 claimLog("/dev/sdb") +
                                     registerLog("<empty>", "192.168.1.5", kTarget, "192.168.1.10", "0") +
                                     ignoringLog("/dev/sdb")) +
                          "Disk name '/dev/sdb'\n"));
}

TEST_F(IscsiTree, ForgetsTheInterfaceAtATargetAndAtAPortal) {
    startSession("192.168.1.5", "00:11:22:33:44:55");
    {
        const LogCapture log;
        feed("\tCurrent Portal: 192.168.1.10:3260,1\n");
        feed("\t\tAttached SCSI devices:\n");
    }
    EXPECT_EQ(addDisk("sdb", "0"), diskLog("sdb", "0", std::string(kInitiator) + ":0"));
}

TEST_F(IscsiTree, KeepsADiskWhoseIdentifierCannotBeRead) {
    startSession();
    mIdentity.identifier("/dev/sdb", throws<TimeOutEx>());
    EXPECT_EQ(addDisk("sdb", "0"), diskLog("sdb", "0", "192.168.1.5"));
    const IscsiPorts::List ports = mListing.takePorts();
    ASSERT_EQ(ports.size(), 1U);
    EXPECT_STREQ(ports.front()->paths.front()->uniqueLunId.c_str(), ":-( SCSI_Inquiry_Failed");
}

TEST_F(IscsiTree, CutsADiskPathAt127Characters) {
    startSession();
    const std::string path = "/dev/" + std::string(122, 'd');
    EXPECT_EQ(logOf("Attached scsi disk " + std::string(200, 'd') + "\n"),
              lineLog(traced("addIscsiPath",
                             claimLog(path) +
                                 registerLog(kInitiator, "192.168.1.5", kTarget, "192.168.1.10", "-1") +
                                 ignoringLog(path)) +
                      "Disk name '" + path + "'\n"));
}

TEST_F(IscsiTree, KeepsAtMost255CharactersOfADeviceName) {
    startSession();
    const LogCapture log;
    feed("scsi2 Lun: 0\n");
    mListing.addIscsiPath(std::string(300, 'd').c_str());
    const IscsiPorts::List ports = mListing.takePorts();
    ASSERT_EQ(ports.size(), 1U);
    EXPECT_EQ(ports.front()->paths.front()->deviceName, std::string(255, 'd'));
}

TEST_F(IscsiTree, TakesADiskNameRightBehindItsKey) {
    startSession();
    EXPECT_EQ(logOf("Attached scsi disksdb\n"),
              lineLog(traced("addIscsiPath",
                             claimLog("/dev/sdb") +
                                 registerLog(kInitiator, "192.168.1.5", kTarget, "192.168.1.10", "-1") +
                                 ignoringLog("/dev/sdb")) +
                      "Disk name '/dev/sdb'\n"));
}

// The initiator's name.

TEST_F(IscsiTree, ReadsTheInitiatorFromTheFirstMatchingLine) {
    mFiles.file(kInitiatorFile, "## DO NOT EDIT\n#InitiatorName=iqn.comment\nInitiatorAlias=x\n"
                                " \tInitiatorName=iqn.first # mine\nInitiatorName=iqn.second\n");
    const LogCapture log;
    EXPECT_EQ(mListing.readInitiatorIQN(), 0U);
    EXPECT_EQ(log.text(), traced("readInitiatorIQN", "InitiatorIQN iqn.first\n"));
}

TEST_F(IscsiTree, ReadsALongInitiatorWhole) {
    const std::string name(5000, 'n');
    mFiles.file(kInitiatorFile, std::string(3000, '#') + "\nInitiatorName=" + name);
    const LogCapture log;
    EXPECT_EQ(mListing.readInitiatorIQN(), 0U);
    EXPECT_EQ(log.text(), traced("readInitiatorIQN", "InitiatorIQN " + name + "\n"));
}

TEST_F(IscsiTree, TakesTheHostsNameForAnEmptyInitiator) {
    mFiles.file(kInitiatorFile, "InitiatorName= iqn.behind-a-blank\n");
    {
        const LogCapture log;
        EXPECT_EQ(mListing.readInitiatorIQN(), 0U);
        EXPECT_EQ(log.text(),
                  traced("readInitiatorIQN", "InitiatorIQN \n"
                                             "Failed to find the Initiator IQN, using hostname!\n"));
    }
    startSession();
    EXPECT_NE(addDisk("sdb", "0").find("init_wwnn=hostA, "), std::string::npos);
}

TEST_F(IscsiTree, KeepsTheInitiatorItHasWhenTheFileNamesNone) {
    mFiles.file(kInitiatorFile, "# nothing\n");
    const LogCapture log;
    EXPECT_EQ(mListing.readInitiatorIQN(), 0U);
    EXPECT_EQ(log.text(), traced("readInitiatorIQN", ""));
}

class IscsiTreeWithoutInitiator : public testing::Test {
protected:
    IscsiTreeWithoutInitiator() { gHostName = mHostName; }
    void TearDown() override { gHostName = nullptr; }

    IscsiListing mListing;
    char mHostName[kHostNameSize] = "hostA";
    HostFiles mFiles;
    FakeCommands mCommands;
};

TEST_F(IscsiTreeWithoutInitiator, TakesTheHostsNameWhenTheFileNamesNone) {
    mFiles.file(kInitiatorFile, "");
    const LogCapture log;
    EXPECT_EQ(mListing.readInitiatorIQN(), 0U);
    EXPECT_EQ(log.text(), traced("readInitiatorIQN", "Failed to find the Initiator IQN, using hostname!\n"));
}

TEST_F(IscsiTreeWithoutInitiator, FailsWithoutItsFile) {
    const LogCapture log;
    EXPECT_EQ(mListing.readInitiatorIQN(), 5U);
    EXPECT_EQ(log.text(), "Entered Function readInitiatorIQN Line #\n"
                          "Failed to open /etc/iscsi/initiatorname.iscsi!\n");
}

const std::string kBanner = "\n================================================\n"
                            "============= ISCSI DEVICE DETAILS ============="
                            "\n================================================\n";

TEST_F(IscsiTreeWithoutInitiator, IsNotBuilt) {
    mCommands.answer(kSessionCommand, "Target: iqn.a\n");
    const LogCapture log;
    BuildIscsiTree_Linux();
    EXPECT_EQ(log.text(),
              traced("BuildIscsiTree_Linux", kBanner + "Entered Function readInitiatorIQN Line #\n"
                                                       "Failed to open /etc/iscsi/initiatorname.iscsi!\n"
                                                       "Failed to read Initiator IQN \n\n"
                                                       "Cannot proceed with building ISCSI tree\n"));
    EXPECT_EQ(FakeCommands::openStreams(), 1U); // the listing is left alone
}

const std::string kInitiatorLog =
    traced("readInitiatorIQN", std::string("InitiatorIQN ") + kInitiator + "\n");
const std::string kPrinting = "Entered Function printDeviceTree Line #\n";

TEST_F(IscsiTree, IsBuiltWithoutSessions) {
    const LogCapture log;
    BuildIscsiTree_Linux();
    EXPECT_EQ(log.text(), traced("BuildIscsiTree_Linux", kBanner + kInitiatorLog + kPrinting));
    EXPECT_EQ(mCommands.runs(), std::vector<std::string>{kSessionCommand});
}

TEST_F(IscsiTree, IsNotBuiltWhenTheCommandDoesNotStart) {
    mCommands.answer(kSessionCommand, FakeRun{.output = "", .canStart = false});
    const LogCapture log;
    BuildIscsiTree_Linux();
    EXPECT_EQ(log.text(),
              traced("BuildIscsiTree_Linux", kBanner + "Failed to open pipe for /sbin/iscsiadm!\n\n"
                                                       "Cannot proceed with building ISCSI tree\n"));
}

TEST_F(IscsiTree, IsBuiltAndPrintedFromTheListing) {
    mCommands.answer(kSessionCommand, std::string("iSCSI Transport Class version 2.0-870\n"
                                                  "Target: ") +
                                          kTarget +
                                          " (non-flash)\n"
                                          "\tCurrent Portal: 192.168.1.10:3260,1\n"
                                          "\t\tIface IPaddress: 192.168.1.5\n"
                                          "\t\tIface HWaddress: <empty>\n"
                                          "\t\tAttached SCSI devices:\n"
                                          "\t\tscsi2 Channel 00 Id 0 Lun: 0\n"
                                          "\t\t\tAttached scsi disk sdb\t\tState: running\n"
                                          "\t\tscsi2 Channel 00 Id 0 Lun: 1\n"
                                          "\t\t\tAttached scsi disk sdc\t\tState: running");
    mIdentity.identifier("/dev/sdb", "6006");
    const LogCapture log;
    BuildIscsiTree_Linux();
    EXPECT_EQ(
        log.text(),
        traced(
            "BuildIscsiTree_Linux",
            kBanner + kInitiatorLog + lineLog("") + lineLog(std::string("Target IQN '") + kTarget + "'\n") +
                lineLog("Target IP '192.168.1.10'\n") + lineLog("Initiator IP '192.168.1.5'\n") +
                lineLog("Initiator MAC '<empty>'\n") + lineLog("Got device list start\n") +
                diskLog("sdb", "0", "192.168.1.5") + diskLog("sdc", "1", "192.168.1.5") + kPrinting + "\n" +
                pathReport(kInitiator, kTarget, "192.168.1.5", "192.168.1.10", "/dev/sdb", "0", "6006") +
                pathReport(kInitiator, kTarget, "192.168.1.5", "192.168.1.10", "/dev/sdc", "1",
                           ":-( SCSI_Inquiry_Failed")));
    EXPECT_EQ(FakeCommands::openStreams(), 0U);
    EXPECT_TRUE(gIscsiPortList.empty());
}

TEST_F(IscsiTree, EndsAtAReadErrorOfTheListing) {
    mCommands.answer(kSessionCommand, FakeRun{.output = "Target: iqn.a\n", .readFails = true});
    const LogCapture log;
    BuildIscsiTree_Linux();
    EXPECT_EQ(log.text(), traced("BuildIscsiTree_Linux",
                                 kBanner + kInitiatorLog + lineLog("Target IQN 'iqn.a'\n") + kPrinting));
}

TEST_F(IscsiTree, LetsALogThatIsFullOut) {
    const RefusingLog log;
    EXPECT_EQ(messageOf<WriteFailedEx>([&] { mListing.readInitiatorIQN(); }), "File write failed\n");
    std::string line = "Target: iqn.a\n";
    EXPECT_EQ(messageOf<WriteFailedEx>([&] { mListing.processCmdOutput(line.data()); }),
              "File write failed\n");
}

TEST_F(IscsiTree, ClosesTheListingWhenTheLogIsFull) {
    mCommands.answer(kSessionCommand, "Target: iqn.a\n");
    const RefusingLog log(6); // the lines up to the entry of the first line of the listing
    EXPECT_THROW(BuildIscsiTree_Linux(), WriteFailedEx);
    EXPECT_EQ(mCommands.runs(), std::vector<std::string>{kSessionCommand});
    EXPECT_EQ(FakeCommands::openStreams(), 0U);
}

// The two text routines.

TEST(SkipBlanks, StopsAtTheFirstThatIsNeitherSpaceNorTab) {
    char text[] = " \t \nx";
    EXPECT_EQ(skipBlanks(text), text + 3);
    EXPECT_EQ(skipBlanks(text + 4), text + 4);
    char blanks[] = "  ";
    EXPECT_EQ(skipBlanks(blanks), blanks + 2);
}

TEST(CutToken, EndsTheTextAtItsFirstWhiteSpace) {
    for (const std::string rest : {" b", "\tb", "\rb", "\nb"}) {
        std::string text = "token" + rest;
        EXPECT_EQ(cutToken(text.data()), text.data());
        EXPECT_STREQ(text.c_str(), "token") << rest;
    }
}

TEST(CutToken, LeavesATextWithoutWhiteSpaceAlone) {
    char text[] = "a\vb:c";
    EXPECT_STREQ(cutToken(text), "a\vb:c");
    char empty[] = "";
    EXPECT_STREQ(cutToken(empty), "");
}

} // namespace
