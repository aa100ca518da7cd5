#include "fc/tree_build.hpp"

#include <deque>
#include <memory>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "foundation/exceptions.hpp"
#include "main/shared/device_register.hpp"
#include "main/shared/run_state.hpp"
#include "scsi/scsi_exceptions.hpp"
#include "tests/support/fake_commands.hpp"
#include "tests/support/fake_hba.hpp"
#include "tests/support/fake_identity.hpp"
#include "tests/support/log_capture.hpp"
#include "tests/support/thrown.hpp"

namespace {

// What gettimeofday tells, in turn; 100 s 0 µs when there is nothing left.
std::deque<timeval> gClock;

std::string entered(const std::string& function) {
    return "Entered Function " + function + " Line #\n";
}

std::string left(const std::string& function) {
    return "Left Function " + function + " Line #\n";
}

std::string traced(const std::string& function, const std::string& lines) {
    return entered(function) + lines + left(function);
}

// The log with '@' for the addresses of mappings.
std::string withoutAddresses(std::string text) {
    for (const std::string line : {"Storing Target Mappings ", "Deleting 0x"}) {
        for (auto at = text.find(line); at != std::string::npos; at = text.find(line, at + 1)) {
            const auto address = text.find("0x", at);
            text.replace(address, text.find('\n', address) - address, "@");
        }
    }
    return text;
}

const std::string kNoTime = "Time values: 100.00, 0.00, 100.00, 0.00\n";
const std::string kLoad = traced("HA_LoadHbaapi", "Going to open HBAAPI library\n") + kNoTime +
                          "Time taken to load HBAAPI: 0.00 milliseconds\n";
const std::string kFree = "Going to free library\n" +
                          traced("HA_FreeHbaapi", "Going to free the HBAAPI library\nFreed HBAAPI library\n");

// The log of the steps for an adapter that goes well, by the adapter's name and ports.

std::string openLog(const std::string& name) {
    return traced("HA_OpenAdapter", "Going to open adapter, adapter name = <" + name + ">\n") +
           "Storing Adapter Handle\n";
}

std::string attributesLog(unsigned ports) {
    return traced(
        "sBuildAdapterAttributes",
        "Going to get Adapter Attributes\n" +
            traced("HA_GetAdapterAttributes", "Going to get adapter attributes\n"
                                              "Adapter info: Manufacturer Maker Model Model 1 NumPorts=" +
                                                  std::to_string(ports) + "\n") +
            "Storing Adapter Attributes\n");
}

std::string portsLog(unsigned ports) {
    std::string calls;
    for (unsigned port = 0; port < ports; ++port) {
        calls += "Going to get port attributes\n";
    }
    return traced("sBuildPortAttributes", "Going to get adapter ports\n" +
                                              traced("HA_GetAdapterPorts", calls) +
                                              "Storing Port Attributes\n");
}

// The log of the mapping calls for `count` targets.
std::string mappingCallsLog(unsigned count) {
    std::string calls = "Allocating memory for single target mapping\n"
                        "Going to invoke HBA_GetFcpTargetMapping to get target mappings\n"
                        "The status of get fcp target mapping: " +
                        std::string(count > 1 ? "7" : "0") + "\nThe number of targets is " +
                        std::to_string(count) + "\n";
    if (count > 1) {
        calls += "Allocating memory for multiple target mapping\n"
                 "Invoking HBA_GetFcpTargetMapping to get <" +
                 std::to_string(count) +
                 "> target mappings\n"
                 "The status of get fcp target mapping: 0\n";
    }
    return "Going to get target mappings\n" + traced("HA_GetTargetMappings", calls);
}

std::string registeredLog(const std::string& name) {
    return traced("addDeviceNameMap", "Added to DevMap " + std::to_string(EmulexHash(name.c_str())) +
                                          " --> " + name + " --> 1\n");
}

std::string identifiedLog(const std::string& identifier) {
    return "UniqueLunid = " + identifier + " size = " + std::to_string(identifier.size()) + "\n" +
           traced("isRunning", "");
}

std::string closeLog(const std::string& stored) {
    return stored + "Going to close adapter...\n" +
           traced("HA_CloseAdapter", "Going to close adapter...\nClosed adapter\n");
}

const std::string kNothingToDelete = "Finding and deleting adapter attributes...\n"
                                     "Finding and delete port attributes...\n"
                                     "Finding and deleting target mappings...\n";

std::string wwnText(unsigned char last) {
    const char* const digits = "0123456789abcdef";
    return std::string("50:06:01:60:00:00:00:") + digits[last >> 4] + digits[last & 15];
}

class FcTreeBuild : public testing::Test {
protected:
    FcTreeBuild() {
        gClock.clear();
        DevMap.clear();
    }

    void TearDown() override {
        const LogCapture log;
        cleanUpFcTree();
        FakeCommands noCommands;
        gPowerPath.sense();
    }

    // PowerPath runs, with this pseudo device for this identifier.
    static void startPowerPath(const std::string& identifier, const std::string& pseudoDevice) {
        FakeCommands commands;
        commands.answer("/usr/bin/pgrep -l emcpd", "812 emcpd\n813 emcpd\n");
        commands.answer(
            "/sbin/powermt display latency dev=all | grep -E '^Pseudo|^Logical' | sed 's/ \\[.*$//g'",
            "Pseudo name=" + pseudoDevice + "\nLogical device ID=" + identifier + "\n");
        const LogCapture log;
        gPowerPath.sense();
    }

    // An adapter whose library answers for these targets as it should.
    FakeAdapter& adapterWith(const std::string& name, HBA_HANDLE handle,
                             const std::vector<HBA_FCPSCSIENTRY>& targets) {
        FakeAdapter& adapter = mHba.adapter(name, handle, {0x71});
        const auto count = static_cast<HBA_UINT32>(targets.size());
        if (count > 1) {
            adapter.mappings.push_back({HBA_STATUS_ERROR_MORE_DATA, count, targets});
        }
        adapter.mappings.push_back({HBA_STATUS_OK, count, targets});
        return adapter;
    }

    FakeHba mHba;
    FakeIdentity mIdentity;
};

TEST_F(FcTreeBuild, HaltsWithoutAdapters) {
    const LogCapture log;
    EXPECT_EQ(messageOf<THaltEx>(sFirstBuildAndOutput), "There are no adapters on the system\n");
    EXPECT_EQ(log.text(), entered("sFirstBuildAndOutput") + kLoad +
                              traced("sBuildAndOutput", traced("HA_GetNumberOfAdapters", "") +
                                                            "The system does not have any adapters\n"));
}

TEST_F(FcTreeBuild, LetsAFailureToLoadTheLibraryOut) {
    mHba.loadStatus = HBA_STATUS_ERROR;
    const LogCapture log;
    EXPECT_EQ(messageOf<THbaapiEx>(sFirstBuildAndOutput), "HBA_LoadLibrary failed");
    EXPECT_EQ(log.text(), entered("sFirstBuildAndOutput") +
                              traced("HA_LoadHbaapi", "Going to open HBAAPI library\n"
                                                      "Failed to load HBAAPI library : HBA_STATUS_ERROR\n"));
}

TEST_F(FcTreeBuild, LetsAFailureToNameAnAdapterOut) {
    mHba.adapter("alpha", 1, {0x71}).nameStatus = HBA_STATUS_ERROR;
    const LogCapture log;
    EXPECT_EQ(messageOf<THbaapiEx>(sFirstBuildAndOutput), "HBA_GetAdapterName method failed\n");
    EXPECT_EQ(log.text(),
              entered("sFirstBuildAndOutput") + kLoad + entered("sBuildAndOutput") +
                  traced("HA_GetNumberOfAdapters", "") +
                  traced("HA_GetAdapterNames", "Going to get adapter name, # = <0>\n"
                                               "Failed to get adapter #0 name - HBA_STATUS_ERROR\n"));
}

TEST_F(FcTreeBuild, BuildsPrintsAndCleansUpAnAdapter) {
    adapterWith("alpha", 7, {fakeEntry("/dev/sda", 0, 0x0A)});
    mIdentity.identifier("/dev/sda", "6006");
    const LogCapture log;
    sFirstBuildAndOutput();
    cleanUpFcTree();
    EXPECT_EQ(
        withoutAddresses(log.text()),
        traced(
            "sFirstBuildAndOutput",
            kLoad +
                traced("sBuildAndOutput",
                       traced("HA_GetNumberOfAdapters", "") +
                           traced("HA_GetAdapterNames", "Going to get adapter name, # = <0>\n"
                                                        "Adapter name: alpha\n") +
                           "Number of adapters: 1\n"
                           "Going to open Adapter #0 - 'alpha'\n" +
                           openLog("alpha") +
                           traced("sBuildAdapterTreeAndOutput",
                                  attributesLog(1) + portsLog(1) +
                                      traced("sBuildTargetMappings",
                                             mappingCallsLog(1) + registeredLog("/dev/sda") +
                                                 identifiedLog("6006") + "Storing Target Mappings @\n") +
                                      traced("HA_PrintAdapterTree",
                                             "\n|_ Adapter wwnn " + wwnText(7) + "\n|  |_ Initiator wwpn " +
                                                 wwnText(0x71) + "\n|  |  |_ Target wwnn " + wwnText(0x8A) +
                                                 " wwpn " + wwnText(0x0A) +
                                                 " bus 2 target# 10\n"
                                                 "|  |  |  |_ lun name /dev/sda luid 6006 oslun 0 fcid "
                                                 "65546 fcplun 00\n")) +
                           kNoTime + "Time taken to build tree: 0.00 milliseconds\n")) +
            closeLog("Finding and deleting adapter attributes...\n"
                     "Finding and delete port attributes...\n"
                     "Deleting 1 port attributes...\n"
                     "Finding and deleting target mappings...\n"
                     "Deleting @\n") +
            kFree);
    EXPECT_EQ(mHba.calls,
              (std::vector<std::string>{"HBA_LoadLibrary", "HBA_GetNumberOfAdapters", "HBA_GetAdapterName 0",
                                        "HBA_OpenAdapter alpha", "HBA_GetAdapterAttributes 7",
                                        "HBA_GetAdapterPortAttributes 7 0", "HBA_GetFcpTargetMapping 7 1",
                                        "HBA_CloseAdapter 7", "HBA_FreeLibrary"}));
    EXPECT_EQ(mIdentity.questions(), (std::vector<std::string>{"vendor /dev/sda", "identifier /dev/sda 1"}));
}

TEST_F(FcTreeBuild, GoesOnWithTheNextAdapterAfterOneThatCannotBeOpened) {
    mHba.adapter("alpha", 0, {0x71});
    adapterWith("beta", 8, {});
    const LogCapture log;
    sBuildAndOutput();
    EXPECT_EQ(withoutAddresses(log.text()),
              traced("sBuildAndOutput",
                     traced("HA_GetNumberOfAdapters", "") +
                         traced("HA_GetAdapterNames", "Going to get adapter name, # = <0>\n"
                                                      "Adapter name: alpha\n"
                                                      "Going to get adapter name, # = <1>\n"
                                                      "Adapter name: beta\n") +
                         "Number of adapters: 2\n"
                         "Going to open Adapter #0 - 'alpha'\n" +
                         traced("HA_OpenAdapter", "Going to open adapter, adapter name = <alpha>\n"
                                                  "Failed to open adapter, adapter name = <alpha>\n") +
                         "Exception occured while opening adapter: alpha\n"
                         "Going to open Adapter #1 - 'beta'\n" +
                         openLog("beta") +
                         traced("sBuildAdapterTreeAndOutput",
                                attributesLog(1) + portsLog(1) +
                                    traced("sBuildTargetMappings", mappingCallsLog(0)) +
                                    traced("HA_PrintAdapterTree", "\n|_ Adapter wwnn " + wwnText(8) +
                                                                      "\n|  |_ Initiator wwpn " +
                                                                      wwnText(0x71) + "\n")) +
                         kNoTime + "Time taken to build tree: 0.00 milliseconds\n"));
}

TEST_F(FcTreeBuild, KeepsOnlyTheHandleOfAnAdapterThatIsNotSupported) {
    mHba.adapter("alpha", 7, {0x71}).attributesStatus = HBA_STATUS_ERROR_NOT_SUPPORTED;
    {
        const LogCapture log;
        sBuildAndOutput();
        EXPECT_EQ(log.text(), traced("sBuildAndOutput",
                                     traced("HA_GetNumberOfAdapters", "") +
                                         traced("HA_GetAdapterNames", "Going to get adapter name, # = <0>\n"
                                                                      "Adapter name: alpha\n") +
                                         "Number of adapters: 1\n"
                                         "Going to open Adapter #0 - 'alpha'\n" +
                                         openLog("alpha") +
                                         traced("sBuildAdapterTreeAndOutput",
                                                traced("sBuildAdapterAttributes",
                                                       "Going to get Adapter Attributes\n" +
                                                           traced("HA_GetAdapterAttributes",
                                                                  "Going to get adapter attributes\n"
                                                                  "Encountered non-supported Adapter - "
                                                                  "HBA_STATUS_ERROR_NOT_SUPPORTED\n"))) +
                                         kNoTime + "Time taken to build tree: 0.00 milliseconds\n"));
    }
    const LogCapture log;
    cleanUpFcTree();
    EXPECT_EQ(log.text(), closeLog(kNothingToDelete) + kFree);
}

TEST_F(FcTreeBuild, CostsOnlyTheAdapterWhenItHaltsWithinOne) {
    mHba.adapter("alpha", 7, {});
    adapterWith("beta", 8, {});
    {
        const LogCapture log;
        sBuildAndOutput();
        EXPECT_NE(log.text().find("No ports on the adapter\n"
                                  "Left Function HA_GetAdapterAttributes Line #\n"
                                  "Exception occured while opening adapter: alpha\n"
                                  "Going to open Adapter #1 - 'beta'\n"),
                  std::string::npos);
        EXPECT_NE(log.text().find("|_ Adapter wwnn " + wwnText(8)), std::string::npos);
    }
    const LogCapture log;
    cleanUpFcTree();
    EXPECT_EQ(log.text(), closeLog(kNothingToDelete) +
                              closeLog("Finding and deleting adapter attributes...\n"
                                       "Finding and delete port attributes...\n"
                                       "Deleting 1 port attributes...\n"
                                       "Finding and deleting target mappings...\n") +
                              kFree);
}

TEST_F(FcTreeBuild, StoresNoPortsOfAnAdapterWhosePortsFail) {
    mHba.adapter("alpha", 7, {0x71, 0x72}).portStatus = HBA_STATUS_ERROR;
    {
        const LogCapture log;
        sBuildAndOutput();
    }
    const LogCapture log;
    cleanUpFcTree();
    EXPECT_EQ(log.text(), closeLog(kNothingToDelete) + kFree);
}

TEST_F(FcTreeBuild, PrintsPortsWithoutTargetsWhenTheMappingFails) {
    mHba.adapter("alpha", 7, {0x71}).mappings = {{HBA_STATUS_ERROR, 1, {}}};
    const LogCapture log;
    sBuildAdapterTreeAndOutput(7);
    EXPECT_EQ(
        log.text(),
        traced("sBuildAdapterTreeAndOutput",
               attributesLog(1) + portsLog(1) +
                   traced("sBuildTargetMappings",
                          "Going to get target mappings\n" +
                              traced("HA_GetTargetMappings",
                                     "Allocating memory for single target mapping\n"
                                     "Going to invoke HBA_GetFcpTargetMapping to get target mappings\n"
                                     "The status of get fcp target mapping: 1\n"
                                     "The number of targets is 1\n"
                                     "Failed to get target mappings - HBA_STATUS_ERROR\n")) +
                   traced("HA_PrintAdapterTree", "\n|_ Adapter wwnn " + wwnText(7) +
                                                     "\n|  |_ Initiator wwpn " + wwnText(0x71) + "\n")));
}

TEST_F(FcTreeBuild, FillsSlotsAtTheSourcesIndexAndCountsThemApart) {
    adapterWith("alpha", 7,
                {fakeEntry("/dev/sda", 0, 0x0A), fakeEntry("", 1, 0x0A), fakeEntry("/dev/sdc", 2, 0x0A)});
    mIdentity.identifier("/dev/sda", "6006");
    mIdentity.identifier("/dev/sdc", "6008");
    const LogCapture log;
    const HBA_FCPTARGETMAPPINGV2& mapping = sBuildTargetMappings(7);
    const std::string unassigned =
        "Device Name Unassigned for Lun 1 under Target " + wwnText(0x0A) + " ignoring\n";
    EXPECT_EQ(withoutAddresses(log.text()),
              traced("sBuildTargetMappings", mappingCallsLog(3) + unassigned + registeredLog("/dev/sda") +
                                                 identifiedLog("6006") + unassigned +
                                                 registeredLog("/dev/sdc") + identifiedLog("6008") +
                                                 "Storing Target Mappings @\n"));
    ASSERT_EQ(mapping.NumberOfEntries, 2U);
    EXPECT_STREQ(mapping.entry[0].ScsiId.OSDeviceName, "/dev/sda");
    EXPECT_STREQ(mapping.entry[0].LUID.buffer, "6006");
    EXPECT_STREQ(mapping.entry[1].ScsiId.OSDeviceName, "");
    EXPECT_EQ(mapping.entry[1].FcpId.FcId, 0U);
    EXPECT_STREQ(mapping.entry[2].ScsiId.OSDeviceName, "/dev/sdc");
    EXPECT_EQ(mapping.entry[2].FcpId.FcId, 0x1000AU);
    EXPECT_STREQ(mapping.entry[2].LUID.buffer, "6008");
    EXPECT_EQ(mIdentity.questions(),
              (std::vector<std::string>{"vendor /dev/sda", "vendor /dev/sdc", "identifier /dev/sda 1",
                                        "identifier /dev/sdc 1"}));
}

TEST_F(FcTreeBuild, PrintsTheUnfilledSlotAndHidesTheLastFilledOne) {
    adapterWith("alpha", 7,
                {fakeEntry("/dev/sda", 0, 0x0A), fakeEntry("", 1, 0x0A), fakeEntry("/dev/sdc", 2, 0x0A)});
    mIdentity.identifier("/dev/sda", "6006");
    mIdentity.identifier("/dev/sdc", "6008");
    const LogCapture log;
    sBuildAdapterTreeAndOutput(7);
    const std::string text = log.text();
    EXPECT_EQ(
        text.substr(text.find("|  |_ Initiator")),
        "|  |_ Initiator wwpn " + wwnText(0x71) + "\n|  |  |_ Target wwnn " + wwnText(0x8A) + " wwpn " +
            wwnText(0x0A) +
            " bus 2 target# 10\n"
            "|  |  |  |_ lun name /dev/sda luid 6006 oslun 0 fcid 65546 fcplun 00\n"
            "|  |  |_ Target wwnn 00:00:00:00:00:00:00:00 wwpn 00:00:00:00:00:00:00:00 bus 0 target# 0\n"
            "|  |  |  |_ lun name  luid  oslun 0 fcid 0 fcplun 00\n" +
            left("HA_PrintAdapterTree") + left("sBuildAdapterTreeAndOutput"));
}

TEST_F(FcTreeBuild, DoesNotStoreAMappingWhoseLunsAllFail) {
    adapterWith("alpha", 7, {fakeEntry("/dev/sda", 0, 0x0A), fakeEntry("/dev/sdb", 1, 0x0A)});
    mIdentity.identifier("/dev/sda", throws<NotFoundEx>());
    mIdentity.identifier("/dev/sdb", throws<NotSupportedEx>());
    const LogCapture log;
    const HBA_FCPTARGETMAPPINGV2& mapping = sBuildTargetMappings(7);
    EXPECT_EQ(mapping.NumberOfEntries, 0U);
    EXPECT_EQ(log.text(), traced("sBuildTargetMappings",
                                 mappingCallsLog(2) + registeredLog("/dev/sda") +
                                     "Failed in getting the uniqueLunId for device /dev/sda ignoring\n" +
                                     registeredLog("/dev/sdb") +
                                     "Failed in getting the uniqueLunId for device /dev/sdb ignoring\n"));
    EXPECT_EQ(getDeviceType("/dev/sda"), TREE_FC);
    EXPECT_EQ(getDeviceType("/dev/sdb"), TREE_FC);
}

TEST_F(FcTreeBuild, ShowsNoTargetsOfAMappingWhoseLunsAllFail) {
    adapterWith("alpha", 7, {fakeEntry("/dev/sda", 0, 0x0A), fakeEntry("/dev/sdb", 1, 0x0A)});
    {
        const LogCapture log;
        sBuildAdapterTreeAndOutput(7);
        const std::string text = log.text();
        EXPECT_EQ(text.substr(text.find("\n|_ Adapter")),
                  "\n|_ Adapter wwnn " + wwnText(7) + "\n|  |_ Initiator wwpn " + wwnText(0x71) + "\n" +
                      left("HA_PrintAdapterTree") + left("sBuildAdapterTreeAndOutput"));
    }
}

TEST_F(FcTreeBuild, OnlyLogsWhenTheVendorOfALunIsNotToBeHad) {
    adapterWith("alpha", 7, {fakeEntry("/dev/sda", 4294967295U, 0x0A), fakeEntry("/dev/sdb", 5, 0x0B)});
    mIdentity.vendorData("/dev/sda", throws<NotFoundEx>());
    mIdentity.vendorData("/dev/sdb", throws<NotSupportedEx>());
    mIdentity.identifier("/dev/sda", "6006");
    mIdentity.identifier("/dev/sdb", "6007");
    const LogCapture log;
    const HBA_FCPTARGETMAPPINGV2& mapping = sBuildTargetMappings(7);
    EXPECT_EQ(mapping.NumberOfEntries, 2U);
    EXPECT_EQ(withoutAddresses(log.text()),
              traced("sBuildTargetMappings",
                     mappingCallsLog(2) +
                         "Failed in getting the VendorId for device /dev/sda Lun -1 Under Target " +
                         wwnText(0x0A) +
                         " ignoring\n"
                         "Failed in getting the VendorId for device /dev/sdb Lun 5 Under Target " +
                         wwnText(0x0B) + " ignoring\n" + registeredLog("/dev/sda") + identifiedLog("6006") +
                         registeredLog("/dev/sdb") + identifiedLog("6007") + "Storing Target Mappings @\n"));
}

// The exceptions that cost the whole adapter, by the text they are thrown with.
struct AdapterFailure {
    const char* name;
    FakeAnswer answer;
};

class FcTreeBuildFailure : public FcTreeBuild, public testing::WithParamInterface<AdapterFailure> {
protected:
    // The pass over an adapter with one LUN whose question fails behind `before`.
    static std::string passLog(const std::string& before) {
        return traced("sBuildAndOutput",
                      traced("HA_GetNumberOfAdapters", "") +
                          traced("HA_GetAdapterNames", "Going to get adapter name, # = <0>\n"
                                                       "Adapter name: alpha\n") +
                          "Number of adapters: 1\n"
                          "Going to open Adapter #0 - 'alpha'\n" +
                          openLog("alpha") + entered("sBuildAdapterTreeAndOutput") + attributesLog(1) +
                          portsLog(1) + entered("sBuildTargetMappings") + mappingCallsLog(1) + before +
                          "Exception occured while opening adapter: alpha\n" + kNoTime +
                          "Time taken to build tree: 0.00 milliseconds\n");
    }
};

TEST_P(FcTreeBuildFailure, OfTheIdentifierCostsTheAdapter) {
    adapterWith("alpha", 7, {fakeEntry("/dev/sda", 0, 0x0A)});
    mIdentity.identifier("/dev/sda", GetParam().answer);
    {
        const LogCapture log;
        sBuildAndOutput();
        EXPECT_EQ(log.text(), passLog(registeredLog("/dev/sda")));
    }
    const LogCapture log;
    cleanUpFcTree();
    EXPECT_EQ(log.text(), closeLog("Finding and deleting adapter attributes...\n"
                                   "Finding and delete port attributes...\n"
                                   "Deleting 1 port attributes...\n"
                                   "Finding and deleting target mappings...\n") +
                              kFree);
}

TEST_P(FcTreeBuildFailure, OfTheVendorDataCostsTheAdapter) {
    adapterWith("alpha", 7, {fakeEntry("/dev/sda", 0, 0x0A)});
    mIdentity.vendorData("/dev/sda", GetParam().answer);
    mIdentity.identifier("/dev/sda", "6006");
    const LogCapture log;
    sBuildAndOutput();
    EXPECT_EQ(log.text(), passLog(""));
    EXPECT_EQ(mIdentity.questions(), std::vector<std::string>{"vendor /dev/sda"});
}

INSTANTIATE_TEST_SUITE_P(Exceptions, FcTreeBuildFailure,
                         testing::Values(AdapterFailure{"TimeOutEx", throws<TimeOutEx>()},
                                         AdapterFailure{"ScsiIoctlEx", throws<ScsiIoctlEx>()},
                                         AdapterFailure{"ScsiStatusEx", throws<ScsiStatusEx>()},
                                         AdapterFailure{"InvalidEx", throws<InvalidEx>()},
                                         AdapterFailure{"ExpiredEx", throws<ExpiredEx>()},
                                         AdapterFailure{"THaltEx", throws<THaltEx>()}),
                         [](const auto& failure) { return std::string(failure.param.name); });

TEST_F(FcTreeBuild, LogsThePseudoDeviceOfALunUnderPowerPath) {
    adapterWith("alpha", 7, {fakeEntry("/dev/sda", 0, 0x0A), fakeEntry("/dev/sdb", 1, 0x0A)});
    mIdentity.identifier("/dev/sda", "6006");
    mIdentity.identifier("/dev/sdb", "6007");
    startPowerPath("6006", "emcpowera");
    const LogCapture log;
    const HBA_FCPTARGETMAPPINGV2& mapping = sBuildTargetMappings(7);
    EXPECT_EQ(mapping.NumberOfEntries, 2U);
    EXPECT_EQ(withoutAddresses(log.text()),
              traced("sBuildTargetMappings", mappingCallsLog(2) + registeredLog("/dev/sda") +
                                                 identifiedLog("6006") + traced("getPseudoDevice", "") +
                                                 "Pseudo Device for Unique LunId 6006 is emcpowera\n" +
                                                 registeredLog("/dev/sdb") + identifiedLog("6007") +
                                                 traced("getPseudoDevice", "") +
                                                 "Lun With UniqueLunId 6007 is not under PowerPath\n"
                                                 "Storing Target Mappings @\n"));
}

TEST_F(FcTreeBuild, KeepsAtMost255CharactersOfAnIdentifier) {
    adapterWith("alpha", 7, {fakeEntry("/dev/sda", 0, 0x0A)});
    mIdentity.identifier("/dev/sda", std::string(300, 'u'));
    const LogCapture log;
    const HBA_FCPTARGETMAPPINGV2& mapping = sBuildTargetMappings(7);
    EXPECT_EQ(mapping.entry[0].LUID.buffer, std::string(255, 'u'));
    EXPECT_NE(log.text().find("UniqueLunid = " + std::string(300, 'u') + " size = 300\n"), std::string::npos);
}

TEST_F(FcTreeBuild, EndsADeviceNameAtItsField) {
    const std::string name = "/dev/" + std::string(251, 'd');
    adapterWith("alpha", 7, {fakeEntry(name, 0, 0x0A)});
    mIdentity.identifier(name, "6006");
    const LogCapture log;
    EXPECT_EQ(sBuildTargetMappings(7).NumberOfEntries, 1U);
    EXPECT_EQ(mIdentity.questions(),
              (std::vector<std::string>{"vendor " + name, "identifier " + name + " 1"}));
}

TEST_F(FcTreeBuild, KeepsALunWithAnEmptyIdentifier) {
    adapterWith("alpha", 7, {fakeEntry("/dev/sda", 0, 0x0A)});
    mIdentity.identifier("/dev/sda", "");
    const LogCapture log;
    EXPECT_EQ(sBuildTargetMappings(7).NumberOfEntries, 1U);
    EXPECT_NE(log.text().find("UniqueLunid =  size = 0\n"), std::string::npos);
}

TEST_F(FcTreeBuild, RefusesToBuildAMappingThatThereIsNoMemoryFor) {
    // The library has room for 2100000 of the longer entries and tells a count that fills it with shorter
    // ones, which is more than the built mapping can hold as longer ones again.
    mHba.adapter("alpha", 7, {0x71}).mappings = {{HBA_STATUS_ERROR_MORE_DATA, 2100000, {}},
                                                 {HBA_STATUS_OK, 4294967295U, {}}};
    const LogCapture log;
    EXPECT_EQ(messageOf<NoMemoryEx>([] { sBuildTargetMappings(7); }), "No Memory\n");
    EXPECT_EQ(log.text(), traced("sBuildTargetMappings", mappingCallsLog(2100000)));
}

TEST_F(FcTreeBuild, ClosesAHandleTwiceThatWasOpenedTwice) {
    adapterWith("alpha", 7, {});
    mHba.adapters.push_back(mHba.adapters.front());
    {
        const LogCapture log;
        sBuildAndOutput();
        EXPECT_NE(log.text().find("Storing Adapter Attributes\n"
                                  "Element already existed in the map\n"
                                  "Exception occured while opening adapter: alpha\n"),
                  std::string::npos);
    }
    const LogCapture log;
    cleanUpFcTree();
    EXPECT_EQ(log.text(), closeLog("Finding and deleting adapter attributes...\n"
                                   "Finding and delete port attributes...\n"
                                   "Deleting 1 port attributes...\n"
                                   "Finding and deleting target mappings...\n") +
                              closeLog(kNothingToDelete) + kFree);
}

TEST_F(FcTreeBuild, CleansUpNothingTheSecondTime) {
    adapterWith("alpha", 7, {});
    const LogCapture log;
    sBuildAndOutput();
    cleanUpFcTree();
    const LogCapture secondLog;
    cleanUpFcTree();
    EXPECT_EQ(secondLog.text(), kFree);
}

TEST_F(FcTreeBuild, OpensAnAdapterByItsExpandedName) {
    FakeAdapter& adapter = adapterWith("50% of 100%% %s", 7, {});
    adapter.mappings.clear();
    mHba.adapters.push_back(adapter);
    mHba.adapters.back().name = "50% of 100% %s";
    mHba.adapters.front().handle = 0;
    const LogCapture log;
    sBuildAndOutput();
    EXPECT_NE(log.text().find("Going to open Adapter #0 - '50% of 100%% %s'\n"
                              "Entered Function HA_OpenAdapter Line #\n"
                              "Going to open adapter, adapter name = <50% of 100% %s>\n"),
              std::string::npos);
}

TEST_F(FcTreeBuild, EndsThePassAtANameThatCannotBeFormatted) {
    adapterWith("alpha", 7, {});
    adapterWith("100%", 8, {});
    adapterWith("gamma", 9, {});
    const LogCapture log;
    EXPECT_EQ(messageOf<WriteFailedEx>(sBuildAndOutput), "String Write failed\n");
    const std::string text = log.text();
    const std::string last = "Going to open Adapter #1 - '100%'\n";
    EXPECT_EQ(text.substr(text.size() - last.size()), last);
}

TEST(AdapterName, IsTheFormatOfItsOwnCopy) {
    EXPECT_EQ(expandAdapterName("qla2xxx-0"), "qla2xxx-0");
    EXPECT_EQ(expandAdapterName(""), "");
    EXPECT_EQ(expandAdapterName("100%%"), "100%");
    EXPECT_EQ(expandAdapterName("%%%%d"), "%%d");
}

TEST(AdapterName, KeepsEveryOtherConversionAsText) {
    EXPECT_EQ(expandAdapterName("%s %n %5d%x"), "%s %n %5d%x");
    EXPECT_EQ(expandAdapterName("50% of it"), "50% of it");
}

TEST(AdapterName, FailsAtALonePercentSignAtItsEnd) {
    EXPECT_EQ(messageOf<WriteFailedEx>([] { expandAdapterName("100%"); }), "String Write failed\n");
    EXPECT_EQ(messageOf<WriteFailedEx>([] { expandAdapterName("%%%"); }), "String Write failed\n");
}

TEST(AdapterName, FitsWith256Characters) {
    const std::string name(256, 'n');
    EXPECT_EQ(expandAdapterName(name.c_str()), name);
}

TEST(ElapsedMilliseconds, CountsSecondsAndMicroseconds) {
    const LogCapture log;
    EXPECT_DOUBLE_EQ(elapsedMilliseconds({10, 900000}, {11, 100000}), 200.0);
    EXPECT_EQ(log.text(), "Time values: 10.00, 900000.00, 11.00, 100000.00\n");
}

TEST(ElapsedMilliseconds, KeepsMicroseconds) {
    const LogCapture log;
    EXPECT_DOUBLE_EQ(elapsedMilliseconds({2000000000, 1}, {2000000000, 1235}), 1.234);
}

TEST(ElapsedMilliseconds, IsNegativeWhenTheClockWasSetBack) {
    const LogCapture log;
    EXPECT_DOUBLE_EQ(elapsedMilliseconds({11, 0}, {10, 500000}), -500.0);
}

TEST_F(FcTreeBuild, LogsTheTimesItTook) {
    gClock = {{10, 900000}, {11, 100000}, {20, 0}, {21, 250}};
    adapterWith("alpha", 7, {});
    const LogCapture log;
    sFirstBuildAndOutput();
    EXPECT_NE(log.text().find("Time values: 10.00, 900000.00, 11.00, 100000.00\n"
                              "Time taken to load HBAAPI: 200.00 milliseconds\n"),
              std::string::npos);
    EXPECT_NE(log.text().find("Time values: 20.00, 0.00, 21.00, 250.00\n"
                              "Time taken to build tree: 1000.25 milliseconds\n"),
              std::string::npos);
}

} // namespace

extern "C" int gettimeofday(timeval* tv, void* /*tz*/) noexcept {
    *tv = {100, 0};
    if (!gClock.empty()) {
        *tv = gClock.front();
        gClock.pop_front();
    }
    return 0;
}
