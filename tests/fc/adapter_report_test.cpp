#include "fc/adapter_report.hpp"

#include <memory>
#include <string>

#include <gtest/gtest.h>

#include "foundation/exceptions.hpp"
#include "tests/support/fake_hba.hpp"
#include "tests/support/log_capture.hpp"
#include "tests/support/refusing_log.hpp"
#include "tests/support/thrown.hpp"

namespace {

// A mapping of at most eight LUNs, built up LUN by LUN.
struct Mapping {
    Mapping()
        : block(static_cast<HBA_FCPTARGETMAPPINGV2*>(
                    std::calloc(1, mappingBlockSize<HBA_FCPTARGETMAPPINGV2, HBA_FCPSCSIENTRYV2>(8))),
                &std::free) {}

    HBA_FCPSCSIENTRYV2& add(const std::string& name, HBA_UINT32 lun, unsigned char target,
                            const std::string& luid) const {
        HBA_FCPSCSIENTRYV2& slot = block->entry[block->NumberOfEntries++];
        const HBA_FCPSCSIENTRY entry = fakeEntry(name, lun, target);
        slot.ScsiId = entry.ScsiId;
        slot.FcpId = entry.FcpId;
        luid.copy(slot.LUID.buffer, sizeof slot.LUID.buffer);
        return slot;
    }

    MappingBlock<HBA_FCPTARGETMAPPINGV2> block;
};

const std::string kAdapterLine = "\n|_ Adapter wwnn 50:06:01:60:00:00:00:07\n";
const std::string kTargetA =
    "|  |  |_ Target wwnn 50:06:01:60:00:00:00:8a wwpn 50:06:01:60:00:00:00:0a bus 2 "
    "target# 10\n";
const std::string kTargetB =
    "|  |  |_ Target wwnn 50:06:01:60:00:00:00:8b wwpn 50:06:01:60:00:00:00:0b bus 2 "
    "target# 11\n";

class AdapterReport : public testing::Test {
protected:
    // The report of an adapter whose ports have these last bytes in their WWPNs.
    std::string report(std::initializer_list<unsigned char> ports) {
        const FakeAdapter& adapter = mHba.adapter("alpha", 7, ports);
        const LogCapture log;
        const auto records = HA_GetAdapterPorts(7, adapter.attributes);
        char* text = nullptr;
        std::size_t size = 0;
        std::FILE* const stream = open_memstream(&text, &size);
        const LogCapture reportLog;
        HA_PrintAdapterTree(adapter.attributes, *records, *mMapping.block, stream);
        EXPECT_EQ(reportLog.text(), "Entered Function HA_PrintAdapterTree Line #\n"
                                    "Left Function HA_PrintAdapterTree Line #\n");
        static_cast<void>(std::fclose(stream));
        std::string result(text, size);
        std::free(text);
        return result;
    }

    FakeHba mHba;
    Mapping mMapping;
};

TEST_F(AdapterReport, ShowsPortsWithoutTargets) {
    EXPECT_EQ(report({0x71, 0x72}), kAdapterLine + "|  |_ Initiator wwpn 50:06:01:60:00:00:00:71\n"
                                                   "|  |_ Initiator wwpn 50:06:01:60:00:00:00:72\n");
}

TEST_F(AdapterReport, ShowsEveryLunUnderEveryPort) {
    mMapping.add("/dev/sda", 0, 0x0A, "6006");
    const std::string luns =
        kTargetA + "|  |  |  |_ lun name /dev/sda luid 6006 oslun 0 fcid 65546 fcplun 00\n";
    EXPECT_EQ(report({0x71, 0x72}), kAdapterLine + "|  |_ Initiator wwpn 50:06:01:60:00:00:00:71\n" + luns +
                                        "|  |_ Initiator wwpn 50:06:01:60:00:00:00:72\n" + luns);
}

TEST_F(AdapterReport, ShowsOneTargetLineForLunsOfOneTargetInARow) {
    mMapping.add("/dev/sda", 0, 0x0A, "6006");
    mMapping.add("/dev/sdb", 1, 0x0A, "6007");
    EXPECT_EQ(report({0x71}), kAdapterLine + "|  |_ Initiator wwpn 50:06:01:60:00:00:00:71\n" + kTargetA +
                                  "|  |  |  |_ lun name /dev/sda luid 6006 oslun 0 fcid 65546 fcplun 00\n"
                                  "|  |  |  |_ lun name /dev/sdb luid 6007 oslun 1 fcid 65546 fcplun 01\n");
}

TEST_F(AdapterReport, ShowsATargetAgainThatComesBackAfterAnother) {
    mMapping.add("/dev/sda", 0, 0x0A, "6006");
    mMapping.add("/dev/sdb", 0, 0x0B, "6007");
    mMapping.add("/dev/sdc", 1, 0x0A, "6008");
    EXPECT_EQ(report({0x71}),
              kAdapterLine + "|  |_ Initiator wwpn 50:06:01:60:00:00:00:71\n" + kTargetA +
                  "|  |  |  |_ lun name /dev/sda luid 6006 oslun 0 fcid 65546 fcplun 00\n" + kTargetB +
                  "|  |  |  |_ lun name /dev/sdb luid 6007 oslun 0 fcid 65547 fcplun 00\n" + kTargetA +
                  "|  |  |  |_ lun name /dev/sdc luid 6008 oslun 1 fcid 65546 fcplun 01\n");
}

TEST_F(AdapterReport, TellsTargetsOfOnePortNameApartByTheirNodeName) {
    mMapping.add("/dev/sda", 0, 0x0A, "6006");
    mMapping.add("/dev/sdb", 1, 0x0A, "6007").FcpId.NodeWWN = fakeWwn(0x8B);
    EXPECT_EQ(
        report({0x71}),
        kAdapterLine + "|  |_ Initiator wwpn 50:06:01:60:00:00:00:71\n" + kTargetA +
            "|  |  |  |_ lun name /dev/sda luid 6006 oslun 0 fcid 65546 fcplun 00\n"
            "|  |  |_ Target wwnn 50:06:01:60:00:00:00:8b wwpn 50:06:01:60:00:00:00:0a bus 2 target# 10\n"
            "|  |  |  |_ lun name /dev/sdb luid 6007 oslun 1 fcid 65546 fcplun 01\n");
}

TEST_F(AdapterReport, DoesNotLookAtBusAndTargetNumberToTellTargetsApart) {
    mMapping.add("/dev/sda", 0, 0x0A, "6006");
    mMapping.add("/dev/sdb", 1, 0x0A, "6007").ScsiId.ScsiTargetNumber = 99;
    EXPECT_EQ(report({0x71}), kAdapterLine + "|  |_ Initiator wwpn 50:06:01:60:00:00:00:71\n" + kTargetA +
                                  "|  |  |  |_ lun name /dev/sda luid 6006 oslun 0 fcid 65546 fcplun 00\n"
                                  "|  |  |  |_ lun name /dev/sdb luid 6007 oslun 1 fcid 65546 fcplun 01\n");
}

TEST_F(AdapterReport, ShowsOnlyTheLow32BitsOfAnFcpLun) {
    HBA_FCPSCSIENTRYV2& entry = mMapping.add("/dev/sda", 4294967295U, 0x0A, "6006");
    entry.FcpId.FcpLun = 0x00010000DEADBEEF;
    entry.FcpId.FcId = 4294967295U;
    EXPECT_EQ(
        report({0x71}),
        kAdapterLine + "|  |_ Initiator wwpn 50:06:01:60:00:00:00:71\n" + kTargetA +
            "|  |  |  |_ lun name /dev/sda luid 6006 oslun 4294967295 fcid 4294967295 fcplun 0deadbeef\n");
}

TEST_F(AdapterReport, ShowsAnUnfilledSlotAsZeros) {
    mMapping.add("/dev/sda", 0, 0x0A, "6006");
    ++mMapping.block->NumberOfEntries;
    EXPECT_EQ(
        report({0x71}),
        kAdapterLine + "|  |_ Initiator wwpn 50:06:01:60:00:00:00:71\n" + kTargetA +
            "|  |  |  |_ lun name /dev/sda luid 6006 oslun 0 fcid 65546 fcplun 00\n"
            "|  |  |_ Target wwnn 00:00:00:00:00:00:00:00 wwpn 00:00:00:00:00:00:00:00 bus 0 target# 0\n"
            "|  |  |  |_ lun name  luid  oslun 0 fcid 0 fcplun 00\n");
}

TEST_F(AdapterReport, EndsNamesAtTheirFields) {
    mMapping.add(std::string(256, 'n'), 0, 0x0A, std::string(256, 'l'));
    EXPECT_EQ(report({0x71}), kAdapterLine + "|  |_ Initiator wwpn 50:06:01:60:00:00:00:71\n" + kTargetA +
                                  "|  |  |  |_ lun name " + std::string(256, 'n') + " luid " +
                                  std::string(256, 'l') + " oslun 0 fcid 65546 fcplun 00\n");
}

TEST_F(AdapterReport, ThrowsWhenTheStreamRefusesIt) {
    const FakeAdapter& adapter = mHba.adapter("alpha", 7, {0x71});
    std::unique_ptr<PortAttributes> ports;
    {
        const LogCapture log;
        ports = HA_GetAdapterPorts(7, adapter.attributes);
    }
    constexpr int kTrace = 1;
    const RefusingLog log(kTrace);
    EXPECT_EQ(messageOf<WriteFailedEx>(
                  [&] { HA_PrintAdapterTree(adapter.attributes, *ports, *mMapping.block, gLogStream); }),
              "File write failed");
}

} // namespace
