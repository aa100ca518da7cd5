#include "main/shared/device_register.hpp"

#include <string>

#include <gtest/gtest.h>

#include "foundation/exceptions.hpp"
#include "tests/support/log_capture.hpp"
#include "tests/support/refusing_log.hpp"
#include "tests/support/thrown.hpp"

namespace {

TEST(EmulexHash, HasItsReferenceValueOfTheEmptyText) {
    EXPECT_EQ(EmulexHash(""), 2548701195U);
}

TEST(EmulexHash, HasItsReferenceValueOfTheFirstDisk) {
    EXPECT_EQ(EmulexHash("/dev/sda"), 2560771373U);
}

TEST(EmulexHash, HasItsReferenceValueOfTheSecondDisk) {
    EXPECT_EQ(EmulexHash("/dev/sdb"), 4093812380U);
}

TEST(EmulexHash, HasItsReferenceValueOfOneWord) {
    EXPECT_EQ(EmulexHash("abcd"), 1015912768U);
}

// Tails of one to three bytes, some of them above 127, as an independent calculation has them.
TEST(EmulexHash, TakesTheTailByByteAndUnsigned) {
    EXPECT_EQ(EmulexHash("a"), 3867267516U);
    EXPECT_EQ(EmulexHash("ab"), 1144023974U);
    EXPECT_EQ(EmulexHash("abc"), 2091410914U);
    EXPECT_EQ(EmulexHash("/dev/sda1"), 3130676408U);
    EXPECT_EQ(EmulexHash("\xFF\xFE\xFD\xFC\xFB\xFA\xF9"), 2132228645U);
}

class DeviceRegister : public testing::Test {
protected:
    DeviceRegister() { DevMap.clear(); }
    void TearDown() override { DevMap.clear(); }
};

TEST_F(DeviceRegister, LogsWhatItRegisters) {
    const LogCapture log;
    addDeviceNameMap(TREE_FC, "/dev/sdb");
    EXPECT_EQ(log.text(), "Entered Function addDeviceNameMap Line #\n"
                          "Added to DevMap 4093812380 --> /dev/sdb --> 1\n"
                          "Left Function addDeviceNameMap Line #\n");
}

TEST_F(DeviceRegister, LogsTheTypeInHexadecimal) {
    const LogCapture log;
    addDeviceNameMap(0xAB, "/dev/sdb");
    EXPECT_NE(log.text().find(" --> /dev/sdb --> ab\n"), std::string::npos);
}

TEST_F(DeviceRegister, KeepsTheFirstTypeOfANameAndLogsBothTimes) {
    const LogCapture log;
    addDeviceNameMap(TREE_FC, "/dev/sda");
    addDeviceNameMap(TREE_ISCSI, "/dev/sda");
    EXPECT_EQ(log.text(), "Entered Function addDeviceNameMap Line #\n"
                          "Added to DevMap 2560771373 --> /dev/sda --> 1\n"
                          "Left Function addDeviceNameMap Line #\n"
                          "Entered Function addDeviceNameMap Line #\n"
                          "Added to DevMap 2560771373 --> /dev/sda --> 4\n"
                          "Left Function addDeviceNameMap Line #\n");
    EXPECT_EQ(getDeviceType("/dev/sda"), TREE_FC);
}

TEST_F(DeviceRegister, FindsARegisteredNameWithoutAnExitTrace) {
    {
        const LogCapture log;
        addDeviceNameMap(TREE_ISCSI, "/dev/sdb");
    }
    const LogCapture log;
    EXPECT_EQ(getDeviceType("/dev/sdb"), TREE_ISCSI);
    EXPECT_EQ(log.text(), "Entered Function getDeviceType Line #\n");
}

TEST_F(DeviceRegister, Has0ForAnUnknownName) {
    const LogCapture log;
    EXPECT_EQ(getDeviceType("/dev/sdb"), 0U);
    EXPECT_EQ(log.text(), "Entered Function getDeviceType Line #\nLeft Function getDeviceType Line #\n");
}

TEST_F(DeviceRegister, TellsNamesOfOneHashApart) {
    const LogCapture log;
    ZebTwoLevelMap<uint32>::insert(DevMap, EmulexHash("/dev/sdb"), "another name", TREE_FC);
    EXPECT_EQ(getDeviceType("/dev/sdb"), 0U);
    addDeviceNameMap(TREE_DAS, "/dev/sdb");
    EXPECT_EQ(getDeviceType("/dev/sdb"), TREE_DAS);
}

TEST_F(DeviceRegister, RegistersANameWhoseLogLineIsRefused) {
    {
        constexpr int kTrace = 1;
        const RefusingLog log(kTrace);
        EXPECT_EQ(messageOf<WriteFailedEx>([] { addDeviceNameMap(TREE_FC, "/dev/sdb"); }),
                  "File write failed");
    }
    const LogCapture log;
    EXPECT_EQ(getDeviceType("/dev/sdb"), TREE_FC);
}

} // namespace
