#include "fc/wwn.hpp"

#include <gtest/gtest.h>

namespace {

TEST(WwnText, KeepsTheLeadingZeroOfEachByteInLowerCase) {
    EXPECT_STREQ(WwnText(HBA_WWN{{0x00, 0x1B, 0x32, 0x0A, 0xFF, 0x00, 0x01, 0x02}}).text,
                 "00:1b:32:0a:ff:00:01:02");
}

TEST(WwnText, TellsBytesBelow16FromThoseAbove) {
    EXPECT_STREQ(WwnText(HBA_WWN{{0x0F, 0x10, 0, 0, 0, 0, 0, 0xAB}}).text, "0f:10:00:00:00:00:00:ab");
}

TEST(SameWwn, ComparesAllEightBytes) {
    const HBA_WWN wwn = {{1, 2, 3, 4, 5, 6, 7, 8}};
    EXPECT_TRUE(isSameWwn(wwn, wwn));
    for (std::size_t index = 0; index < sizeof wwn.wwn; ++index) {
        HBA_WWN other = wwn;
        other.wwn[index] = 0;
        EXPECT_FALSE(isSameWwn(wwn, other)) << index;
    }
}

} // namespace
