#include "scsi/io_context_linux.hpp"

#include <string>

#include <gtest/gtest.h>

#include "foundation/exceptions.hpp"
#include "scsi/scsi_exceptions.hpp"
#include "tests/support/failing_memory.hpp"
#include "tests/support/inquiry_data.hpp"
#include "tests/support/log_capture.hpp"
#include "tests/support/scsi_log.hpp"
#include "tests/support/thrown.hpp"

namespace {

using Buffer = ZebCountedPointer<ZebBuffer>;
using Record = ZebCountedPointer<IoObject>;

// A context and its record, the driver's side of which the tests play themselves.
class IoContext : public testing::Test {
protected:
    IoContext() : mRecord(mContext.ioObject()) {}

    void prepare(uint32 allocLength = 36) {
        mContext.addDataInScsiCdb(responseOf({0x12, 0, 0, 0, 36, 0}, 6), allocLength);
    }

    void end(uint32 ioctlState, uint16 hostStatus, uint16 driverStatus, uint8 status) {
        mRecord->ioctlState = ioctlState;
        mRecord->header.host_status = hostStatus;
        mRecord->header.driver_status = driverStatus;
        mRecord->header.status = status;
    }

    // Puts sense data where the driver does.
    void putSense(const Bytes& sense) {
        std::copy(sense.begin(), sense.end(), mRecord->header.sbp);
        mRecord->header.sb_len_wr = static_cast<unsigned char>(sense.size());
    }

    uint32 category(uint16 hostStatus, uint16 driverStatus, uint8 status) {
        end(kIoctlSucceeded, hostStatus, driverStatus, status);
        uint32 code = 0;
        return mContext.getScsiStatus(code);
    }

    LogCapture mConstruction; // hears what the constructor says, and what no test asks for
    ZebScsiIoContextLinux mContext;
    Record mRecord;
};

void expectPresets(const sg_io_hdr& header, uint32 dataLength) {
    EXPECT_EQ(header.interface_id, 83);
    EXPECT_EQ(header.flags, 2U);
    EXPECT_EQ(header.dxfer_direction, -3);
    EXPECT_EQ(header.dxfer_len, dataLength);
    EXPECT_NE(header.dxferp, nullptr);
    EXPECT_NE(header.sbp, nullptr);
    EXPECT_EQ(header.mx_sb_len, 32);
    EXPECT_EQ(header.sb_len_wr, 32);
    EXPECT_EQ(header.iovec_count, 0);
    EXPECT_EQ(header.timeout, 0U);
    EXPECT_EQ(header.pack_id, 0);
    EXPECT_EQ(header.usr_ptr, nullptr);
    EXPECT_EQ(header.status, 0);
    EXPECT_EQ(header.masked_status, 0);
    EXPECT_EQ(header.msg_status, 0);
    EXPECT_EQ(header.host_status, 0);
    EXPECT_EQ(header.driver_status, 0);
    EXPECT_EQ(header.resid, 0);
    EXPECT_EQ(header.duration, 0U);
    EXPECT_EQ(header.info, 0U);
}

TEST(IoRecord, IsTheDriversHeaderWithTwoWordsBehindIt) {
    EXPECT_EQ(sizeof(IoObject), sizeof(sg_io_hdr) + 8);
    EXPECT_EQ(offsetof(IoObject, header), 0U);
    EXPECT_EQ(offsetof(IoObject, reserved), sizeof(sg_io_hdr));
    EXPECT_EQ(offsetof(IoObject, ioctlState), sizeof(sg_io_hdr) + 4);
}

TEST_F(IoContext, StartsPreset) {
    EXPECT_EQ(mConstruction.text(), madeContext());
    expectPresets(mRecord->header, 256);
    EXPECT_EQ(mRecord->header.cmdp, nullptr);
    EXPECT_EQ(mRecord->header.cmd_len, 0);
    EXPECT_EQ(mRecord->reserved, 0U);
    EXPECT_EQ(mRecord->ioctlState, kIoctlNotDone);
}

TEST(IoContextCreation, FreesWhatItMadeWhenMemoryRunsOut) {
    // Data buffer, sense buffer, record: each in turn is the one that cannot be made.
    const std::string made[] = {"", madeBuffer(), madeBuffer() + madeBuffer()};
    const std::string freed[] = {"", freedBuffer(), freedBuffer() + freedBuffer()};
    for (int granted = 0; granted < 3; ++granted) {
        SCOPED_TRACE(granted);
        const LogCapture log;
        const FailingNew failing(granted);
        EXPECT_EQ(messageOf<NoMemoryEx>([] { const ZebScsiIoContextLinux context; }), "No Memory\n");
        EXPECT_EQ(log.text(), entered("_create") + made[granted] + left("_create") + freed[granted]);
    }
}

TEST(IoContextDestruction, FreesCdbSenseAndData) {
    const LogCapture log;
    std::string before;
    {
        ZebScsiIoContextLinux context;
        context.addDataInScsiCdb(responseOf({0x12, 0, 0, 0, 36, 0}, 6), 36);
        before = log.text();
    }
    EXPECT_EQ(log.text(), before + freedBuffer() + freedBuffer() + freedBuffer());
}

TEST(IoContextDestruction, LeavesAResponseThatIsStillShared) {
    const LogCapture log;
    Buffer response;
    std::string before;
    {
        ZebScsiIoContextLinux context;
        context.addDataInScsiCdb(responseOf({0x12, 0, 0, 0, 36, 0}, 6), 36);
        Record record(context.ioObject());
        record->ioctlState = kIoctlSucceeded;
        uint32 code = 0;
        EXPECT_EQ(context.getScsiStatus(code), kResultGood);
        context.getResponseData(response);
        before = log.text();
    }
    EXPECT_EQ(log.text(), before + freedContext());
    EXPECT_EQ(response->length(), 256U);
}

TEST_F(IoContext, DataInAsksForTheWholeBufferNotForTheAllocationLength) {
    prepare(36);
    expectPresets(mRecord->header, 256);
    EXPECT_EQ(mRecord->header.cmd_len, 6);
    EXPECT_EQ(Bytes(mRecord->header.cmdp, mRecord->header.cmdp + 6), (Bytes{0x12, 0, 0, 0, 36, 0}));
}

TEST_F(IoContext, DataInLogsItsSteps) {
    const Buffer cdb = responseOf({0x12, 0, 0, 0, 36, 0}, 6);
    const LogCapture log;
    mContext.addDataInScsiCdb(cdb, 256);
    EXPECT_EQ(log.text(), preparedDataIn());
}

TEST_F(IoContext, DataInGrowsTheBufferAndNeverShrinksIt) {
    prepare(300);
    EXPECT_EQ(mRecord->header.dxfer_len, 300U);
    prepare(36);
    EXPECT_EQ(mRecord->header.dxfer_len, 300U);
    prepare(301);
    EXPECT_EQ(mRecord->header.dxfer_len, 301U);
}

TEST_F(IoContext, AGrownBufferReplacesTheOldOneBeforeTheReset) {
    const Buffer cdb = responseOf({0x12, 0, 0, 0, 36, 0}, 6);
    const LogCapture log;
    mContext.addDataInScsiCdb(cdb, 257);
    EXPECT_EQ(log.text(), preparedDataIn(madeBuffer() + freedBuffer()));
}

TEST_F(IoContext, DataInWithoutMemoryKeepsTheBuffer) {
    const Buffer cdb = responseOf({0x12, 0, 0, 0, 36, 0}, 6);
    {
        const LogCapture log;
        const FailingNew failing(0);
        EXPECT_EQ(messageOf<NoMemoryEx>([&] { mContext.addDataInScsiCdb(cdb, 257); }), "No Memory");
        EXPECT_EQ(log.text(), traced("addDataInScsiCdb"));
    }
    mContext.addDataInScsiCdb(cdb, 36);
    EXPECT_EQ(mRecord->header.dxfer_len, 256U);
}

TEST_F(IoContext, DataInResetsWhatAnEarlierCommandLeft) {
    prepare();
    putSense(Bytes(18, 0xAA));
    static_cast<uint8*>(mRecord->header.dxferp)[255] = 0xAA;
    mRecord->header.timeout = 10000;
    mRecord->header.resid = 220;
    mRecord->header.info = 1;
    EXPECT_EQ(category(0, 0, 0), kResultGood);
    prepare();
    expectPresets(mRecord->header, 256);
    EXPECT_EQ(mRecord->ioctlState, kIoctlNotDone);
    EXPECT_EQ(mRecord->header.sbp[17], 0);
    EXPECT_EQ(static_cast<uint8*>(mRecord->header.dxferp)[255], 0);
    mRecord->ioctlState = kIoctlSucceeded;
    Buffer response;
    EXPECT_EQ(messageOf<NotSupportedEx>([&] { mContext.getResponseData(response); }),
              "Ioctl succeeded, but SCSI response returned with failure\n"); // not classified again yet
}

TEST_F(IoContext, DataOutSendsTheCallersBytes) {
    const Buffer cdb = responseOf({0x3B, 0, 0, 0, 0, 0, 0, 0, 4, 0}, 10);
    Buffer data = responseOf({1, 2, 3, 4}, 4);
    const LogCapture log;
    mContext.addDataOutScsiCdb(cdb, data);
    EXPECT_EQ(log.text(),
              traced("addDataOutScsiCdb", resetContext() + tookWritePointer() + tookWritePointer()));
    const sg_io_hdr& header = mRecord->header;
    EXPECT_EQ(header.cmd_len, 10);
    EXPECT_EQ(header.cmdp[8], 4);
    EXPECT_EQ(header.dxfer_direction, -2);
    EXPECT_EQ(header.dxfer_len, 4U);
    EXPECT_EQ(header.dxferp, static_cast<void*>(static_cast<uint8*>(*data)));
    EXPECT_EQ(header.sb_len_wr, 32);
}

TEST_F(IoContext, DataOutKeepsTheCallersBytes) {
    const Buffer cdb = responseOf({0x3B, 0, 0, 0, 0, 0, 0, 0, 4, 0}, 10);
    Buffer data = responseOf({1, 2, 3, 4}, 4);
    mContext.addDataOutScsiCdb(cdb, data);
    const LogCapture log;
    data.release();
    EXPECT_EQ(log.text(), ""); // the buffer lives on
    EXPECT_EQ(static_cast<const uint8*>(mRecord->header.dxferp)[3], 4);
}

TEST_F(IoContext, StatusIsThereOnlyAfterTheIoctl) {
    for (const uint32 state : {kIoctlNotDone, kIoctlFailed}) {
        SCOPED_TRACE(state);
        end(state, 0, 0, 0x02);
        uint32 code = 77;
        const LogCapture log;
        EXPECT_EQ(messageOf<NotAllowedEx>([&] { mContext.getScsiStatus(code); }),
                  "IOCTL should be called before processing response\n");
        EXPECT_EQ(log.text(), traced("getScsiStatus"));
        EXPECT_EQ(code, 77U);
    }
}

TEST_F(IoContext, StatusIsTheByteWithoutItsReservedBits) {
    end(kIoctlSucceeded, 0, 0, 0xFF);
    uint32 code = 0;
    const LogCapture log;
    mContext.getScsiStatus(code);
    EXPECT_EQ(code, 0x7EU);
    EXPECT_EQ(log.text(), traced("getScsiStatus"));
}

TEST_F(IoContext, CategoryFollowsHostThenDriverThenStatus) {
    struct Row {
        uint16 hostStatus;
        uint16 driverStatus;
        uint8 status;
        uint32 category;
    };
    constexpr Row kRows[] = {
        {0, 0, 0x00, kResultGood},           {0, 0, 0x81, kResultGood}, // reserved bits
        {0, 0x10, 0x00, kResultGood},        {0, 0, 0x04, kResultOtherStatus},
        {0, 0, 0x08, kResultOtherStatus},    {0, 0, 0x18, kResultOtherStatus},
        {0, 0, 0x28, kResultOtherStatus},    {0, 0, 0x02, kResultSenseAvailable},
        {0, 0, 0x22, kResultSenseAvailable}, {0, 8, 0x00, kResultSenseAvailable},
        {0, 8, 0x02, kResultSenseAvailable}, {0, 0x28, 0x18, kResultSenseAvailable},
        {0, 6, 0x00, kResultTransportError}, {0, 1, 0x02, kResultTransportError},
        {7, 0, 0x00, kResultTransportError}, {7, 0, 0x02, kResultTransportError},
        {7, 8, 0x02, kResultTransportError}, {0x100, 0, 0x00, kResultTransportError},
    };
    for (const Row& row : kRows) {
        EXPECT_EQ(category(row.hostStatus, row.driverStatus, row.status), row.category)
            << row.hostStatus << ", " << row.driverStatus << ", " << static_cast<int>(row.status);
    }
}

TEST_F(IoContext, DriverSenseWithGoodStatusIsCategory3) {
    EXPECT_EQ(category(0, 8, 0), 3U);
}

TEST_F(IoContext, HostStatus7IsCategory4WhateverTheStatus) {
    for (const uint8 status : Bytes{0x00, 0x02, 0x08, 0x22}) {
        EXPECT_EQ(category(7, 0, status), 4U);
    }
}

TEST_F(IoContext, TheResponseIsTheWholeSharedBuffer) {
    prepare();
    static_cast<uint8*>(mRecord->header.dxferp)[255] = 0x5A;
    mRecord->header.resid = 220;
    EXPECT_EQ(category(0, 0, 0), kResultGood);
    Buffer response;
    const LogCapture log;
    mContext.getResponseData(response);
    EXPECT_EQ(log.text(), traced("getResponseData"));
    EXPECT_EQ(response->length(), 256U);
    EXPECT_EQ(response->byte(255), 0x5A);
    prepare();
    EXPECT_EQ(response->byte(255), 0); // the next command erases what was handed out
}

TEST_F(IoContext, ResponseAndSenseAreRefusedWithoutIoctl) {
    struct Row {
        uint32 state;
        const char* text;
    };
    for (const Row& row : {Row{kIoctlNotDone, "Ioctl not done, so no response\n"},
                           Row{kIoctlFailed, "Ioctl done, but failed, so no response\n"}}) {
        SCOPED_TRACE(row.text);
        end(row.state, 0, 0, 0);
        Buffer buffer;
        uint32 code = 0;
        {
            const LogCapture log;
            EXPECT_EQ(messageOf<NotAllowedEx>([&] { mContext.getResponseData(buffer); }), row.text);
            EXPECT_EQ(log.text(), traced("getResponseData", row.text));
        }
        const LogCapture log;
        EXPECT_EQ(messageOf<NotAllowedEx>([&] { mContext.getSenseData(code, buffer); }), row.text);
        EXPECT_EQ(log.text(), traced("getSenseData", row.text));
    }
}

TEST_F(IoContext, TheResponseIsRefusedUnlessTheCommandEndedWell) {
    const char* const text = "Ioctl succeeded, but SCSI response returned with failure\n";
    Buffer buffer;
    for (const uint8 status : Bytes{0x02, 0x08}) {
        EXPECT_NE(category(0, 0, status), kResultGood);
        const LogCapture log;
        EXPECT_EQ(messageOf<NotSupportedEx>([&] { mContext.getResponseData(buffer); }), text);
        EXPECT_EQ(log.text(), traced("getResponseData", text));
    }
}

TEST_F(IoContext, TheResponseIsRefusedBeforeTheStatusWasAskedFor) {
    prepare();
    end(kIoctlSucceeded, 0, 0, 0);
    Buffer buffer;
    EXPECT_EQ(messageOf<NotSupportedEx>([&] { mContext.getResponseData(buffer); }),
              "Ioctl succeeded, but SCSI response returned with failure\n");
}

TEST_F(IoContext, SenseIsRefusedWithoutALineAfterAnyOtherOutcome) {
    Buffer buffer;
    uint32 code = 77;
    for (const uint16 hostStatus : std::initializer_list<uint16>{0, 7}) {
        category(hostStatus, 0, 0);
        const LogCapture log;
        EXPECT_EQ(messageOf<NotAllowedEx>([&] { mContext.getSenseData(code, buffer); }),
                  "Processing result is not sense\n");
        EXPECT_EQ(log.text(), traced("getSenseData"));
        EXPECT_EQ(code, 77U);
    }
}

TEST_F(IoContext, SenseIsAViewOfTheBytesThatTheDriverWrote) {
    const Bytes sense = {0x70, 0, 0x06, 0, 0, 0, 0, 10, 0, 0, 0, 0, 0x29, 0, 0, 0, 0, 0};
    putSense(sense);
    EXPECT_EQ(category(0, 8, 0x02), kResultSenseAvailable);
    uint32 code = 0;
    std::string log;
    std::string dropped;
    {
        Buffer view;
        {
            const LogCapture capture;
            mContext.getSenseData(code, view);
            log = capture.text();
        }
        EXPECT_EQ(view->length(), 18U);
        EXPECT_EQ(view->byte(2), 0x06);
        mRecord->header.sbp[2] = 0x0B;
        EXPECT_EQ(view->byte(2), 0x0B);
        const LogCapture capture;
        view.release();
        dropped = capture.text();
    }
    EXPECT_EQ(log, traced("getSenseData", traced("ZebBuffer")));
    EXPECT_EQ(dropped, droppedView());
    EXPECT_EQ(mRecord->header.sbp[2], 0x0B);
}

TEST_F(IoContext, EverySenseKeyHasCode99) {
    for (uint8 senseKey = 0; senseKey < 16; ++senseKey) {
        SCOPED_TRACE(static_cast<int>(senseKey));
        for (const Bytes& sense : {Bytes{0x70, 0, senseKey}, Bytes{0x72, senseKey, 0x20, 0}}) {
            putSense(sense);
            category(0, 8, 0x02);
            uint32 code = 0;
            Buffer view;
            mContext.getSenseData(code, view);
            EXPECT_EQ(code, 99U);
        }
    }
}

TEST_F(IoContext, ShortSenseLeavesTheCode) {
    putSense({0x70, 0});
    category(0, 8, 0x02);
    uint32 code = 77;
    Buffer view;
    const LogCapture log;
    mContext.getSenseData(code, view);
    EXPECT_EQ(code, 77U);
    EXPECT_EQ(view->length(), 2U);
    EXPECT_EQ(log.text(), traced("getSenseData", traced("ZebBuffer")));
}

TEST_F(IoContext, MalformedSenseLeavesTheCodeAndNoExitTrace) {
    putSense({0x00, 0, 0x05, 0});
    category(0, 8, 0x02);
    uint32 code = 77;
    Buffer view;
    const LogCapture log;
    mContext.getSenseData(code, view);
    EXPECT_EQ(code, 77U);
    EXPECT_EQ(view->length(), 4U);
    EXPECT_EQ(log.text(), entered("getSenseData") + traced("ZebBuffer") + "sensep NULL or 0 sb_len");
}

TEST_F(IoContext, IsUsableAgainAfterEveryFailure) {
    end(kIoctlFailed, 0, 0, 0);
    Buffer response;
    EXPECT_EQ(messageOf<NotAllowedEx>([&] { mContext.getResponseData(response); }),
              "Ioctl done, but failed, so no response\n");
    prepare();
    EXPECT_EQ(category(0, 0, 0), kResultGood);
    mContext.getResponseData(response);
    EXPECT_EQ(response->length(), 256U);
}

} // namespace
