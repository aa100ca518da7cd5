#include "view/identity/names.hpp"

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include <gtest/gtest.h>

namespace {

using namespace std::string_literals;
using view::Names;

using Bytes = std::vector<std::uint8_t>;

// Code sets and types of designators (SPC).
enum CodeSet : std::uint8_t { kBinary = 1, kAscii = 2, kUtf8 = 3 };
enum Type : std::uint8_t { kVendorSpecific = 0, kT10 = 1, kEui64 = 2, kNaa = 3, kScsiName = 8 };

constexpr std::uint8_t kOfTargetPort = 0x10;

// A designator with its header.
std::string designator(unsigned codeSet, unsigned type, const std::string& identifier) {
    return std::string{static_cast<char>(codeSet), static_cast<char>(type), 0,
                       static_cast<char>(identifier.size())} +
           identifier;
}

std::string page(const std::string& designators, char code = '\x83') {
    return std::string{0, code, static_cast<char>(designators.size() >> 8U),
                       static_cast<char>(designators.size())} +
           designators;
}

Names namesOf(const std::string& page83, std::string_view vendor = {}, std::string_view product = {}) {
    return view::namesOf(Bytes(page83.begin(), page83.end()), vendor, product);
}

// All names in one text: multipath, kernel, scsi_id, rules of sg3-utils, links.
std::string shown(const Names& names) {
    std::string text =
        names.multipath + " | " + names.kernel + " | " + names.scsiId + " | " + names.sg3Rules + " |";
    for (const std::string& link : names.links) {
        text += ' ' + link;
    }
    return text;
}

const std::string kNaa2 = "\x21\x23\x45\x67\x89\xab\xcd\xef";
const std::string kNaa3 = "\x33\x33\x33\x30\x00\x00\x07\xd0"s;
const std::string kNaa5 = "\x50\x00\xc5\x00\x10\x3f\x70\x23"s;
const std::string kNaa6 = "\x60\x06\x01\x60\xb4\xc0\x2e\x00\xa0\x7d\x5c\x3f\x11\xe2\xdd\x11"s;
const std::string kEui = "\x00\x1b\x4d\x20\x08\x23\x11\x88"s;

TEST(Names, OfAnNaaDesignatorAreItsDigits) {
    EXPECT_EQ(shown(namesOf(page(designator(kBinary, kNaa, kNaa6)))),
              "360060160b4c02e00a07d5c3f11e2dd11 | naa.60060160b4c02e00a07d5c3f11e2dd11 | "
              "360060160b4c02e00a07d5c3f11e2dd11 | 360060160b4c02e00a07d5c3f11e2dd11 | "
              "scsi-360060160b4c02e00a07d5c3f11e2dd11 wwn-0x60060160b4c02e00a07d5c3f11e2dd11");
}

TEST(Names, PreferARegisteredExtendedNaaDesignatorWhereverItStands) {
    const std::string name = "60060160b4c02e00a07d5c3f11e2dd11";
    EXPECT_EQ(shown(namesOf(page(designator(kBinary, kNaa, kNaa5) + designator(kBinary, kEui64, kEui) +
                                 designator(kBinary, kNaa, kNaa6)))),
              "3" + name + " | naa." + name + " | 3" + name + " | 3" + name + " | scsi-3" + name +
                  " scsi-35000c500103f7023 scsi-2001b4d2008231188 wwn-0x" + name);
}

TEST(Names, DifferForALocalNaaDesignatorBesideAT10One) {
    EXPECT_EQ(
        shown(namesOf(page(designator(kAscii, kT10, "Linux   scsi_debug      2000") +
                           designator(kBinary, kNaa, kNaa3)))),
        "1Linux_scsi_debug_2000 | naa.33333330000007d0 | 333333330000007d0 | "
        "1Linux_scsi_debug_2000 | scsi-1Linux_scsi_debug_2000 scsi-333333330000007d0 wwn-0x33333330000007d0");
}

TEST(Names, DifferForAnNaaDesignatorOfAFormatThatNotAllKnow) {
    EXPECT_EQ(shown(namesOf(page(designator(kBinary, kNaa, kNaa2)))),
              "32123456789abcdef |  | 32123456789abcdef | 32123456789abcdef | scsi-32123456789abcdef "
              "wwn-0x2123456789abcdef");
}

TEST(Names, OfAnEui64DesignatorAreItsDigits) {
    EXPECT_EQ(shown(namesOf(page(designator(kBinary, kEui64, kEui)))),
              "2001b4d2008231188 | eui.001b4d2008231188 | 2001b4d2008231188 | 2001b4d2008231188 | "
              "scsi-2001b4d2008231188");
}

TEST(Names, OfAT10DesignatorDifferInItsBlanks) {
    EXPECT_EQ(shown(namesOf(page(designator(kAscii, kT10, "ACME    disk  7/b  ")))),
              "1ACME_disk_7/b | t10.ACME    disk  7/b   | 1ACME    disk  7/b   | 1ACME_disk_7\\x2fb | "
              "scsi-1ACME_disk_7\\x2fb scsi-1ACME_disk_7_b");
}

TEST(Names, OfAnAtaDiskAreItsModelAndSerialNumberToTheRulesOfSg3Utils) {
    EXPECT_EQ(
        shown(namesOf(
            page(designator(kAscii, kT10, "ATA     ACME SSD   SER1 ") + designator(kBinary, kNaa, kNaa5)))),
        "35000c500103f7023 | naa.5000c500103f7023 | 35000c500103f7023 | ACME_SSD_SER1 | ata-ACME_SSD_SER1 "
        "scsi-35000c500103f7023 scsi-1ATA_ACME_SSD_SER1 wwn-0x5000c500103f7023");
}

TEST(Names, OfAScsiNameStringDependOnItsPrefix) {
    EXPECT_EQ(shown(namesOf(page(designator(kUtf8, kScsiName, "iqn.2001-05.com.acme:Lun9\0\0\0"s)))),
              "82001-05.com.acme:Lun9 | iqn.2001-05.com.acme:Lun9 |  | 8iqn.2001-05.com.acme:Lun9 | "
              "scsi-8iqn.2001-05.com.acme:Lun9");
    EXPECT_EQ(
        shown(namesOf(page(designator(kUtf8, kScsiName, "naa.5000C500103F7023")))),
        "35000c500103f7023 | naa.5000C500103F7023 |  | 8naa.5000C500103F7023 | scsi-8naa.5000C500103F7023");
    EXPECT_EQ(shown(namesOf(page(designator(kUtf8, kScsiName, "disk 7 ")))),
              " | disk 7  |  | 8disk 7 | scsi-8disk_7");
}

TEST(Names, OfAVendorSpecificDesignatorNeedVendorAndProduct) {
    const std::string page83 = page(designator(kAscii, kVendorSpecific, "drive-0"));
    EXPECT_EQ(shown(namesOf(page83, "QEMU", "QEMU HARDDISK")),
              " |  | 0QEMU    QEMU HARDDISK   drive-0 |  | scsi-0QEMU_QEMU_HARDDISK_drive-0");
    EXPECT_EQ(namesOf(page83), Names());
}

TEST(Names, AreThoseOfTheLogicalUnitAlone) {
    EXPECT_EQ(namesOf(page(designator(kBinary, kNaa | kOfTargetPort, kNaa5))), Names());
}

TEST(Names, OfAnAnswerOlderThanDesignatorsAreItsBytes) {
    EXPECT_EQ(shown(namesOf(page("\x60\x06\x04\x80\x00\x01\x23\x45\x67\x89\xab\xcd\xef\x01\x23\x45"s))),
              " |  | 360060480000123456789abcdef012345 | 360060480000123456789abcdef012345 | "
              "scsi-360060480000123456789abcdef012345 wwn-0x60060480000123456789abcdef012345");
}

TEST(Names, AreEmptyWithoutAPage) {
    EXPECT_EQ(view::namesOf({}, "ACME", "DISK"), Names());
    EXPECT_EQ(namesOf(page("")), Names());
    EXPECT_EQ(namesOf("\0\x83"s), Names());
}

TEST(Names, AreEmptyForAPageOfAnotherCode) {
    EXPECT_EQ(namesOf(page(designator(kBinary, kNaa, kNaa6), '\x80')), Names());
}

TEST(Names, OfADesignatorOfAnOddLengthAreNotAgreedOn) {
    EXPECT_EQ(shown(namesOf(page(designator(kBinary, kNaa, kNaa5.substr(0, 7))))),
              " |  | 35000c500103f70 | 35000c500103f70 | scsi-35000c500103f70 wwn-0x5000c500103f70");
}

TEST(Names, AreNotAgreedOnWhereADesignatorIsLongerThanThePage) {
    std::string cut = page(designator(kBinary, kEui64, kEui) + designator(kBinary, kNaa, kNaa6));
    cut.resize(cut.size() - 4);
    cut[3] = static_cast<char>(cut.size() - 4);
    EXPECT_EQ(shown(namesOf(cut)),
              "2001b4d2008231188 | naa.60060160b4c02e00a07d5c3f | 360060160b4c02e00a07d5c3f00000000 | "
              "2001b4d2008231188 | scsi-2001b4d2008231188 scsi-360060160b4c02e00a07d5c3f00000000 "
              "wwn-0x60060160b4c02e00a07d5c3f00000000");
}

TEST(Names, InLinksHoldNoBytesThatAFileNameShouldNot) {
    EXPECT_EQ(namesOf(page(designator(kAscii, kT10, "ACME\t a\n\xc3\xbc\xff;b"))).links,
              (std::vector<std::string>{"scsi-1ACME_a....\\x3bb", "scsi-1ACME_a_\xc3\xbc__b"}));
}

TEST(Names, OfTheLongestDesignatorsEndWhereTheProgramsEndThem) {
    const std::string serial(247, 's');
    const Names names = namesOf(page(designator(kAscii, kT10, "ACME    " + serial)));
    EXPECT_EQ(names.multipath, "1ACME_" + std::string(120, 's'));
    EXPECT_EQ(names.kernel, "t10.ACME    " + serial);
    EXPECT_EQ(names.scsiId, "");
}

} // namespace
