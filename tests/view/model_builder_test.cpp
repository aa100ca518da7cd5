#include "view/read/model_builder.hpp"

#include <cstddef>
#include <iomanip>
#include <sstream>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "tests/view/reading.hpp"

namespace {

using view::Model;

using Lines = std::vector<std::string>;

const std::string kOpening = "Going to open Adapter #0 - 'acme-0'\n";
const std::string kAdapterLines = "|_ Adapter wwnn 20:01\n|  |_ Initiator wwpn 10:01\n";
const std::string kTargetLine = "|  |  |_ Target wwnn 50:01 wwpn 52:01 bus 2 target# 3\n";

std::string lunLine(const std::string& device, const std::string& identifier, const std::string& lun = "4") {
    return "|  |  |  |_ lun name " + device + " luid " + identifier + " oslun " + lun +
           " fcid 66049 fcplun 0" + lun + "\n";
}

// What the log has of a LUN whose page 83h holds an NAA designator, up to its unique identifier.
std::string identified(const std::string& device, const std::string& identifier) {
    return "Added to DevMap 12 --> " + device +
           " --> 1\nEntered Function HA_GetScsiUniqueLunId Line 1\nGet LunID\n" +
           "Found NaaId: " + identifier + " \nOld Unique LunId = x, New Unique LunId = " + identifier +
           "\nUniqueLunid = " + identifier + " size = 1\n";
}

// Problems and notes, one a line: severity, tree, subject, cause, line.
Lines problemsOf(const Model& model) {
    Lines lines;
    const auto problems = view::toJson(model)["problems"];
    for (const auto& problem : problems) {
        lines.push_back(problem["severity"].get<std::string>() + ", " + problem["tree"].get<std::string>() +
                        ", " + problem["subject"].get<std::string>() + ": " +
                        problem["cause"].get<std::string>() + ", line " + problem["line"].dump());
    }
    return lines;
}

// The problems of a run whose texts are `texts`; line 1 is its beginning.
Lines problemsOfRun(const std::string& texts) {
    return problemsOf(modelOf(kRunStart + texts + kRunEnd));
}

TEST(ModelBuilder, JoinsThePartsOfAnFcPath) {
    const Model model = modelOf(
        kRunStart + kFcBanner + kOpening + "Adapter info: Manufacturer ACME Model A 8 NumPorts=1\n" +
        "The number of targets is 1\nVendor DISKCO ProductId ARRAY 9 ProductRev 1.0\n" +
        identified("/dev/sdb", "6") + "Pseudo Device for Unique LunId 6 is emcpowera\n" + kAdapterLines +
        kTargetLine + lunLine("/dev/sdb", "6") + "Time taken to build tree: 12.50 milliseconds\n" + kRunEnd);
    EXPECT_EQ(
        sectionOf(model, "fc"),
        R"({"state":"built","loadMilliseconds":null,"buildMilliseconds":12.5,"adapters":[{"number":0,)"
        R"("name":"acme-0","manufacturer":"ACME","model":"A 8","node":"20:01","state":"reported","cause":null,)"
        R"("mappingEntries":1,"initiators":["10:01"],"unlisted":[]}],"paths":[{"adapter":0,)"
        R"("initiator":"10:01","targetNode":"50:01","targetPort":"52:01","bus":2,"target":3,)"
        R"("device":"/dev/sdb","lun":4,"fcId":66049,"fcpLun":"4","identifier":"6","identifierKind":"naa",)"
        R"("vendor":"DISKCO","product":"ARRAY 9","revision":"1.0","pseudoDevice":"emcpowera"}]})");
    EXPECT_EQ(problemsOf(model), Lines());
}

// A dump, as the log has it.
std::string dump(const std::vector<unsigned>& bytes) {
    std::ostringstream text;
    text << "Going to dump " << bytes.size() << " bytes\n" << std::hex;
    for (std::size_t i = 0; i < bytes.size(); ++i) {
        text << "Byte " << std::dec << i << ": 0x" << std::hex << bytes[i];
    }
    return text.str() + '\n';
}

// What the log has of the two commands that read page 83h: their CDBs, and the dumps of what came back. A
// page of four bytes has an empty list of designators.
std::string page83Read(const std::vector<unsigned>& page) {
    const std::vector<unsigned> header(page.begin(), page.begin() + 4);
    const std::string cdb = "SCSI Inquiry CDB Dump:" + dump({0x12, 1, 0x83, 0, 4, 0});
    return cdb + "Going to dump the DI VPD page heder\n" + dump(header) +
           (page.size() > 4 ? cdb + "Going to dump entire DI VPD page\n" + dump(page) : "");
}

// The bytes of an answer in hexadecimal; "not read" when there is none.
std::string shown(const view::Page83& page83) {
    std::ostringstream text;
    text << std::hex << std::setfill('0');
    if (page83 == nullptr) {
        return "not read";
    }
    for (const unsigned byte : *page83) {
        text << std::setw(2) << byte;
    }
    return text.str();
}

const std::string kIdentification = "Entered Function HA_GetScsiUniqueLunId Line 1\nGet LunID\n";

TEST(ModelBuilder, KeepsThePage83OfEachFcPathAndOfALunThatTheTreeDoesNotList) {
    const auto lun = [](const std::string& device, unsigned number) {
        return "Added to DevMap 12 --> " + device + " --> 1\n" + kIdentification +
               page83Read({0, 0x83, 0, 5, 1, 3, 0, 1, number}) + dump({1, 3, 0, 1, number}) +
               "UniqueLunid = 6 size = 1\n";
    };
    const Model model =
        modelOf(kRunStart + kFcBanner + kOpening + lun("/dev/sdb", 0x6b) + lun("/dev/sdc", 0x6c) +
                kAdapterLines + kTargetLine + lunLine("", "", "0") + lunLine("/dev/sdb", "6") +
                "|  |_ Initiator wwpn 10:02\n" + kTargetLine + lunLine("/dev/sdb", "6") + kRunEnd);
    ASSERT_EQ(model.fc.paths.size(), 2);
    EXPECT_EQ(shown(model.fc.paths[0].page83), "00830005010300016b");
    EXPECT_EQ(model.fc.paths[1].page83, model.fc.paths[0].page83);
    EXPECT_EQ(shown(model.fc.adapters.at(0).unlisted.at(0).page83), "00830005010300016c");
}

TEST(ModelBuilder, KeepsThePage83OfEachIscsiPath) {
    const auto path = [](const std::string& device) {
        return "Register new iSCSI path: init_wwnn=i, init_wwpn=a, tgt_wwnn=t, tgt_wwpn=b, lun=1\n"
               "|_ Initiator IQN  i\n|  |_ Target IQN t\n         a <---> b\n"
               "|  |  |  |_ Device_Name: " +
               device + " sScsiOSLun: 1 LunId: 6\n";
    };
    const Model model =
        modelOf(kRunStart + kIscsiBanner + "Target IQN 't'\n" + "Added to DevMap 12 --> /dev/sdb --> 4\n" +
                kIdentification + page83Read({0, 0x83, 0, 5, 1, 3, 0, 1, 0x6b}) + path("/dev/sdb") +
                "Added to DevMap 12 --> /dev/sdc --> 4\n" + kIdentification + path("/dev/sdc") + kRunEnd);
    ASSERT_EQ(model.iscsi.paths.size(), 2);
    EXPECT_EQ(shown(model.iscsi.paths[0].page83), "00830005010300016b");
    EXPECT_EQ(shown(model.iscsi.paths[1].page83), "not read");
}

TEST(ModelBuilder, TellsAnEmptyPage83AndAPartOfOneFromOneThatWasNotRead) {
    const Model model = modelOf(
        kRunStart + kDasBanner + kIdentification + page83Read({0, 0x83, 0, 5, 1, 3, 0, 1, 0x6b}) +
        diskLine("/dev/sda", "6B") + kIdentification + page83Read({0, 0x83, 0, 0}) +
        diskLine("/dev/sdb", "host::/dev/sdb") + kIdentification + diskLine("/dev/sdc", "host::/dev/sdc") +
        kIdentification + "Going to dump entire DI VPD page\nGoing to dump 9 bytes\n" +
        "Byte 0: 0x0Byte 1: 0x83Byte 7: 0x1\nByte 2: 0x0\n" + diskLine("/dev/sdd", "host::/dev/sdd") +
        kRunEnd);
    ASSERT_EQ(model.direct.devices.size(), 4);
    EXPECT_EQ(shown(model.direct.devices[0].page83), "00830005010300016b");
    EXPECT_EQ(shown(model.direct.devices[1].page83), "00830000");
    EXPECT_EQ(shown(model.direct.devices[2].page83), "not read");
    EXPECT_EQ(shown(model.direct.devices[3].page83), "008300");
}

TEST(ModelBuilder, ReadsAnFcTreeWhoseProgressIsMissing) {
    const Model model = modelOf(kAdapterLines + kTargetLine + lunLine("/dev/sdb", "6") + kAdapterLines +
                                kTargetLine + lunLine("/dev/sdc", "7") + kRunEnd);
    ASSERT_EQ(model.fc.paths.size(), 2);
    EXPECT_EQ(model.fc.adapters.size(), 2);
    EXPECT_EQ(model.fc.paths[1].adapter, 1);
    EXPECT_EQ(model.fc.paths[1].device, "/dev/sdc");
}

TEST(ModelBuilder, TakesAnEmptySlotForNoPathAndTheLunThatItDisplacedForUnlisted) {
    const Model model =
        modelOf(kRunStart + kFcBanner + kOpening + identified("/dev/sdb", "6") + identified("/dev/sdc", "7") +
                kAdapterLines + kTargetLine + lunLine("", "", "0") + lunLine("/dev/sdb", "6") + kRunEnd);
    ASSERT_EQ(model.fc.paths.size(), 1);
    EXPECT_EQ(model.fc.paths[0].device, "/dev/sdb");
    ASSERT_EQ(model.fc.adapters.size(), 1);
    ASSERT_EQ(model.fc.adapters[0].unlisted.size(), 1);
    EXPECT_EQ(model.fc.adapters[0].unlisted[0].device, "/dev/sdc");
    EXPECT_EQ(
        problemsOf(model),
        Lines{
            "problem, fc, /dev/sdc: identified as 7, but not listed in the tree: an earlier LUN of the adapter "
            "was dropped, and the tree lists as many entries as were kept, counted from the first, line 21"});
}

TEST(ModelBuilder, TellsWhichLunWasDroppedAndWhy) {
    EXPECT_EQ(
        problemsOfRun(kFcBanner + kOpening +
                      "Failed in getting the VendorId for device /dev/sdb Lun 5 Under Target 52:01 ignoring\n"
                      "Entered Function HA_GetScsiUniqueLunId Line 1\nGet LunID\nTimeout\n"
                      "Time-out in Reading VPD 0x83 Page\nioctl failed, error code = 5\n"
                      "SCSI Ioctl Failure for Std Inquiry Data\n"
                      "Failed in getting the uniqueLunId for device /dev/sdb ignoring\n"),
        Lines{
            "problem, fc, /dev/sdb (LUN 5 of target 52:01): dropped: reading page 0x83 timed out; the standard "
            "INQUIRY failed in the kernel (errno 5, Input/output error), line 11"});
}

TEST(ModelBuilder, TellsAtMostFourCauses) {
    std::string texts = kFcBanner + kOpening;
    for (unsigned i = 0; i < 9; ++i) {
        texts += "GotStatus:Category=2; Code=" + std::to_string(i) + ";\nSCSI Error for VPD 0x83 Inquiry\n";
    }
    const std::string cause = "reading page 0x83 ended with a SCSI error (SCSI status ";
    EXPECT_EQ(problemsOfRun(texts + "Failed in getting the uniqueLunId for device /dev/sdb ignoring\n"),
              Lines{"problem, fc, /dev/sdb: dropped: " + cause + "0); " + cause + "1); " + cause + "2); " +
                    cause + "3), line 22"});
}

TEST(ModelBuilder, NotesALunWithoutADeviceOnceForBothPasses) {
    const std::string unnamed = "Device Name Unassigned for Lun 5 under Target 52:01 ignoring\n";
    EXPECT_EQ(
        problemsOfRun(kFcBanner + kOpening + unnamed + unnamed),
        Lines{
            "problem, fc, LUN 5: dropped: target 52:01 offers it, but the host has no device for it, line 4"});
}

TEST(ModelBuilder, TellsWhyAnAdapterIsMissing) {
    EXPECT_EQ(
        problemsOfRun(kFcBanner + kOpening + "Failed to get adapter attributes - HBA_STATUS_ERROR\n" +
                      "Exception occured while opening adapter: acme-0\n" + kOpening +
                      "Encountered non-supported Adapter - HBA_STATUS_ERROR_NOT_SUPPORTED\n"),
        (Lines{
            "problem, fc, acme-0: abandoned, none of its LUNs is reported: its attributes could not be read: "
            "HBA_STATUS_ERROR, line 5",
            "note, fc, acme-0: its HBA library does not support it: HBA_STATUS_ERROR_NOT_SUPPORTED, line 7"}));
}

TEST(ModelBuilder, TellsWhyATreeEnded) {
    EXPECT_EQ(
        problemsOfRun(kFcBanner + "Failed to load HBAAPI library : HBA_STATUS_ERROR\n" +
                      "Caught an Hbaapi Exception in testing 'BuildFcTree\n'" + kIscsiBanner +
                      "Failed to open pipe for /sbin/iscsiadm!\n\nCannot proceed with building ISCSI tree\n" +
                      kDasBanner + "Caught exception while building DAS tree: no memory\n\n"),
        (Lines{"problem, fc, FC: the tree was ended early: the HBA library could not be loaded: "
               "HBA_STATUS_ERROR, line 4",
               "problem, iscsi, ISCSI: the tree was ended early: iscsiadm could not be started, line 8",
               "problem, direct, DAS: the tree was ended early: no memory, line 10"}));
}

TEST(ModelBuilder, TakesAHostWithoutAdaptersForABuiltTree) {
    const Model model =
        modelOf(kRunStart + kFcBanner +
                "Caught exception while building FC tree: There are no adapters on the system\n\n" + kRunEnd);
    EXPECT_EQ(model.fc.state, view::TreeState::Built);
    EXPECT_EQ(problemsOf(model),
              Lines{"note, fc, FC: the HBA library lists no Fibre Channel adapter, line 3"});
}

TEST(ModelBuilder, JoinsThePartsOfAnIscsiPath) {
    const Model model = modelOf(
        kRunStart + kIscsiBanner +
        "Target IQN 'iqn.t'\nTarget IP '10.0.0.2'\nAdded to DevMap 1 --> /dev/sdc --> 4\n" +
        "Entered Function HA_GetScsiUniqueLunId Line 1\nFound T10 Id: ACME \nOld Unique LunId = x, New Unique LunId = "
        "ACME\nRegister new iSCSI path: init_wwnn=iqn.i, init_wwpn=10.0.0.1, tgt_wwnn=iqn.t, tgt_wwpn=10.0.0.2, lun=7\n"
        "|_ Initiator IQN  iqn.i\n|  |_ Target IQN iqn.t\n         10.0.0.1 <---> 10.0.0.2\n"
        "|  |  |  |_ Device_Name: /dev/sdc sScsiOSLun: 7 LunId: ACME\n\n" +
        kRunEnd);
    EXPECT_EQ(
        sectionOf(model, "iscsi"),
        R"({"state":"built","paths":[{"initiatorIqn":"iqn.i","initiatorPort":"10.0.0.1","targetIqn":"iqn.t",)"
        R"("targetAddress":"10.0.0.2","device":"/dev/sdc","lun":7,"identifier":"ACME","identifierKind":"t10"}]})");
    EXPECT_EQ(problemsOf(model), Lines());
}

TEST(ModelBuilder, TellsWhyAnIscsiDiskHasNoIdentifier) {
    const Model model = modelOf(
        kRunStart + kIscsiBanner +
        "Target IQN 'iqn.t'\nTarget IP '10.0.0.2'\nAdded to DevMap 1 --> /dev/sdc --> 4\n" +
        "Entered Function HA_GetScsiUniqueLunId Line 1\nCannot do Scsi Inquiry on /dev/sdc - No such device\n" +
        "Register new iSCSI path: init_wwnn=iqn.i, init_wwpn=a, tgt_wwnn=iqn.t, tgt_wwpn=b, lun=7\n"
        "|  |_ Target IQN iqn.t\n|  |  |  |_ Device_Name: /dev/sdc sScsiOSLun: 7 LunId: :-( SCSI_Inquiry_Failed\n\n" +
        kRunEnd);
    ASSERT_EQ(model.iscsi.paths.size(), 1);
    EXPECT_EQ(model.iscsi.paths[0].identifier.kind, view::IdentifierKind::None);
    EXPECT_EQ(
        problemsOf(model),
        Lines{
            "problem, iscsi, /dev/sdc (LUN 7 of iqn.t): its identifier could not be read: the device node could "
            "not be opened: No such device, line 10"});
}

TEST(ModelBuilder, TellsWhatAnIgnoredIscsiDiskLacks) {
    EXPECT_EQ(
        problemsOfRun(
            kIscsiBanner + "Target IQN 'iqn.t'\nAdded to DevMap 1 --> /dev/sdc --> 4\n" +
            "Register new iSCSI path: init_wwnn=iqn.i, init_wwpn=<empty>, tgt_wwnn=iqn.t, tgt_wwpn=, "
            "lun=-1\nIgnoring device /dev/sdc, some param missing!\n"),
        Lines{
            "problem, iscsi, /dev/sdc: not reported: the session listing does not give its initiator address, "
            "target address, LUN number, line 6"});
}

TEST(ModelBuilder, NotesASessionWithoutDisksOnce) {
    EXPECT_EQ(problemsOfRun(kIscsiBanner + "Target IQN 'iqn.t'\nTarget IP '10.0.0.2'\n" + kDasBanner),
              Lines{"note, iscsi, iqn.t: the session to 10.0.0.2 has no disks, line 3"});
}

TEST(ModelBuilder, KnowsADirectDiskByItsHostAndTheReason) {
    const Model model =
        modelOf(kRunStart + kDasBanner + "Entered Function HA_GetScsiUniqueLunId Line 1\n" +
                "ioctl failed, error code = 25\n\nCaught exception -> ioctl failed, error code = 25\n : "
                "Adding host name as LUN ID if the device is DAS and rejecting otherwise...\n" +
                diskLine("/dev/vda", "db1::/dev/vda") + kRunEnd);
    EXPECT_EQ(sectionOf(model, "direct"),
              R"({"state":"built","devices":[{"device":"/dev/vda","identifier":"db1::/dev/vda",)"
              R"("identifierKind":"host-name","names":null}]})");
    EXPECT_EQ(model.host, "db1");
    EXPECT_EQ(problemsOf(model),
              Lines{"note, direct, /dev/vda: known by the host's name only: the first INQUIRY failed "
                    "(errno 25, Inappropriate ioctl for device), line 8"});
}

// The log of a direct disk whose page 83h could not be read, for the reason in `texts`.
std::string unreadDisk(const std::string& texts) {
    return "Entered Function HA_GetScsiUniqueLunId Line 1\nGet LunID\n" + texts +
           diskLine("/dev/sda", "db1::/dev/sda");
}

TEST(ModelBuilder, TakesADirectDiskThatACommandDoesNotReachForAProblem) {
    const std::string known = "direct, /dev/sda: known by the host's name only: reading page 0x83 ";
    EXPECT_EQ(problemsOfRun(kDasBanner + unreadDisk("Timeout\nTime-out in Reading VPD 0x83 Page\n")),
              Lines{"problem, " + known + "timed out, line 7"});
    EXPECT_EQ(problemsOfRun(kDasBanner + unreadDisk("ioctl failed, error code = 19\n\nSCSI Ioctl Failure for "
                                                    "VPD 0x83 Page\n")),
              Lines{"problem, " + known + "failed in the kernel (errno 19, No such device), line 8"});
    EXPECT_EQ(problemsOfRun(kDasBanner + unreadDisk("TransportError: Category=4; Code=2;\nSCSI Error for VPD "
                                                    "0x83 Inquiry\n")),
              Lines{"problem, " + known + "ended with a SCSI error (the transport failed), line 7"});
    EXPECT_EQ(problemsOfRun(kDasBanner + unreadDisk("Malformed VPD 0x83 Page\n")),
              Lines{"note, direct, /dev/sda: known by the host's name only: page 0x83 is malformed, line 6"});
}

TEST(ModelBuilder, TellsTheKindOfAnIdentifierByTheDesignatorThatWasChosen) {
    const auto kindOf = [](const std::string& found) {
        const Model model =
            modelOf(kDasBanner + "Entered Function HA_GetScsiUniqueLunId Line 1\n" + found +
                    "Old Unique LunId = x, New Unique LunId = x\n" + diskLine("/dev/sda", "x") + kRunEnd);
        return model.direct.devices.at(0).identifier.kind;
    };
    EXPECT_EQ(kindOf("Found T10 Id:  \nFound ScsiName ID: x \n"), view::IdentifierKind::ScsiName);
    EXPECT_EQ(kindOf("Found T10 Id: y \nFound T10 Id:  \nFound MD5ID: x \n"), view::IdentifierKind::Md5);
    EXPECT_EQ(kindOf("Found T10 Id: x \nFound Eui64Id: y \n"), view::IdentifierKind::T10);
    EXPECT_EQ(kindOf("Found T10 Id: y \nFound NaaId:  \n"), view::IdentifierKind::Naa);
}

TEST(ModelBuilder, TakesAMissingBeginningForAProblem) {
    EXPECT_EQ(
        problemsOf(modelOf("Got ULID\n" + kDasBanner + diskLine("/dev/sda", "6") + kRunEnd)),
        Lines{"problem, run, log: its beginning is missing: the report holds only what stands behind it, "
              "line 1"});
}

TEST(ModelBuilder, TakesNoTextThatStandsInTheSectionOfAnother) {
    const Model model = modelOf(kRunStart + kFcBanner + kOpening + diskLine("/dev/evil", "6") + kDasBanner +
                                diskLine("/dev/sda", "7") + kFcBanner + kAdapterLines + kRunEnd);
    EXPECT_EQ(
        sectionOf(model, "direct"),
        R"({"state":"built","devices":[{"device":"/dev/sda","identifier":"7","identifierKind":"unknown","names":null}]})");
    EXPECT_EQ(model.fc.adapters.size(), 1);
    EXPECT_EQ(
        problemsOf(model),
        Lines{"problem, run, log: lines that look like Morvane's own stand where it does not write them (4 "
              "in all): they are not taken; a device, a library or a command may have written them, line "
              "4"});
}

TEST(ModelBuilder, TellsATreeThatIsNotConfiguredFromOneThatAnErrorEnded) {
    const auto stateAfter = [](const std::string& texts) {
        return modelOf(kRunStart + kIscsiBanner + texts + kRunEnd).iscsi.state;
    };
    const std::string stopped = "Cannot proceed with building ISCSI tree\n";
    EXPECT_EQ(stateAfter("Failed to open /etc/iscsi/initiatorname.iscsi!\n" + stopped),
              view::TreeState::NotConfigured);
    EXPECT_EQ(stateAfter("Failed to open pipe for /sbin/iscsiadm!\n\n" + stopped), view::TreeState::Ended);
    EXPECT_EQ(stateAfter("Caught exception while building ISCSI tree: no memory\n\n"),
              view::TreeState::Ended);
}

TEST(ModelBuilder, TellsWhyADirectDeviceIsNotSupported) {
    const std::string begun = "Entered Function HA_GetScsiUniqueLunId Line 1\n";
    EXPECT_EQ(
        problemsOfRun(
            kDasBanner + begun + "--------> Device Name: |/dev/sr0| is not supported\n\n" + begun +
            "Cannot do Scsi Inquiry on /dev/sdb - No medium found\n--------> Device Name: |/dev/sdb| is "
            "not supported\n\n"),
        (Lines{
            "problem, direct, /dev/sdb: not reported: the device node could not be opened: No medium found, "
            "line 8",
            "note, direct, /dev/sr0: not reported: its device type is neither disk nor storage array "
            "controller, line 4"}));
}

TEST(ModelBuilder, ListsLogicalDevicesAndTheirHost) {
    const Model model =
        modelOf("============ LOGICAL DEVICE DETAILS ============\n--------> Device Name: |/dev/sda1| LunId: "
                "|db1 :: /dev/sda1| \n--------> Device Name: |/dev/dm-0| LunId: |db1 :: /dev/dm-0| \n" +
                kRunEnd);
    EXPECT_EQ(sectionOf(model, "logical"), R"({"state":"built","devices":["/dev/sda1","/dev/dm-0"]})");
    EXPECT_EQ(model.host, "db1");
}

TEST(ModelBuilder, ListsPowerPathsDevices) {
    const Model model = modelOf(kRunStart +
                                "PowerPath Data : Ulid  Pseudo Name\n               6 emcpowera             "
                                "  7 emcpowerb\n" +
                                kRunEnd);
    EXPECT_EQ(sectionOf(model, "multipath"),
              R"({"powerPath":"running","devices":[{"ulid":"6","pseudoDevice":"emcpowera"},)"
              R"({"ulid":"7","pseudoDevice":"emcpowerb"}]})");
}

TEST(ModelBuilder, TakesANumberThatIsTooGreatForTheGreatest) {
    const Model model = modelOf(kFcBanner + kAdapterLines + kTargetLine +
                                lunLine("/dev/sdb", "6", "99999999999999999999") + kRunEnd);
    ASSERT_EQ(model.fc.paths.size(), 1);
    EXPECT_EQ(model.fc.paths[0].lun, UINT64_MAX);
}

TEST(ModelBuilder, SaysWhereALogIsCut) {
    const std::string end =
        ", without the closing banner: the run is still going on or was ended, or the file was cut "
        "off, line ";
    EXPECT_EQ(problemsOf(modelOf(kRunStart)),
              Lines{"problem, multipath, log: it ends in the multipath section" + end + "1"});
    EXPECT_EQ(problemsOf(modelOf(kRunStart + kDasBanner + diskLine("/dev/sda", "6"))),
              Lines{"problem, direct, log: it ends in the DAS section" + end + "3"});
}

TEST(ModelBuilder, SaysThatAnAssertionEndedTheRunAndNotThatTheLogIsCut) {
    EXPECT_EQ(
        problemsOf(modelOf(kRunStart + "Assertion [ lPos != ZebString::npos ] failed\n")),
        Lines{
            "problem, multipath, run: the program found something that must not be and ended itself: lPos != "
            "ZebString::npos, line 2"});
}

TEST(ModelBuilder, ForgetsARunWhenTheNextBegins) {
    const std::string second = kRunStart + kFcBanner + kOpening + kRunEnd;
    const Model alone = modelOf(second);
    const Model after =
        modelOf(kRunStart + kFcBanner + kOpening + identified("/dev/sdb", "6") + kAdapterLines + kTargetLine +
                lunLine("/dev/sdb", "6") + kIscsiBanner + "Target IQN 'iqn.t'\n" + second);
    for (const char* section :
         {"host", "luns", "multipath", "fc", "iscsi", "direct", "logical", "problems"}) {
        EXPECT_EQ(sectionOf(after, section), sectionOf(alone, section));
    }
}

} // namespace
