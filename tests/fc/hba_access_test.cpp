#include "fc/hba_access.hpp"

#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "foundation/exceptions.hpp"
#include "tests/support/fake_hba.hpp"
#include "tests/support/log_capture.hpp"
#include "tests/support/refusing_log.hpp"
#include "tests/support/thrown.hpp"

namespace {

// What a function leaves in the log that writes `lines` between its two traces.
std::string traced(const std::string& function, const std::string& lines) {
    return "Entered Function " + function + " Line #\n" + lines + "Left Function " + function + " Line #\n";
}

class HbaAccess : public testing::Test {
protected:
    FakeHba mHba;
};

TEST_F(HbaAccess, LoadsTheLibrary) {
    const LogCapture log;
    HA_LoadHbaapi();
    EXPECT_EQ(log.text(), traced("HA_LoadHbaapi", "Going to open HBAAPI library\n"));
    EXPECT_EQ(mHba.calls, std::vector<std::string>{"HBA_LoadLibrary"});
}

TEST_F(HbaAccess, ThrowsWhenTheLibraryCannotBeLoaded) {
    mHba.loadStatus = HBA_STATUS_ERROR_UNAVAILABLE;
    const LogCapture log;
    EXPECT_EQ(messageOf<THbaapiEx>(HA_LoadHbaapi), "HBA_LoadLibrary failed");
    EXPECT_EQ(log.text(),
              traced("HA_LoadHbaapi", "Going to open HBAAPI library\n"
                                      "Failed to load HBAAPI library : HBA_STATUS_ERROR_UNAVAILABLE\n"));
}

TEST_F(HbaAccess, NamesAStatusAbove30InvalidInTheLog) {
    mHba.loadStatus = 31;
    const LogCapture log;
    EXPECT_THROW(HA_LoadHbaapi(), THbaapiEx);
    EXPECT_EQ(log.text(),
              traced("HA_LoadHbaapi", "Going to open HBAAPI library\n"
                                      "Failed to load HBAAPI library : Invalid Hbaapi Status Code\n"));
}

TEST_F(HbaAccess, FreesTheLibraryWhateverItsStatus) {
    const LogCapture log;
    HA_FreeHbaapi();
    EXPECT_EQ(log.text(),
              traced("HA_FreeHbaapi", "Going to free the HBAAPI library\nFreed HBAAPI library\n"));
    EXPECT_EQ(mHba.calls, std::vector<std::string>{"HBA_FreeLibrary"});
}

TEST_F(HbaAccess, CountsTheAdapters) {
    mHba.adapter("alpha", 1, {1});
    mHba.adapter("beta", 2, {1});
    const LogCapture log;
    EXPECT_EQ(HA_GetNumberOfAdapters(), 2U);
    EXPECT_EQ(log.text(), traced("HA_GetNumberOfAdapters", ""));
}

TEST_F(HbaAccess, FillsTheNamesByIndex) {
    mHba.adapter("alpha", 1, {1});
    mHba.adapter("beta", 2, {1});
    std::vector<ZebString> names(2, "");
    const LogCapture log;
    HA_GetAdapterNames(2, names);
    EXPECT_STREQ(names[0].c_str(), "alpha");
    EXPECT_STREQ(names[1].c_str(), "beta");
    EXPECT_EQ(log.text(), traced("HA_GetAdapterNames", "Going to get adapter name, # = <0>\n"
                                                       "Adapter name: alpha\n"
                                                       "Going to get adapter name, # = <1>\n"
                                                       "Adapter name: beta\n"));
}

TEST_F(HbaAccess, KeepsTheNamesBeforeTheOneThatFails) {
    mHba.adapter("alpha", 1, {1});
    mHba.adapter("beta", 2, {1}).nameStatus = HBA_STATUS_ERROR_ILLEGAL_INDEX;
    mHba.adapter("gamma", 3, {1});
    std::vector<ZebString> names(3, "");
    const LogCapture log;
    EXPECT_EQ(messageOf<THbaapiEx>([&] { HA_GetAdapterNames(3, names); }),
              "HBA_GetAdapterName method failed\n");
    EXPECT_STREQ(names[0].c_str(), "alpha");
    EXPECT_STREQ(names[1].c_str(), "");
    EXPECT_EQ(log.text(), traced("HA_GetAdapterNames",
                                 "Going to get adapter name, # = <0>\n"
                                 "Adapter name: alpha\n"
                                 "Going to get adapter name, # = <1>\n"
                                 "Failed to get adapter #1 name - HBA_STATUS_ERROR_ILLEGAL_INDEX\n"));
    EXPECT_EQ(mHba.calls, (std::vector<std::string>{"HBA_GetAdapterName 0", "HBA_GetAdapterName 1"}));
}

TEST_F(HbaAccess, EndsAnAdapterNameAtItsField) {
    const std::string name(300, 'n');
    mHba.adapter(name, 1, {1});
    std::vector<ZebString> names(1, "");
    const LogCapture log;
    HA_GetAdapterNames(1, names);
    EXPECT_EQ(names[0].c_str(), std::string(256, 'n'));
}

TEST_F(HbaAccess, OpensAnAdapterByName) {
    mHba.adapter("alpha", 7, {1});
    char name[] = "alpha";
    const LogCapture log;
    EXPECT_EQ(HA_OpenAdapter(name), 7U);
    EXPECT_EQ(log.text(), traced("HA_OpenAdapter", "Going to open adapter, adapter name = <alpha>\n"));
}

TEST_F(HbaAccess, ThrowsWhenAnAdapterHasNoHandle) {
    mHba.adapter("alpha", 0, {1});
    char name[] = "alpha";
    const LogCapture log;
    EXPECT_EQ(messageOf<THbaapiEx>([&] { HA_OpenAdapter(name); }), "HBA_OpenAdapter method failed\n");
    EXPECT_EQ(log.text(), traced("HA_OpenAdapter", "Going to open adapter, adapter name = <alpha>\n"
                                                   "Failed to open adapter, adapter name = <alpha>\n"));
}

TEST_F(HbaAccess, ClosesAnAdapter) {
    const LogCapture log;
    HA_CloseAdapter(7);
    EXPECT_EQ(log.text(), traced("HA_CloseAdapter", "Going to close adapter...\nClosed adapter\n"));
    EXPECT_EQ(mHba.calls, std::vector<std::string>{"HBA_CloseAdapter 7"});
}

TEST_F(HbaAccess, ReadsAnAdaptersAttributes) {
    mHba.adapter("alpha", 7, {1, 2});
    const LogCapture log;
    const auto attributes = HA_GetAdapterAttributes(7);
    ASSERT_NE(attributes, nullptr);
    EXPECT_EQ(attributes->NumberOfPorts, 2U);
    EXPECT_EQ(log.text(), traced("HA_GetAdapterAttributes",
                                 "Going to get adapter attributes\n"
                                 "Adapter info: Manufacturer Maker Model Model 1 NumPorts=2\n"));
}

TEST_F(HbaAccess, EndsManufacturerAndModelAtTheirFields) {
    HBA_ADAPTERATTRIBUTES& attributes = mHba.adapter("alpha", 7, {1}).attributes;
    std::memset(attributes.Manufacturer, 'm', sizeof attributes.Manufacturer);
    std::memset(attributes.SerialNumber, 's', sizeof attributes.SerialNumber);
    std::memset(attributes.Model, 'M', sizeof attributes.Model);
    std::memset(attributes.ModelDescription, 'd', sizeof attributes.ModelDescription);
    const LogCapture log;
    HA_GetAdapterAttributes(7);
    EXPECT_EQ(log.text(), traced("HA_GetAdapterAttributes", "Going to get adapter attributes\n"
                                                            "Adapter info: Manufacturer " +
                                                                std::string(64, 'm') + " Model " +
                                                                std::string(256, 'M') + " NumPorts=1\n"));
}

TEST_F(HbaAccess, HasNoRecordOfAnAdapterThatIsNotSupported) {
    mHba.adapter("alpha", 7, {1}).attributesStatus = HBA_STATUS_ERROR_NOT_SUPPORTED;
    const LogCapture log;
    EXPECT_EQ(HA_GetAdapterAttributes(7), nullptr);
    EXPECT_EQ(log.text(), traced("HA_GetAdapterAttributes",
                                 "Going to get adapter attributes\n"
                                 "Encountered non-supported Adapter - HBA_STATUS_ERROR_NOT_SUPPORTED\n"));
}

TEST_F(HbaAccess, ThrowsWhenTheAttributesCallFails) {
    mHba.adapter("alpha", 7, {1}).attributesStatus = HBA_STATUS_ERROR;
    const LogCapture log;
    EXPECT_EQ(messageOf<THbaapiEx>([] { HA_GetAdapterAttributes(7); }),
              "HBA_GetAdapterAttributes method failed\n");
    EXPECT_EQ(log.text(),
              traced("HA_GetAdapterAttributes", "Going to get adapter attributes\n"
                                                "Failed to get adapter attributes - HBA_STATUS_ERROR\n"));
}

TEST_F(HbaAccess, HaltsAtAnAdapterWithoutPorts) {
    mHba.adapter("alpha", 7, {});
    const LogCapture log;
    EXPECT_EQ(messageOf<THaltEx>([] { HA_GetAdapterAttributes(7); }), "ZERO Ports on the Adapter\n");
    EXPECT_EQ(log.text(), traced("HA_GetAdapterAttributes", "Going to get adapter attributes\n"
                                                            "No ports on the adapter\n"));
}

TEST_F(HbaAccess, ReadsThePortsByIndex) {
    const FakeAdapter& adapter = mHba.adapter("alpha", 7, {0x11, 0x12});
    const LogCapture log;
    const auto ports = HA_GetAdapterPorts(7, adapter.attributes);
    ASSERT_EQ(ports->count(), 2U);
    EXPECT_EQ((*ports)[0].PortWWN.wwn[7], 0x11);
    EXPECT_EQ((*ports)[1].PortWWN.wwn[7], 0x12);
    EXPECT_EQ(log.text(), traced("HA_GetAdapterPorts", "Going to get port attributes\n"
                                                       "Going to get port attributes\n"));
}

TEST_F(HbaAccess, ThrowsAtThePortThatFails) {
    FakeAdapter& adapter = mHba.adapter("alpha", 7, {0x11, 0x12});
    adapter.portStatus = HBA_STATUS_ERROR_BUSY;
    const LogCapture log;
    EXPECT_EQ(messageOf<THbaapiEx>([&] { HA_GetAdapterPorts(7, adapter.attributes); }),
              "HBA_GetAdapterPortAttributes method failed\n");
    EXPECT_EQ(log.text(),
              traced("HA_GetAdapterPorts", "Going to get port attributes\n"
                                           "Going to get port attributes\n"
                                           "Failed to get port attributes - HBA_STATUS_ERROR_BUSY\n"));
}

TEST_F(HbaAccess, HaltsAtMorePortsThanThereIsRoomToPointAt) {
    HBA_ADAPTERATTRIBUTES attributes = {};
    attributes.NumberOfPorts = 0xFFFFFFFF;
    const LogCapture log;
    EXPECT_EQ(messageOf<THaltEx>([&] { HA_GetAdapterPorts(7, attributes); }),
              "No memory for Port Attributes\n");
    EXPECT_EQ(log.text(), traced("HA_GetAdapterPorts", "Failed to allocate port attributes ptr array\n"));
    EXPECT_TRUE(mHba.calls.empty());
}

TEST_F(HbaAccess, HaltsAtMorePortsThanThereIsMemoryFor) {
    HBA_ADAPTERATTRIBUTES attributes = {};
    attributes.NumberOfPorts = 4000000;
    const LogCapture log;
    EXPECT_EQ(messageOf<THaltEx>([&] { HA_GetAdapterPorts(7, attributes); }),
              "No memory for Port Attributes\n");
    EXPECT_EQ(log.text(), traced("HA_GetAdapterPorts", "Failed to allocate port attributes\n"));
    EXPECT_TRUE(mHba.calls.empty());
}

const std::string kFirstMappingCall = "Allocating memory for single target mapping\n"
                                      "Going to invoke HBA_GetFcpTargetMapping to get target mappings\n";

TEST_F(HbaAccess, KeepsTheFirstMappingBufferWhenThereAreNoTargets) {
    mHba.adapter("alpha", 7, {1}).mappings = {{HBA_STATUS_OK, 0, {}}};
    const LogCapture log;
    const auto mapping = HA_GetTargetMappings(7);
    EXPECT_EQ(mapping->NumberOfEntries, 0U);
    EXPECT_EQ(log.text(),
              traced("HA_GetTargetMappings", kFirstMappingCall + "The status of get fcp target mapping: 0\n"
                                                                 "The number of targets is 0\n"));
    EXPECT_EQ(mHba.calls, std::vector<std::string>{"HBA_GetFcpTargetMapping 7 1"});
}

TEST_F(HbaAccess, KeepsTheFirstMappingBufferForOneTarget) {
    mHba.adapter("alpha", 7, {1}).mappings = {{HBA_STATUS_OK, 1, {fakeEntry("/dev/sda", 3, 1)}}};
    const LogCapture log;
    const auto mapping = HA_GetTargetMappings(7);
    ASSERT_EQ(mapping->NumberOfEntries, 1U);
    EXPECT_STREQ(mapping->entry[0].ScsiId.OSDeviceName, "/dev/sda");
}

TEST_F(HbaAccess, KeepsTheFirstMappingBufferWhenMoreDataMeansOneTarget) {
    mHba.adapter("alpha", 7, {1}).mappings = {{HBA_STATUS_ERROR_MORE_DATA, 1, {fakeEntry("/dev/sda", 3, 1)}}};
    const LogCapture log;
    const auto mapping = HA_GetTargetMappings(7);
    EXPECT_EQ(mapping->NumberOfEntries, 1U);
    EXPECT_EQ(log.text(),
              traced("HA_GetTargetMappings", kFirstMappingCall + "The status of get fcp target mapping: 7\n"
                                                                 "The number of targets is 1\n"));
    EXPECT_EQ(mHba.calls, std::vector<std::string>{"HBA_GetFcpTargetMapping 7 1"});
}

TEST_F(HbaAccess, AsksAgainForAsManyTargetsAsThereAre) {
    const std::vector<HBA_FCPSCSIENTRY> entries = {fakeEntry("/dev/sda", 0, 1), fakeEntry("/dev/sdb", 1, 1),
                                                   fakeEntry("/dev/sdc", 2, 1)};
    mHba.adapter("alpha", 7, {1}).mappings = {{HBA_STATUS_ERROR_MORE_DATA, 3, entries},
                                              {HBA_STATUS_OK, 3, entries}};
    const LogCapture log;
    const auto mapping = HA_GetTargetMappings(7);
    ASSERT_EQ(mapping->NumberOfEntries, 3U);
    EXPECT_STREQ(mapping->entry[2].ScsiId.OSDeviceName, "/dev/sdc");
    EXPECT_EQ(log.text(),
              traced("HA_GetTargetMappings",
                     kFirstMappingCall + "The status of get fcp target mapping: 7\n"
                                         "The number of targets is 3\n"
                                         "Allocating memory for multiple target mapping\n"
                                         "Invoking HBA_GetFcpTargetMapping to get <3> target mappings\n"
                                         "The status of get fcp target mapping: 0\n"));
    EXPECT_EQ(mHba.calls,
              (std::vector<std::string>{"HBA_GetFcpTargetMapping 7 1", "HBA_GetFcpTargetMapping 7 3"}));
}

TEST_F(HbaAccess, ThrowsWhenTheFirstMappingCallFails) {
    mHba.adapter("alpha", 7, {1}).mappings = {{HBA_STATUS_ERROR_TRY_AGAIN, 1, {}}};
    const LogCapture log;
    EXPECT_EQ(messageOf<THbaapiEx>([] { HA_GetTargetMappings(7); }),
              "HBA_GetFcpTargetMapping method failed\n");
    EXPECT_EQ(log.text(),
              traced("HA_GetTargetMappings",
                     kFirstMappingCall + "The status of get fcp target mapping: 11\n"
                                         "The number of targets is 1\n"
                                         "Failed to get target mappings - HBA_STATUS_ERROR_TRY_AGAIN\n"));
}

TEST_F(HbaAccess, DoesNotAskAThirdTimeForTargets) {
    mHba.adapter("alpha", 7, {1}).mappings = {
        {HBA_STATUS_ERROR_MORE_DATA, 2, {}}, {HBA_STATUS_ERROR_MORE_DATA, 5, {}}, {HBA_STATUS_OK, 0, {}}};
    const LogCapture log;
    EXPECT_EQ(messageOf<THbaapiEx>([] { HA_GetTargetMappings(7); }),
              "HBA_GetFcpTargetMapping method failed\n");
    EXPECT_EQ(log.text(),
              traced("HA_GetTargetMappings",
                     kFirstMappingCall + "The status of get fcp target mapping: 7\n"
                                         "The number of targets is 2\n"
                                         "Allocating memory for multiple target mapping\n"
                                         "Invoking HBA_GetFcpTargetMapping to get <2> target mappings\n"
                                         "The status of get fcp target mapping: 7\n"
                                         "Failed to get <2> target mappings - HBA_STATUS_ERROR_MORE_DATA\n"));
}

TEST_F(HbaAccess, LogsACountThatTheFirstBufferHasNoRoomForAndUsesWhatFits) {
    mHba.adapter("alpha", 7, {1}).mappings = {
        {HBA_STATUS_OK, 4294967295U, {fakeEntry("/dev/sda", 0, 1), fakeEntry("/dev/sdb", 1, 1)}}};
    const LogCapture log;
    const auto mapping = HA_GetTargetMappings(7);
    ASSERT_EQ(mapping->NumberOfEntries, 1U);
    EXPECT_STREQ(mapping->entry[0].ScsiId.OSDeviceName, "/dev/sda");
    EXPECT_EQ(log.text(),
              traced("HA_GetTargetMappings", kFirstMappingCall + "The status of get fcp target mapping: 0\n"
                                                                 "The number of targets is 4294967295\n"));
}

TEST_F(HbaAccess, UsesOnlyTheTargetsThatTheSecondBufferHasRoomFor) {
    const std::vector<HBA_FCPSCSIENTRY> entries = {fakeEntry("/dev/sda", 0, 1), fakeEntry("/dev/sdb", 1, 1)};
    mHba.adapter("alpha", 7, {1}).mappings = {{HBA_STATUS_ERROR_MORE_DATA, 2, entries},
                                              {HBA_STATUS_OK, 4294967295U, entries}};
    const LogCapture log;
    const auto mapping = HA_GetTargetMappings(7);
    // The buffer is sized for two of the longer entries, which makes three of the shorter ones.
    ASSERT_EQ(mapping->NumberOfEntries, 3U);
    EXPECT_STREQ(mapping->entry[1].ScsiId.OSDeviceName, "/dev/sdb");
    EXPECT_STREQ(mapping->entry[2].ScsiId.OSDeviceName, "");
}

TEST_F(HbaAccess, HaltsAtMoreTargetsThanThereIsMemoryFor) {
    mHba.adapter("alpha", 7, {1}).mappings = {{HBA_STATUS_ERROR_MORE_DATA, 4294967295U, {}}};
    const LogCapture log;
    EXPECT_EQ(messageOf<THaltEx>([] { HA_GetTargetMappings(7); }), "No memory for target mappings\n");
    EXPECT_EQ(log.text(), traced("HA_GetTargetMappings", kFirstMappingCall +
                                                             "The status of get fcp target mapping: 7\n"
                                                             "The number of targets is 4294967295\n"
                                                             "Allocating memory for multiple target mapping\n"
                                                             "Failed to allocate target mappings\n"));
}

TEST_F(HbaAccess, LetsALogThatIsFullOut) {
    mHba.adapter("alpha", 7, {1}).mappings = {{HBA_STATUS_OK, 0, {}}};
    constexpr int kTraceAndOneLine = 2;
    const RefusingLog log(kTraceAndOneLine);
    EXPECT_EQ(messageOf<WriteFailedEx>([] { HA_GetTargetMappings(7); }), "File write failed\n");
}

TEST(MappingBlockSize, IsACountAndTheEntries) {
    constexpr bool kIs32Bit = sizeof(void*) == 4;
    using V1 = HBA_FCPTARGETMAPPING;
    using V2 = HBA_FCPTARGETMAPPINGV2;
    EXPECT_EQ((mappingBlockSize<V1, HBA_FCPSCSIENTRY>(1)), kIs32Bit ? 300U : 312U);
    EXPECT_EQ((mappingBlockSize<V1, HBA_FCPSCSIENTRYV2>(5)), kIs32Bit ? 4U + 5 * 552 : 8U + 5 * 560);
    EXPECT_EQ((mappingBlockSize<V2, HBA_FCPSCSIENTRYV2>(0)), kIs32Bit ? 4U : 8U);
}

TEST(MappingBlockSize, IsZeroForABlockThatNo32BitProgramCouldHave) {
    EXPECT_NE((mappingBlockSize<HBA_FCPTARGETMAPPINGV2, HBA_FCPSCSIENTRYV2>(3800000)), 0U);
    EXPECT_EQ((mappingBlockSize<HBA_FCPTARGETMAPPINGV2, HBA_FCPSCSIENTRYV2>(3900000)), 0U);
    EXPECT_EQ((mappingBlockSize<HBA_FCPTARGETMAPPINGV2, HBA_FCPSCSIENTRYV2>(0xFFFFFFFF)), 0U);
}

TEST(FieldText, EndsAtTheNulOrAtTheField) {
    const char shortText[] = {'a', 'b', '\0', 'c'};
    const char fullText[] = {'a', 'b', 'c', 'd'};
    EXPECT_EQ(fieldText(shortText), "ab");
    EXPECT_EQ(fieldText(fullText), "abcd");
}

} // namespace
