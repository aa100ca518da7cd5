#include <optional>

#include <gtest/gtest.h>

#include "foundation/exceptions.hpp"
#include "scsi/scsi_exceptions.hpp"
#include "tests/support/failing_memory.hpp"
#include "tests/support/fatal.hpp"
#include "tests/support/inquiry_fixture.hpp"
#include "tests/support/thrown.hpp"

namespace {

const Bytes kNaa = {0x60, 0x06, 0x04, 0x80, 0x00, 0x01, 0x87, 0x90,
                    0x00, 0x31, 0x53, 0x30, 0x31, 0x30, 0x38, 0x42};

// Reading the page.

class DeviceIdentification : public InquiryFixture {
protected:
    void read() { mInquiry.getDeviceIdentificationVpd(kFd, mHandler, kTimeOutMs, mResponse); }

    static std::string firstPass() {
        return entered("getDeviceIdentificationVpd") + madeContext() + "lcAllocLength = 4\n" +
               carriedOut(inquiryCdb(1, 0x83, 4)) +
               "Determining the length of Identification descriptor list\n"
               "Going to dump the DI VPD page heder\n" +
               tookReadPointer();
    }
};

TEST_F(DeviceIdentification, IsReadInTwoPasses) {
    Bytes page = vpdPage(0x83, designator(kBinaryCodeSet, 0, 3, {0x50, 0x00}));
    page[0] = 0x6C; // a device that is not there, of type 12
    mKernel.answers = {good(page), good(page)};
    const LogCapture log;
    read();
    EXPECT_EQ(log.text(), "Entered Function getDeviceIdentificationVpd Line #\n" + madeContext() +
                              "lcAllocLength = 4\n" + carriedOut({0x12, 1, 0x83, 0, 4, 0}) +
                              "Determining the length of Identification descriptor list\n"
                              "Going to dump the DI VPD page heder\n"
                              "Entered Function operator const uint8* Line #\n"
                              "Going to dump 4 bytes\n"
                              "Byte 0: 0x6cByte 1: 0x83Byte 2: 0x0Byte 3: 0x6\n"
                              "Identification descriptor list length is: 6 bytes\n"
                              "Sending Inquiry again with alloc length: 10 bytes\n" +
                              carriedOutAgain({0x12, 1, 0x83, 0, 10, 0}) +
                              "Going to dump entire DI VPD page\n"
                              "Entered Function operator const uint8* Line #\n"
                              "Going to dump 10 bytes\n"
                              "Byte 0: 0x6cByte 1: 0x83Byte 2: 0x0Byte 3: 0x6"
                              "Byte 4: 0x1Byte 5: 0x3Byte 6: 0x0Byte 7: 0x2Byte 8: 0x50Byte 9: 0x0\n"
                              "Entered Function operator const uint8* Line #\n"
                              "Peripheral type from vpd page = 12\n"
                              "Left Function getDeviceIdentificationVpd Line #\n" +
                              freedContext());
    EXPECT_EQ(cdbs(), (std::vector<Bytes>{{0x12, 1, 0x83, 0, 4, 0}, {0x12, 1, 0x83, 0, 10, 0}}));
}

TEST_F(DeviceIdentification, WithoutDescriptorsFailsWithoutASecondCommand) {
    mKernel.answers = {good(vpdPage(0x83, {}))};
    const LogCapture log;
    EXPECT_EQ(messageOf<NotSupportedEx>([&] { read(); }), "Identification descriptor list not returned\n");
    EXPECT_EQ(mKernel.commands.size(), 1U);
    EXPECT_EQ(log.text(), firstPass() + dumped({0, 0x83, 0, 0}) +
                              "Identification descriptor list length is: 0 bytes\n"
                              "Identification descriptor list not returned\n" +
                              left("getDeviceIdentificationVpd") + freedContext());
}

TEST_F(DeviceIdentification, WithAListAbove255BytesNeedsBothLengthBytes) {
    const Bytes page = vpdPage(0x83, Bytes(0x0102, 0xAB));
    mKernel.answers = {good(page), good(page)};
    const LogCapture unheard;
    read();
    EXPECT_EQ(cdbs(), (std::vector<Bytes>{{0x12, 1, 0x83, 0, 4, 0}, {0x12, 1, 0x83, 1, 6, 0}}));
    EXPECT_EQ(mKernel.commands[0].transferLength, 256U);
    EXPECT_EQ(mKernel.commands[1].transferLength, 262U);
    EXPECT_EQ(mResponse->length(), 262U);
    EXPECT_EQ(mResponse->byte(261), 0xAB);
}

TEST_F(DeviceIdentification, TheLongestListThatFitsIsReadWhole) {
    const Bytes page = vpdPage(0x83, Bytes(65531, 0));
    mKernel.answers = {good(page), good(page)};
    const LogCapture log;
    read();
    EXPECT_EQ(cdbs().back(), inquiryCdb(1, 0x83, 65535));
    EXPECT_NE(log.text().find("Going to dump entire DI VPD page\n" + tookReadPointer() +
                              "Going to dump 65535 bytes\n"),
              std::string::npos);
}

TEST_F(DeviceIdentification, ALongerListWrapsTheAllocationLengthAndTheDump) {
    Bytes page = vpdPage(0x83, Bytes(65534, 0x11));
    mKernel.answers = {good(page), good(page)};
    const LogCapture log;
    read();
    EXPECT_EQ(cdbs().back(), inquiryCdb(1, 0x83, 2));
    EXPECT_EQ(log.text(), firstPass() + dumped({0, 0x83, 0xFF, 0xFE}) +
                              "Identification descriptor list length is: 65534 bytes\n"
                              "Sending Inquiry again with alloc length: 2 bytes\n" +
                              carriedOutAgain(inquiryCdb(1, 0x83, 2)) + "Going to dump entire DI VPD page\n" +
                              tookReadPointer() + dumped({0, 0x83}) + tookReadPointer() +
                              "Peripheral type from vpd page = 0\n" + left("getDeviceIdentificationVpd") +
                              freedContext());
}

TEST_F(DeviceIdentification, AnAllocationLengthThatWrapsTo0AsksForNothing) {
    const Bytes page = vpdPage(0x83, Bytes(65532, 0x11));
    mKernel.answers = {good(page), good(page)};
    const LogCapture log;
    read();
    EXPECT_EQ(cdbs().back(), inquiryCdb(1, 0x83, 0));
    EXPECT_NE(log.text().find("Going to dump 0 bytes\n\n" + tookReadPointer()), std::string::npos);
}

TEST_F(DeviceIdentification, OfARefusedPageHandsNothingOut) {
    mKernel.answers = {pageRefused()};
    const LogCapture unheard;
    EXPECT_EQ(messageOf<NotSupportedEx>([&] { read(); }), "Illegal request in CDB\n");
    EXPECT_FALSE(mResponse != nullptr);
}

TEST_F(DeviceIdentification, AFailingSecondPassLeavesTheErasedFirstResponse) {
    mKernel.answers = {good(vpdPage(0x83, kNaa)), pageRefused()};
    const LogCapture unheard;
    EXPECT_EQ(messageOf<NotSupportedEx>([&] { read(); }), "Illegal request in CDB\n");
    EXPECT_EQ(mResponse->length(), 256U);
    EXPECT_EQ(mResponse->byte(1), 0);
}

// Walking its descriptors.

struct Designator {
    uint32 type = 0;
    uint32 association = 0;
    ZebString text{"as before"};
};

class DescriptorWalk : public testing::Test {
protected:
    void SetUp() override { mUnheard.emplace(); }

    void setPage(const Bytes& page, uint32 length = 256) { mPage = responseOf(page, length); }

    Designator next() {
        Designator designator;
        const LogCapture log;
        mInquiry.getDiPageIdentifierAscii(mPage, mOffset, designator.type, designator.association,
                                          designator.text);
        mLog = log.text();
        return designator;
    }

    template <typename Exception>
    std::string refusal() {
        Designator designator;
        const LogCapture log;
        std::string message = messageOf<Exception>([&] {
            mInquiry.getDiPageIdentifierAscii(mPage, mOffset, designator.type, designator.association,
                                              designator.text);
        });
        mLog = log.text();
        return message;
    }

    void expectMalformed(uint32 offset) {
        SCOPED_TRACE(offset);
        mOffset = offset;
        EXPECT_EQ(refusal<InvalidEx>(), "Device Identification Data is malformed\n");
        EXPECT_EQ(mLog, traced("getDiPageIdentifierAscii",
                               tookReadPointer() + "Device Identification Data is malformed\n"));
    }

    std::optional<LogCapture> mUnheard; // what the making of pages says
    ZebScsiInquiry mInquiry;
    ZebScsiInquiry::Response mPage;
    uint32 mOffset = 0;
    std::string mLog;
};

TEST_F(DescriptorWalk, GivesOneDesignatorACallAndEndsWithNotFound) {
    const Bytes first = designator(kAsciiCodeSet, 0, 1, bytesOf("HITACHI R500"));
    const Bytes second = designator(kBinaryCodeSet, 1, 3, {0x50, 0x06});
    setPage(vpdPage(0x83, joined({first, second})));

    Designator found = next();
    EXPECT_EQ(found.type, 1U);
    EXPECT_EQ(found.association, 0U);
    EXPECT_STREQ(found.text.c_str(), "HITACHI R500");
    EXPECT_EQ(mOffset, 20U);
    EXPECT_EQ(mLog, "Entered Function getDiPageIdentifierAscii Line #\n"
                    "Entered Function operator const uint8* Line #\n"
                    "Going to Extract Data from Descriptor @ 4\n"
                    "Going to dump 16 bytes\n"
                    "Byte 0: 0x2Byte 1: 0x1Byte 2: 0x0Byte 3: 0xc"
                    "Byte 4: 0x48Byte 5: 0x49Byte 6: 0x54Byte 7: 0x41Byte 8: 0x43Byte 9: 0x48Byte 10: 0x49"
                    "Byte 11: 0x20Byte 12: 0x52Byte 13: 0x35Byte 14: 0x30Byte 15: 0x30\n"
                    "Going to store identifier in ASCII format\n"
                    "ID Type: 01; Association type: 00; Identifier: 'HITACHI R500'\n"
                    "Left Function getDiPageIdentifierAscii Line #\n");

    found = next();
    EXPECT_EQ(found.type, 3U);
    EXPECT_EQ(found.association, 1U);
    EXPECT_STREQ(found.text.c_str(), "5006");
    EXPECT_EQ(mOffset, 26U);
    EXPECT_EQ(mLog,
              traced("getDiPageIdentifierAscii",
                     tookReadPointer() + "Going to Extract Data from Descriptor @ 20\n" + dumped(second) +
                         "Going to store identifier in Binary format\n"
                         "ID Type: 03; Association type: 01; Identifier: '5006'\n"));

    EXPECT_EQ(refusal<NotFoundEx>(), "No more descriptors left in DI page\n");
    EXPECT_EQ(mLog, traced("getDiPageIdentifierAscii",
                           tookReadPointer() + "No more descriptors left in DI page to read\n"));
}

TEST_F(DescriptorWalk, WritesBinaryBytesAsTwoHexDigits) {
    setPage(vpdPage(0x83, designator(kBinaryCodeSet, 0, 3, {0x60, 0x0A})));
    EXPECT_STREQ(next().text.c_str(), "600A");
}

TEST_F(DescriptorWalk, TakesUtf8LikeAscii) {
    setPage(vpdPage(0x83, designator(kUtf8CodeSet, 0, 8, bytesOf("iqn.2001-04.com.example:x  "))));
    const Designator found = next();
    EXPECT_EQ(found.type, 8U);
    EXPECT_STREQ(found.text.c_str(), "iqn.2001-04.com.example:x  ");
    EXPECT_NE(mLog.find("Going to store identifier in ASCII format\n"), std::string::npos);
}

TEST_F(DescriptorWalk, SplitsByte1AndTheCodeSetFromWhatStandsBesideThem) {
    Bytes descriptor = designator(kBinaryCodeSet, 0, 3, {0x50});
    descriptor[0] = 0x61; // protocol identifier beside the code set
    descriptor[1] = 0xEF; // PIV and a reserved bit beside association 2 and type 15
    setPage(vpdPage(0x83, descriptor));
    const Designator found = next();
    EXPECT_EQ(found.type, 15U);
    EXPECT_EQ(found.association, 2U);
    EXPECT_STREQ(found.text.c_str(), "50");
    EXPECT_NE(mLog.find("ID Type: 0f; Association type: 02; Identifier: '50'\n"), std::string::npos);
}

TEST_F(DescriptorWalk, AnUndefinedCodeSetHasNoTypeNoAssociationAndNoTextAndMovesOn) {
    for (const uint8 codeSet : Bytes{0, 4, 15}) {
        SCOPED_TRACE(static_cast<int>(codeSet));
        const Bytes odd = designator(codeSet, 0, 3, {0x50, 0x06});
        setPage(vpdPage(0x83, joined({odd, designator(kAsciiCodeSet, 0, 1, bytesOf("T10"))})));
        mOffset = 0;
        const Designator found = next();
        EXPECT_EQ(found.type, 0xFFFFFFFFU);
        EXPECT_EQ(found.association, 0xFFFFFFFFU);
        EXPECT_STREQ(found.text.c_str(), "as before");
        EXPECT_EQ(mOffset, 10U);
        EXPECT_EQ(mLog,
                  traced("getDiPageIdentifierAscii",
                         tookReadPointer() + "Going to Extract Data from Descriptor @ 4\n" + dumped(odd) +
                             "Identifier format is undefined.\n"
                             "ID Type: 0ffffffff; Association type: 0ffffffff; "
                             "Identifier: 'as before'\n"));
        EXPECT_STREQ(next().text.c_str(), "T10");
    }
}

TEST_F(DescriptorWalk, AnEmptyIdentifierIsAnEmptyText) {
    setPage(vpdPage(0x83, designator(kBinaryCodeSet, 0, 3, {})));
    EXPECT_STREQ(next().text.c_str(), "");
    EXPECT_EQ(mOffset, 8U);
}

TEST_F(DescriptorWalk, TheLongestIdentifierIsShownWhole) {
    setPage(vpdPage(0x83, designator(kBinaryCodeSet, 0, 3, Bytes(255, 0xC5))), 263);
    std::string expected;
    for (int i = 0; i < 255; ++i) {
        expected += "C5";
    }
    EXPECT_STREQ(next().text.c_str(), expected.c_str());
    EXPECT_EQ(mOffset, 263U);
    EXPECT_EQ(refusal<NotFoundEx>(), "No more descriptors left in DI page\n");
}

TEST_F(DescriptorWalk, AnOffsetPastTheEndIsMalformed) {
    setPage(vpdPage(0x83, designator(kBinaryCodeSet, 0, 3, {0x50, 0x06})));
    expectMalformed(11);
    expectMalformed(1000);
    expectMalformed(0xFFFFFFFF);
}

TEST_F(DescriptorWalk, AnOffsetAtTheEndIsTheEnd) {
    setPage(vpdPage(0x83, designator(kBinaryCodeSet, 0, 3, {0x50, 0x06})));
    mOffset = 10;
    EXPECT_EQ(refusal<NotFoundEx>(), "No more descriptors left in DI page\n");
}

TEST_F(DescriptorWalk, ADescriptorThatRunsOverTheEndIsMalformed) {
    Bytes page = vpdPage(0x83, designator(kBinaryCodeSet, 0, 3, {0x50, 0x06}));
    page[7] = 3;
    setPage(page);
    expectMalformed(0);
}

TEST_F(DescriptorWalk, ADescriptorHeaderThatRunsOverTheEndIsMalformed) {
    const Bytes page = vpdPage(0x83, joined({designator(kBinaryCodeSet, 0, 1, {0x50}), {1, 3}}));
    setPage(page);
    expectMalformed(9);
    setPage(page, static_cast<uint32>(page.size())); // and over the buffer's end as well
    expectMalformed(9);
}

TEST_F(DescriptorWalk, AnOldArraysPageWithoutDescriptorsIsMalformed) {
    setPage(vpdPage(0x83, kNaa));
    expectMalformed(0);
}

TEST_F(DescriptorWalk, APageThatIsLongerThanItsBufferIsRefusedWithAnEmptyLine) {
    Bytes page = vpdPage(0x83, Bytes(253, 0));
    page.resize(256);
    setPage(page);
    EXPECT_EQ(refusal<InvalidEx>(), "length 257 morethan expected 256\n");
    EXPECT_EQ(mLog,
              traced("getDiPageIdentifierAscii", tookReadPointer() + "length 257 morethan expected 256\n\n"));
    setPage({0, 0x83, 0xFF, 0xFF}, 4);
    EXPECT_EQ(refusal<InvalidEx>(), "length 65539 morethan expected 4\n");
}

TEST_F(DescriptorWalk, AnotherPageIsRefused) {
    setPage(vpdPage(0x80, bytesOf("ABC")));
    EXPECT_EQ(refusal<InvalidEx>(), "Input buffer does not contain a DI VPD Page\n");
    EXPECT_EQ(mLog, traced("getDiPageIdentifierAscii",
                           tookReadPointer() + "Input buffer does not contain a DI VPD Page\n"));
}

TEST_F(DescriptorWalk, NeedsMemoryForAnAsciiText) {
    setPage(vpdPage(0x83, designator(kAsciiCodeSet, 0, 1, bytesOf("T10"))));
    const FailingCalloc failing;
    EXPECT_EQ(refusal<NoMemoryEx>(), "No Memory\n");
}

TEST_F(DescriptorWalk, InBinaryDoesNothing) {
    const LogCapture log;
    mInquiry.getDiPageIdentifierBinary();
    EXPECT_EQ(log.text(), traced("getDiPageIdentifierBinary"));
}

TEST(DescriptorWalkDeathTest, APageWithoutAListEndsTheProgram) {
    ZebScsiInquiry inquiry;
    ZebScsiInquiry::Response page;
    {
        const LogCapture unheard;
        page = responseOf({0, 0x83, 0, 0});
    }
    uint32 offset = 0;
    Designator designator;
    EXPECT_FATAL(inquiry.getDiPageIdentifierAscii(page, offset, designator.type, designator.association,
                                                  designator.text),
                 entered("getDiPageIdentifierAscii") + tookReadPointer() +
                     "Assertion [ 0 != lcListLength ] failed\n");
    const LogCapture unheard;
    page.release();
}

} // namespace
