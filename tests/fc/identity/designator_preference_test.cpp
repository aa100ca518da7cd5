#include <algorithm>
#include <array>
#include <iterator>
#include <numeric>

#include <gtest/gtest.h>

#include "fc/identity/unique_lun_id.hpp"
#include "main/shared/run_state.hpp"
#include "tests/fc/identity/unique_lun_id_log.hpp"

namespace {

constexpr uint32 kFlags[] = {1, 2, 4};

// One kind of designator, in the order of preference.
struct Kind {
    uint8 type;
    uint8 codeSet;
    Bytes identifier;
    std::string text;    // as it stands
    std::string trimmed; // as it counts
    std::string label;
};

const std::array<Kind, 5>& kinds() {
    static const std::array<Kind, 5> kKinds = {
        {{3, kBinaryCodeSet, {0x60, 0x0A, 0x0B}, "600A0B", "600A0B", "NaaId"},
         {1, kAsciiCodeSet, bytesOf("HP  A1  "), "HP  A1  ", "HP  A1", "T10 Id"},
         {2, kBinaryCodeSet, {0x00, 0x02}, "0002", "0002", "Eui64Id"},
         {8, kUtf8CodeSet, bytesOf("eui.x "), "eui.x ", "eui.x", "ScsiName ID"},
         {7, kBinaryCodeSet, {0xFF}, "FF", "FF", "MD5ID"}}};
    return kKinds;
}

class DesignatorPreference : public testing::TestWithParam<uint32> {
protected:
    // Asks a device with these designators; the log must say each step of the way, and the identifier must
    // be the counting kind that ranks first.
    void ask(const std::vector<std::size_t>& order, unsigned counting) {
        std::vector<Bytes> descriptors;
        std::string walk;
        std::string firstSeen;
        std::size_t best = kinds().size();
        std::size_t offset = 4;
        bool isWalking = true;
        const auto add = [&](const Bytes& descriptor, const std::string& text, const std::string& line) {
            descriptors.push_back(descriptor);
            if (isWalking) {
                walk += walkedTo(offset, descriptor, text) + line;
            }
            offset += descriptor.size();
        };
        uint8 reserved = 10;
        for (const std::size_t index : order) {
            const Kind& kind = kinds().at(index);
            // Of the logical unit itself, but of a type that has no meaning.
            add(designator(kBinaryCodeSet, 0, reserved, {0x77}), "77", "");
            reserved = static_cast<uint8>(reserved == 15 ? 10 : reserved + 1);
            const bool counts = (counting >> index & 1U) != 0;
            // The others are the port's (1) and the target device's (2).
            const auto association = static_cast<uint8>(counts ? 0 : 1 + index % 2);
            add(designator(kind.codeSet, association, kind.type, kind.identifier), kind.text,
                counts ? "Found " + kind.label + ": " + kind.trimmed + " \n" : "");
            if (counts && isWalking) {
                best = std::min(best, index);
                firstSeen = firstSeen.empty() ? kind.trimmed : firstSeen;
                isWalking = kind.type != 3;
            }
        }
        walk += isWalking ? walkedToEnd() : "";

        Bytes content;
        for (const Bytes& descriptor : descriptors) {
            content.insert(content.end(), descriptor.begin(), descriptor.end());
        }
        const Bytes page = vpdPage(0x83, content);
        const Bytes standard = standardData(0, "ACME", "DISK", "1.0", {0});
        const bool isFound = best < kinds().size();
        const bool isDirectAttached = !isFound && GetParam() == 2;
        const bool isFallback = !isFound && !isDirectAttached;
        const std::string expected = isFound ? kinds().at(best).trimmed : isFallback ? "ACME:DISK:1.0:" : "";

        FakeKernel kernel;
        kernel.answers = {good(standard), good(page), good(page)};
        if (isFallback) {
            kernel.answers.push_back(good(standard));
        }
        gDirectAttachedFlag = false;
        uint32 flag = GetParam();
        ZebString identifier("");
        const LogCapture log;
        HA_GetScsiUniqueLunId("/dev/sda", identifier, flag);

        ASSERT_EQ(identifier.c_str(), expected);
        ASSERT_EQ(gDirectAttachedFlag, isDirectAttached);
        ASSERT_TRUE(kernel.openDescriptors.empty());
        const std::string end = isFallback ? didStandardInquiry(freedBuffer()) + gotField(0) +
                                                 "InqBuffer # Vendor ACME \n" + gotField(1) + gotField(2) +
                                                 gotField(3) +
                                                 "UniqueLunId from Standard Inquiry = ACME:DISK:1.0:\n" +
                                                 traced("close") + left("HA_GetScsiUniqueLunId")
                                           : gotIdentifier();
        ASSERT_EQ(withoutAddresses(log.text()),
                  entered("HA_GetScsiUniqueLunId") + openedDisk() + readPage(page) + walk +
                      (isFound ? "Old Unique LunId = " + firstSeen + ", New Unique LunId = " + expected + "\n"
                               : "Could not find UniqueLunId from VPD Page 83, for device /dev/sda\n") +
                      end + freedBuffer() + freedBuffer());
    }
};

// Whether those that do not count stand in one fixed order: their other orders show nothing new.
bool isRepresentative(const std::vector<std::size_t>& order, unsigned counting) {
    std::vector<std::size_t> others;
    std::copy_if(order.begin(), order.end(), std::back_inserter(others),
                 [&](std::size_t index) { return (counting >> index & 1U) == 0; });
    return std::is_sorted(others.begin(), others.end());
}

TEST_P(DesignatorPreference, IsTheSameInWhateverOrderTheDesignatorsStand) {
    std::vector<std::size_t> order(kinds().size());
    std::iota(order.begin(), order.end(), 0U);
    int asked = 0;
    do {
        for (unsigned counting = 0; counting < 32; ++counting) {
            if (isRepresentative(order, counting)) {
                SCOPED_TRACE(testing::PrintToString(order) + " " + std::to_string(counting));
                ask(order, counting);
                ++asked;
            }
            if (HasFatalFailure()) {
                return;
            }
        }
    } while (std::next_permutation(order.begin(), order.end()));
    EXPECT_EQ(asked, 1546); // all ways to choose some of the five, in all orders, among the rest
}

INSTANTIATE_TEST_SUITE_P(RequestFlag, DesignatorPreference, testing::ValuesIn(kFlags));

} // namespace
