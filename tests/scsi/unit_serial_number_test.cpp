#include <gtest/gtest.h>

#include "foundation/exceptions.hpp"
#include "scsi/scsi_exceptions.hpp"
#include "tests/support/failing_memory.hpp"
#include "tests/support/inquiry_fixture.hpp"
#include "tests/support/thrown.hpp"

namespace {

class UnitSerialNumber : public InquiryFixture {
protected:
    void read() { mInquiry.getUnitSerialNumberVpd(kFd, mHandler, kTimeOutMs, mResponse); }

    std::string text() {
        ZebString serial("");
        mInquiry.getUsnPageFieldAscii(mResponse, serial);
        return serial.c_str();
    }

    static std::string firstPass() {
        return entered("getUnitSerialNumberVpd") + madeContext() + "lcAllocLength = 4\n" +
               carriedOut(inquiryCdb(1, 0x80, 4)) +
               "Going to Determine the length of product serial number\n" + tookReadPointer();
    }
};

TEST_F(UnitSerialNumber, IsReadInTwoPasses) {
    const Bytes page = vpdPage(0x80, bytesOf("3KS0ABCD"));
    mKernel.answers = {good(page), good(page)};
    const LogCapture log;
    read();
    EXPECT_EQ(log.text(), "Entered Function getUnitSerialNumberVpd Line #\n" + madeContext() +
                              "lcAllocLength = 4\n" + carriedOut({0x12, 1, 0x80, 0, 4, 0}) +
                              "Going to Determine the length of product serial number\n"
                              "Entered Function operator const uint8* Line #\n"
                              "USN length is: 8 bytes\n"
                              "Sending Inquiry again with alloc length: 12 bytes\n" +
                              carriedOutAgain({0x12, 1, 0x80, 0, 12, 0}) +
                              "Left Function getUnitSerialNumberVpd Line #\n" + freedContext());
    EXPECT_EQ(cdbs(), (std::vector<Bytes>{{0x12, 1, 0x80, 0, 4, 0}, {0x12, 1, 0x80, 0, 12, 0}}));
    EXPECT_EQ(text(), "3KS0ABCD");
}

TEST_F(UnitSerialNumber, OfNoBytesFailsWithoutASecondCommand) {
    mKernel.answers = {good(vpdPage(0x80, {}))};
    const LogCapture log;
    EXPECT_EQ(messageOf<NotSupportedEx>([&] { read(); }), "Unit serial number not returned\n");
    EXPECT_EQ(mKernel.commands.size(), 1U);
    EXPECT_EQ(log.text(), firstPass() +
                              "USN length is: 0 bytes\n"
                              "Unit serial number not returned\n" +
                              left("getUnitSerialNumberVpd") + freedContext());
}

TEST_F(UnitSerialNumber, Of255BytesNeedsALargerBuffer) {
    const Bytes page = vpdPage(0x80, Bytes(255, 'S'));
    mKernel.answers = {good(page), good(page)};
    const LogCapture log;
    read();
    // The old buffer stays with the response until the second command has ended well.
    const Bytes cdb = inquiryCdb(1, 0x80, 259);
    EXPECT_EQ(log.text(), firstPass() +
                              "USN length is: 255 bytes\n"
                              "Sending Inquiry again with alloc length: 259 bytes\n" +
                              createdCdb(cdb, madeBuffer(), freedBuffer()) + traced("doScsiIo") +
                              gotResponse(freedBuffer()) + left("getUnitSerialNumberVpd") + freedContext());
    EXPECT_EQ(mKernel.commands[1].transferLength, 259U);
    EXPECT_EQ(mResponse->length(), 259U);
    EXPECT_EQ(text(), std::string(255, 'S'));
}

TEST_F(UnitSerialNumber, IsNotReadAgainWhenTheDeviceRefusesThePage) {
    mKernel.answers = {pageRefused()};
    const LogCapture log;
    EXPECT_EQ(messageOf<NotSupportedEx>([&] { read(); }), "Illegal request in CDB\n");
    EXPECT_EQ(log.text(), entered("getUnitSerialNumberVpd") + madeContext() + "lcAllocLength = 4\n" +
                              createdCdb(inquiryCdb(1, 0x80, 4)) + traced("doScsiIo") +
                              "Illegal request in CDB\n" + freedContext() + freedBuffer());
}

TEST_F(UnitSerialNumber, AFailingSecondPassLeavesTheErasedFirstResponse) {
    mKernel.answers = {good(vpdPage(0x80, bytesOf("ABC"))), statusOnly(0x08)};
    const LogCapture unheard;
    EXPECT_EQ(messageOf<ScsiStatusEx>([&] { read(); }), "Scsi Inquiry failed\n");
    EXPECT_EQ(mResponse->length(), 256U);
    EXPECT_EQ(mResponse->byte(1), 0);
}

TEST_F(UnitSerialNumber, IsTheTextBehindThePageHeader) {
    const ZebScsiInquiry::Response page = responseOf(vpdPage(0x80, bytesOf(" 3KS0ABCD ")));
    ZebString serial("");
    const LogCapture log;
    mInquiry.getUsnPageFieldAscii(page, serial);
    EXPECT_STREQ(serial.c_str(), " 3KS0ABCD ");
    EXPECT_EQ(log.text(), traced("getUsnPageFieldAscii", tookReadPointer() + "USN is  3KS0ABCD \n"));
}

TEST_F(UnitSerialNumber, OfAnotherPageIsRefused) {
    const ZebScsiInquiry::Response page = responseOf(vpdPage(0x83, bytesOf("ABC")));
    ZebString serial("");
    const LogCapture log;
    EXPECT_EQ(messageOf<InvalidEx>([&] { mInquiry.getUsnPageFieldAscii(page, serial); }),
              "Buffer does not represent a USN VPD page\n");
    EXPECT_EQ(log.text(), traced("getUsnPageFieldAscii",
                                 tookReadPointer() + "Buffer does not represent a USN VPD page\n"));
}

TEST_F(UnitSerialNumber, OfABufferThatIsTooShortIsRefused) {
    const LogCapture unheard;
    const ZebScsiInquiry::Response page = responseOf({0}, 1);
    ZebString serial("");
    EXPECT_EQ(messageOf<InvalidEx>([&] { mInquiry.getUsnPageFieldAscii(page, serial); }),
              "Buffer does not represent a USN VPD page\n");
}

TEST_F(UnitSerialNumber, BehindTheBufferIsZeros) {
    const LogCapture unheard;
    Bytes bytes = vpdPage(0x80, Bytes(252, 'S'));
    bytes[3] = 255;
    mResponse = responseOf(bytes);
    EXPECT_EQ(text(), std::string(252, 'S'));
}

TEST_F(UnitSerialNumber, NeedsMemory) {
    const LogCapture unheard;
    mResponse = responseOf(vpdPage(0x80, bytesOf("ABC")));
    const FailingCalloc failing;
    EXPECT_EQ(messageOf<NoMemoryEx>([&] { text(); }), "No Memory\n");
}

TEST_F(UnitSerialNumber, InBinaryDoesNothing) {
    const LogCapture log;
    mInquiry.getUsnPageFieldBinary();
    EXPECT_EQ(log.text(), traced("getUsnPageFieldBinary"));
}

} // namespace
