#include "scsi/sense.hpp"

#include <gtest/gtest.h>

#include "tests/support/inquiry_data.hpp"

namespace {

SenseHeader decoded(const Bytes& sense) {
    return decodeSense(sense.data(), static_cast<uint32>(sense.size()));
}

void expectHeader(const SenseHeader& header, int senseKey, int asc, int ascq) {
    EXPECT_EQ(header.senseKey, senseKey);
    EXPECT_EQ(header.asc, asc);
    EXPECT_EQ(header.ascq, ascq);
}

// 18 bytes of fixed format.
Bytes fixedSense(uint8 responseCode, uint8 byte2, uint8 additionalLength, uint8 asc, uint8 ascq) {
    return {responseCode, 0, byte2, 0, 0, 0, 0, additionalLength, 0, 0, 0, 0, asc, ascq, 0, 0, 0, 0};
}

TEST(Sense, IsPresentFromThreeBytesOn) {
    const Bytes sense(3);
    EXPECT_FALSE(isSensePresent(sense.data(), 0));
    EXPECT_FALSE(isSensePresent(sense.data(), 2));
    EXPECT_TRUE(isSensePresent(sense.data(), 3));
    EXPECT_FALSE(isSensePresent(nullptr, 18));
}

TEST(Sense, IsWellFormedWithAResponseCodeOf70hTo7Fh) {
    for (unsigned first = 0; first < 256; ++first) {
        const auto byte = static_cast<uint8>(first);
        const unsigned responseCode = first % 128;
        EXPECT_EQ(isSenseWellFormed(&byte), responseCode >= 0x70) << first;
    }
}

TEST(Sense, FixedFormatHasKeyAndCodesInBytes2And12And13) {
    expectHeader(decoded(fixedSense(0x70, 0x05, 10, 0x24, 0x01)), 5, 0x24, 0x01);
    expectHeader(decoded(fixedSense(0x71, 0x06, 10, 0x29, 0x02)), 6, 0x29, 0x02); // deferred
}

TEST(Sense, TheValidBitOfTheResponseCodeDoesNotCount) {
    expectHeader(decoded(fixedSense(0xF0, 0x05, 10, 0x20, 0x00)), 5, 0x20, 0);
    expectHeader(decoded({0xF2, 0x05, 0x20, 0x01}), 5, 0x20, 0x01);
}

TEST(Sense, TheKeyLeavesOutTheFlagsBesideIt) {
    expectHeader(decoded(fixedSense(0x70, 0xE5, 10, 0x24, 0x00)), 5, 0x24, 0);
    expectHeader(decoded({0x72, 0xF5, 0x24, 0x00}), 5, 0x24, 0);
}

TEST(Sense, FixedFormatOfThreeBytesHasAKeyAndNoCodes) {
    expectHeader(decoded({0x70, 0, 0x05}), 5, 0, 0);
}

TEST(Sense, FixedFormatEndsWhereItsAdditionalLengthSays) {
    expectHeader(decoded(fixedSense(0x70, 0x05, 4, 0x20, 0x01)), 5, 0, 0);       // 12 bytes
    expectHeader(decoded(fixedSense(0x70, 0x05, 5, 0x20, 0x01)), 5, 0x20, 0);    // 13
    expectHeader(decoded(fixedSense(0x70, 0x05, 6, 0x20, 0x01)), 5, 0x20, 0x01); // 14
}

TEST(Sense, AnAdditionalLengthBehindTheDataDoesNotCount) {
    Bytes sense = fixedSense(0x70, 0x05, 255, 0x20, 0x01);
    expectHeader(decoded(sense), 5, 0x20, 0x01);
    sense.resize(13);
    expectHeader(decoded(sense), 5, 0x20, 0);
    sense.resize(12);
    expectHeader(decoded(sense), 5, 0, 0);
}

TEST(Sense, AnAdditionalLengthThatIsNotThereDoesNotCount) {
    expectHeader(decoded({0x70, 0, 0x05, 0, 0, 0, 0}), 5, 0, 0);
}

TEST(Sense, DescriptorFormatHasKeyAndCodesInBytes1To3) {
    expectHeader(decoded({0x72, 0x05, 0x20, 0x01, 0, 0, 0, 0}), 5, 0x20, 0x01);
    expectHeader(decoded({0x73, 0x06, 0x29, 0x02, 0, 0, 0, 0}), 6, 0x29, 0x02);
    expectHeader(decoded({0x7F, 0x0B, 0x47, 0x03, 0, 0, 0, 0}), 11, 0x47, 0x03);
}

TEST(Sense, DescriptorFormatOfThreeBytesHasNoQualifier) {
    expectHeader(decoded({0x72, 0x05, 0x20}), 5, 0x20, 0);
}

} // namespace
