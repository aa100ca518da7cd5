// Whether two pages 83h are one logical unit's.
#include "view/identity/logical_unit.hpp"

#include <gtest/gtest.h>

namespace view {
namespace {

using Bytes = std::vector<std::uint8_t>;

struct Part {
    unsigned association = 0;
    unsigned type = 0;
    std::string text;
};

Bytes page(const std::vector<Part>& parts) {
    Bytes bytes = {0, 0x83, 0, 0};
    for (const Part& part : parts) {
        const Bytes header = {2, static_cast<std::uint8_t>(part.association << 4U | part.type), 0,
                              static_cast<std::uint8_t>(part.text.size())};
        bytes.insert(bytes.end(), header.begin(), header.end());
        bytes.insert(bytes.end(), part.text.begin(), part.text.end());
    }
    bytes[3] = static_cast<std::uint8_t>(bytes.size() - 4);
    return bytes;
}

LogicalUnit unit(const Bytes& bytes) {
    return {bytes, "ACME", "DISK"};
}

LogicalUnit unit(const std::vector<Part>& parts) {
    return unit(page(parts));
}

const Part kT10 = {0, 1, "ACME    one"};
const Part kOtherT10 = {0, 1, "ACME    two"};
const Part kName = {0, 8, "iqn.2001-05.com.example:one"};

TEST(LogicalUnit, isTheSameWithItsDesignatorsInAnotherOrder) {
    EXPECT_EQ(unit({kT10, kName}).isSame(unit({kName, kT10})), true);
}

TEST(LogicalUnit, isAnotherWhenOneDesignatorDiffersOrIsMissing) {
    EXPECT_EQ(unit({kT10, kName}).isSame(unit({kOtherT10, kName})), false);
    EXPECT_EQ(unit({kT10, kName}).isSame(unit({kName})), false);
}

TEST(LogicalUnit, isNotToldByDesignatorsOfItsPortOrTarget) {
    EXPECT_EQ(unit({kT10, {1, 4, "port"}, {2, 8, "naa.target"}}).isSame(unit({kT10, {1, 4, "else"}})), true);
    EXPECT_EQ(unit({{1, 3, "12345678"}}).isSame(unit({{1, 3, "12345678"}})), std::nullopt);
}

TEST(LogicalUnit, isToldByVendorSpecificDesignatorsOnlyWhenThereAreNoOthers) {
    const Part label = {0, 0, "label"};
    const Part renamed = {0, 0, "renamed"};
    EXPECT_EQ(unit({kT10, label}).isSame(unit({kT10, renamed})), true);
    EXPECT_EQ(unit({label}).isSame(unit({label})), true);
    EXPECT_EQ(unit({label}).isSame(unit({renamed})), false);
    EXPECT_EQ(unit({label}).isSame(unit({kT10})), false);
}

TEST(LogicalUnit, isComparedAsFarAsACutPageGoes) {
    const Bytes whole = page({kT10, kName});
    const Bytes cut(whole.begin(), whole.end() - 1);
    EXPECT_EQ(unit(whole).isSame(unit(cut)), true);
    EXPECT_EQ(unit(page({kOtherT10, kName})).isSame(unit(cut)), false);
    EXPECT_EQ(unit(whole).isSame(unit(Bytes(whole.begin(), whole.begin() + 8))), std::nullopt);
}

TEST(LogicalUnit, isUnknownByAPageThatIsNone) {
    for (const Bytes& bytes :
         {Bytes(), Bytes{0}, Bytes{0, 0x83, 0xff, 0xff}, Bytes(300, 0), Bytes(300, 0xff)}) {
        EXPECT_FALSE(unit(bytes).isNamed());
        EXPECT_EQ(unit(bytes).isSame(unit({kT10})), std::nullopt);
    }
}

TEST(LogicalUnit, isCalledByTheKernelAndByMapsAfterAnyOfItsDesignators) {
    const LogicalUnit both = unit({kT10, kName});
    EXPECT_TRUE(both.isKernelName("t10.ACME    one"));
    EXPECT_TRUE(both.isKernelName("iqn.2001-05.com.example:one"));
    EXPECT_FALSE(both.isKernelName("t10.ACME    two"));
    EXPECT_FALSE(both.isKernelName(""));
    EXPECT_TRUE(both.isMapName("1ACME_one"));
    EXPECT_TRUE(both.isMapName("82001-05.com.example:one"));
    EXPECT_FALSE(both.isMapName("1ACME_two"));
    EXPECT_FALSE(both.isMapName(""));
}

} // namespace
} // namespace view
