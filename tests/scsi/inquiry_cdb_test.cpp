#include <gtest/gtest.h>

#include "scsi/inquiry.hpp"
#include "scsi/io_context_linux.hpp"
#include "tests/support/inquiry_data.hpp"
#include "tests/support/log_capture.hpp"
#include "tests/support/scsi_log.hpp"

namespace {

class InquiryCdb : public testing::Test {
protected:
    void SetUp() override {
        const LogCapture unheard;
        mContext.create(new ZebScsiIoContextLinux, ZebPST_Individual, ZebPAT_New);
    }
    void TearDown() override {
        const LogCapture unheard;
        mContext.release();
    }

    Bytes cdb(uint8 evpd, uint8 pageCode, uint16 allocLength) {
        const LogCapture log;
        mInquiry.createInquiryCDB(mContext, evpd, pageCode, allocLength);
        mLog = log.text();
        const sg_io_hdr& sent = header();
        return {sent.cmdp, sent.cmdp + sent.cmd_len};
    }

    const sg_io_hdr& header() const { return mContext->ioObject()->header; }

    ZebScsiInquiry mInquiry;
    ZebScsiInquiry::Context mContext;
    std::string mLog;
};

TEST_F(InquiryCdb, OfStandardDataIsLoggedByteByByte) {
    EXPECT_EQ(cdb(0, 0, 36), (Bytes{0x12, 0, 0, 0, 0x24, 0}));
    EXPECT_EQ(mLog, "Entered Function createInquiryCDB Line #\n"
                    "Going to create the Inquiry command\n"
                    "SCSI Inquiry CDB Dump:Going to dump 6 bytes\n"
                    "Byte 0: 0x12Byte 1: 0x0Byte 2: 0x0Byte 3: 0x0Byte 4: 0x24Byte 5: 0x0\n"
                    "Entered Function ZebBuffer Line #\n"
                    "Left Function ZebBuffer Line #\n"
                    "Entered Function copy Line #\n"
                    "Left Function copy Line #\n"
                    "Entered Function addDataInScsiCdb Line #\n"
                    "Entered Function _init Line #\n"
                    "Entered Function erase Line #\n"
                    "Left Function erase Line #\n"
                    "Entered Function erase Line #\n"
                    "Left Function erase Line #\n"
                    "Entered Function operator uint8* Line #\n"
                    "Left Function operator uint8* Line #\n"
                    "Entered Function operator uint8* Line #\n"
                    "Left Function operator uint8* Line #\n"
                    "Left Function _init Line #\n"
                    "Entered Function operator uint8* Line #\n"
                    "Left Function operator uint8* Line #\n"
                    "Entered Function operator uint8* Line #\n"
                    "Left Function operator uint8* Line #\n"
                    "Left Function addDataInScsiCdb Line #\n"
                    "Left Function createInquiryCDB Line #\n");
    EXPECT_EQ(header().dxfer_len, 256U);
}

TEST_F(InquiryCdb, OfAPageHasItsCodeAndBothLengthBytes) {
    EXPECT_EQ(cdb(1, 0x83, 0x1234), (Bytes{0x12, 1, 0x83, 0x12, 0x34, 0}));
    EXPECT_EQ(header().dxfer_len, 0x1234U);
}

TEST_F(InquiryCdb, TakesOnlyTheLowestBitOfEvpd) {
    EXPECT_EQ(cdb(0xFF, 0x80, 4), (Bytes{0x12, 1, 0x80, 0, 4, 0}));
    EXPECT_EQ(cdb(0xFE, 0x80, 4), (Bytes{0x12, 0, 0x80, 0, 4, 0}));
}

TEST_F(InquiryCdb, TakesTheWholeRangeOfLengths) {
    EXPECT_EQ(cdb(1, 0x83, 0xFFFF), (Bytes{0x12, 1, 0x83, 0xFF, 0xFF, 0}));
    EXPECT_EQ(header().dxfer_len, 0xFFFFU);
    EXPECT_EQ(cdb(1, 0x83, 0), (Bytes{0x12, 1, 0x83, 0, 0, 0}));
    EXPECT_EQ(header().dxfer_len, 0xFFFFU);
}

} // namespace
