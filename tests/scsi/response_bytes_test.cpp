#include "scsi/response_bytes.hpp"

#include <gtest/gtest.h>

#include "foundation/exceptions.hpp"
#include "tests/support/failing_memory.hpp"
#include "tests/support/inquiry_data.hpp"
#include "tests/support/log_capture.hpp"
#include "tests/support/scsi_log.hpp"
#include "tests/support/thrown.hpp"

namespace {

// The bytes, which end where the buffer does.
class Sample {
public:
    explicit Sample(const Bytes& bytes)
        : mBuffer(responseOf(bytes, static_cast<uint32>(bytes.size()))), mBytes(*mBuffer) {}
    operator const ResponseBytes&() const { return mBytes; } // NOLINT(google-explicit-constructor)

private:
    LogCapture mUnheard;
    ZebCountedPointer<ZebBuffer> mBuffer;
    ResponseBytes mBytes;
};

TEST(ResponseBytesTest, TakesThePointerOnce) {
    const ZebCountedPointer<ZebBuffer> buffer = responseOf({1, 2, 3}, 3);
    const LogCapture log;
    const ResponseBytes bytes(*buffer);
    EXPECT_EQ(bytes.length(), 3U);
    EXPECT_EQ(bytes[0], 1);
    EXPECT_EQ(bytes[2], 3);
    EXPECT_EQ(log.text(), tookReadPointer());
}

TEST(ResponseBytesTest, AByteBehindTheEndIsZero) {
    const Sample sample({1, 2, 3});
    const ResponseBytes& bytes = sample;
    EXPECT_EQ(bytes[3], 0);
    EXPECT_EQ(bytes[0xFFFFFFFF], 0);
}

TEST(ResponseText, IsTheBytesAsTheyStand) {
    const Sample sample(bytesOf("EMC     x"));
    EXPECT_STREQ(asciiText(sample, 0, 8).c_str(), "EMC     ");
    EXPECT_STREQ(asciiText(sample, 0, 0).c_str(), "");
}

TEST(ResponseText, EndsAtANulAndBehindTheBuffer) {
    const Sample sample({'a', 'b', 0, 'c'});
    EXPECT_STREQ(asciiText(sample, 0, 4).c_str(), "ab");
    EXPECT_STREQ(asciiText(sample, 3, 200).c_str(), "c");
    EXPECT_STREQ(asciiText(sample, 4, 3).c_str(), "");
}

TEST(ResponseText, NeedsMemory) {
    const Sample sample(bytesOf("x"));
    const FailingCalloc failing;
    EXPECT_EQ(messageOf<NoMemoryEx>([&] { asciiText(sample, 0, 1); }), "No Memory\n");
}

TEST(ResponseHex, HasTwoUpperCaseDigitsAByte) {
    const Sample sample({0x60, 0x0A, 0x00, 0x0F, 0x10, 0xFF, 0xAB});
    EXPECT_STREQ(hexText(sample, 0, 7).c_str(), "600A000F10FFAB");
    EXPECT_STREQ(hexText(sample, 1, 1).c_str(), "0A");
    EXPECT_STREQ(hexText(sample, 0, 0).c_str(), "");
}

TEST(ResponseHex, ShowsBytesBehindTheEndAsZeros) {
    const Sample sample({0x60, 0x0A});
    EXPECT_STREQ(hexText(sample, 1, 3).c_str(), "0A0000");
}

TEST(ResponseHex, HasNoLimit) {
    const Sample sample(Bytes(255, 0xC5));
    std::string expected;
    for (int i = 0; i < 255; ++i) {
        expected += "C5";
    }
    EXPECT_EQ(hexText(sample, 0, 255).c_str(), expected);
}

} // namespace
