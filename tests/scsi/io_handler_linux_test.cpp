#include "scsi/io_handler_linux.hpp"

#include <fcntl.h>
#include <scsi/sg.h>

#include <cerrno>
#include <optional>
#include <string>

#include <gtest/gtest.h>

#include "scsi/io_context_linux.hpp"
#include "scsi/scsi_exceptions.hpp"
#include "tests/support/fake_kernel.hpp"
#include "tests/support/inquiry_data.hpp"
#include "tests/support/log_capture.hpp"
#include "tests/support/scsi_log.hpp"
#include "tests/support/thrown.hpp"

namespace {

constexpr int kFd = 7;
constexpr uint16 kDriverSense = 8;

using ContextPointer = ZebCountedPointer<ZebScsiIoContext>;

// A context that was never set up.
class EmptyContext : public ZebScsiIoContext {
public:
    void addDataInScsiCdb(const ZebCountedPointer<ZebBuffer>& /*cdb*/, uint32 /*allocLength*/) override {}
    void addDataOutScsiCdb(const ZebCountedPointer<ZebBuffer>& /*cdb*/,
                           const ZebCountedPointer<ZebBuffer>& /*data*/) override {}
    void getResponseData(ZebCountedPointer<ZebBuffer>& /*bufferOut*/) override {}
    void getSenseData(uint32& /*codeOut*/, ZebCountedPointer<ZebBuffer>& /*bufferOut*/) override {}
    uint32 getScsiStatus(uint32& /*statusOut*/) override { return kResultNone; }
};

// 18 bytes of fixed format.
Bytes fixedSense(uint8 senseKey, uint8 additionalLength, uint8 asc, uint8 ascq) {
    return {0x70, 0, senseKey, 0, 0, 0, 0, additionalLength, 0, 0, 0, 0, asc, ascq, 0, 0, 0, 0};
}

SgAnswer driverSense(const Bytes& sense) {
    SgAnswer answer;
    answer.driverStatus = kDriverSense;
    answer.sense = sense;
    return answer;
}

// What the log says about a failure: doScsiIo leaves before it tells why.
std::string leftWith(const std::string& text) {
    return traced("doScsiIo") + text;
}

class DoScsiIo : public testing::Test {
protected:
    void SetUp() override {
        const LogCapture unheard;
        mContext.create(new ZebScsiIoContextLinux, ZebPST_Individual, ZebPAT_New);
        mContext->addDataInScsiCdb(responseOf({0x12, 0, 0, 0, 36, 0}, 6), 36);
        mRecord = mContext->ioObject();
    }

    void TearDown() override {
        const LogCapture unheard;
        mContext.release();
        mRecord.release();
    }

    // Sends the command and notes what comes of it.
    void send(const SgAnswer& answer, uint32 timeout_ms = 10000) {
        mKernel.answers = {answer};
        mRecord->header.sb_len_wr = 32; // as before every command; the driver overwrites it
        mThrownType.reset();
        const LogCapture log;
        try {
            mHandler.doScsiIo(kFd, timeout_ms, mContext);
        } catch (const TException& exception) {
            mThrownType = typeid(exception).name();
            mThrownText = exception.what();
        }
        mLog = log.text();
        const std::string left = "Left Function doScsiIo Line ";
        const std::string exact = log.exactText();
        const auto at = exact.find(left);
        mExit = at == std::string::npos ? 0 : std::stoi(exact.substr(at + left.size()));
    }

    void expectReturn(int exit, const std::string& text = "") const {
        EXPECT_EQ(mLog, leftWith(text));
        EXPECT_EQ(mExit, exit);
        EXPECT_FALSE(mThrownType.has_value()) << mThrownText;
        EXPECT_EQ(mRecord->ioctlState, kIoctlSucceeded);
    }

    template <typename Exception>
    void expectThrow(int exit, const std::string& thrown, const std::string& printed) const {
        EXPECT_EQ(mLog, leftWith(printed));
        EXPECT_EQ(mExit, exit);
        ASSERT_TRUE(mThrownType.has_value());
        EXPECT_EQ(*mThrownType, typeid(Exception).name());
        EXPECT_EQ(mThrownText, thrown);
    }

    void expectTimeOut(int exit) const { expectThrow<TimeOutEx>(exit, "Timeout\n", "Timeout\n"); }
    void expectNotSupported(int exit, const std::string& text) const {
        expectThrow<NotSupportedEx>(exit, text, text);
    }

    FakeKernel mKernel;
    ZebScsiIoHandlerLinux mHandler;
    ContextPointer mContext;
    ZebCountedPointer<IoObject> mRecord;

    std::string mLog;
    int mExit = 0; // the line number of the exit trace
    std::optional<std::string> mThrownType;
    std::string mThrownText;
};

TEST(IoHandlerOpen, IsReadOnlyAndDoesNotBlock) {
    FakeKernel kernel;
    const LogCapture log;
    int32 fd = -1;
    ZebScsiIoHandlerLinux().open("/dev/sdx", fd);
    EXPECT_EQ(fd, FakeKernel::kFirstFd);
    ASSERT_EQ(kernel.opens.size(), 1U);
    EXPECT_EQ(kernel.opens[0].path, "/dev/sdx");
    EXPECT_EQ(kernel.opens[0].flags, O_RDONLY | O_NONBLOCK | O_CLOEXEC);
    EXPECT_EQ(kernel.opens[0].mode, 0U);
    EXPECT_EQ(log.text(), traced("open"));
}

TEST(IoHandlerOpen, ThrowsTheSystemsErrorTextWithoutExitTrace) {
    FakeKernel kernel;
    kernel.openError = ENXIO;
    const LogCapture log;
    int32 fd = -1;
    const auto open = [&] { ZebScsiIoHandlerLinux().open("/dev/sdx", fd); };
    EXPECT_EQ(messageOf<OpenFailedEx>(open), "No such device or address");
    EXPECT_EQ(fd, -1);
    EXPECT_EQ(log.text(), entered("open"));
}

TEST(IoHandlerClose, ClosesTheDescriptor) {
    FakeKernel kernel;
    kernel.openDescriptors = {kFd};
    const LogCapture log;
    ZebScsiIoHandlerLinux().close(kFd);
    EXPECT_EQ(kernel.closes, 1);
    EXPECT_TRUE(kernel.openDescriptors.empty());
    EXPECT_EQ(log.text(), traced("close"));
}

TEST(IoHandlerClose, ThrowsTheSystemsErrorTextWithoutExitTrace) {
    FakeKernel kernel;
    kernel.openDescriptors = {kFd};
    kernel.closeError = EIO;
    const LogCapture log;
    const auto close = [] { ZebScsiIoHandlerLinux().close(kFd); };
    EXPECT_EQ(messageOf<CloseFailedEx>(close), "Input/output error");
    EXPECT_EQ(log.text(), entered("close"));
}

TEST(IoHandlerCheck, RefusesAContextWithoutRecord) {
    const FakeKernel kernel;
    ContextPointer context;
    context.create(new EmptyContext, ZebPST_Individual, ZebPAT_New);
    const LogCapture log;
    const auto send = [&] { ZebScsiIoHandlerLinux().doScsiIo(kFd, 10000, context); };
    EXPECT_EQ(messageOf<NotSupportedEx>(send), "No IoObject\n");
    EXPECT_EQ(log.text(), leftWith("No IoObject\n"));
    EXPECT_TRUE(kernel.commands.empty());
}

TEST_F(DoScsiIo, RefusesAnIncompleteCommandAtItsFirstMissingField) {
    struct Row {
        void (*clear)(sg_io_hdr&);
        const char* printed;
        const char* thrown;
    };
    const Row rows[] = {
        {[](sg_io_hdr& header) { header.cmdp = nullptr; }, "No cmdp in IoObject\n", "No cmdp in IoObject\n"},
        {[](sg_io_hdr& header) { header.sbp = nullptr; }, "No sbp in IoObject\n", "No sbp in IoObject\n"},
        {[](sg_io_hdr& header) { header.sb_len_wr = 0; }, "No sb len In IoObject\n",
         "No sb len In IoObject\n"},
        {[](sg_io_hdr& header) { header.dxferp = nullptr; }, "No dxferp In IoObject\n",
         "No dxferp In IoObject\n"},
        {[](sg_io_hdr& header) { header.dxfer_len = 0; }, "No dxfer len in IoObject\n",
         "No dxfer len In IoObject\n"},
        {[](sg_io_hdr& header) { header.dxfer_direction = 0; }, "No dxfer direction in IoObject\n",
         "No dxfer direction  In IoObject\n"},
    };
    const auto send = [&] { mHandler.doScsiIo(kFd, 10000, mContext); };
    const sg_io_hdr complete = mRecord->header;
    sg_io_hdr moreAndMore = complete;
    for (auto row = std::rbegin(rows); row != std::rend(rows); ++row) {
        SCOPED_TRACE(row->thrown);
        row->clear(moreAndMore); // all fields behind this one are missing too, and the first is what counts
        sg_io_hdr one = complete;
        row->clear(one);
        for (const sg_io_hdr& header : {one, moreAndMore}) {
            mRecord->header = header;
            const LogCapture log;
            EXPECT_EQ(messageOf<NotSupportedEx>(send), row->thrown);
            EXPECT_EQ(log.text(), leftWith(row->printed));
        }
    }
    EXPECT_TRUE(mKernel.commands.empty());
    EXPECT_EQ(mRecord->ioctlState, kIoctlNotDone);
}

TEST_F(DoScsiIo, TheRoomForSenseDataAloneIsNotEnough) {
    mRecord->header.mx_sb_len = 32;
    mRecord->header.sb_len_wr = 0;
    const LogCapture log;
    EXPECT_EQ(messageOf<NotSupportedEx>([&] { mHandler.doScsiIo(kFd, 10000, mContext); }),
              "No sb len In IoObject\n");
}

TEST_F(DoScsiIo, SendsTheRecordWithTheTimeOut) {
    send({}, 12345);
    expectReturn(261);
    ASSERT_EQ(mKernel.commands.size(), 1U);
    const SgCommand& command = mKernel.commands[0];
    EXPECT_EQ(command.fd, kFd);
    EXPECT_EQ(command.request, 0x2285U);
    EXPECT_EQ(command.timeout, 12345U);
    EXPECT_EQ(command.cdb, (Bytes{0x12, 0, 0, 0, 36, 0}));
    EXPECT_EQ(command.direction, -3);
    EXPECT_EQ(command.transferLength, 256U);
}

TEST_F(DoScsiIo, ARefusedIoctlLeavesAt168WithItsErrorAndAnEmptyLine) {
    SgAnswer answer;
    answer.ioctlError = ENOTTY;
    send(answer);
    expectThrow<ScsiIoctlEx>(168, "ioctl failed, error code = 25\n", "ioctl failed, error code = 25\n\n");
    EXPECT_EQ(mRecord->ioctlState, kIoctlFailed);
}

TEST_F(DoScsiIo, ARefusedIoctlIsNoTimeOutHoweverLongItTook) {
    SgAnswer answer;
    answer.ioctlError = EIO;
    answer.elapsedMs = 60000;
    send(answer);
    expectThrow<ScsiIoctlEx>(168, "ioctl failed, error code = 5\n", "ioctl failed, error code = 5\n\n");
}

TEST_F(DoScsiIo, ACommandThatTakesTooLongLeavesAt187ThoughItSucceeded) {
    SgAnswer answer;
    answer.elapsedMs = 10001;
    send(answer);
    expectTimeOut(187);
    EXPECT_EQ(mRecord->ioctlState, kIoctlSucceeded);
}

TEST_F(DoScsiIo, ATimeOutOf0IsOverAfter1Millisecond) {
    SgAnswer answer;
    answer.elapsedMs = 1;
    send(answer, 0);
    expectTimeOut(187);
    EXPECT_EQ(mRecord->ioctlState, kIoctlSucceeded);
}

TEST_F(DoScsiIo, ACommandMayTakeTheWholeTimeOut) {
    SgAnswer answer;
    answer.elapsedMs = 10000;
    send(answer);
    expectReturn(261);
}

TEST_F(DoScsiIo, ElapsedTimeRunsOnAcrossTheFullSecond) {
    mKernel.clockMs = 1'000'999;
    SgAnswer answer;
    answer.elapsedMs = 2;
    send(answer, 2);
    expectReturn(261);
}

TEST_F(DoScsiIo, ElapsedTimeAcrossTheFullSecondCanBeTooLong) {
    mKernel.clockMs = 1'000'999;
    SgAnswer answer;
    answer.elapsedMs = 3;
    send(answer, 2);
    expectTimeOut(187);
}

TEST_F(DoScsiIo, AClockThatWasSetBackIsNoTimeOut) {
    SgAnswer answer;
    answer.elapsedMs = -3600000;
    send(answer, 0);
    expectReturn(261);
}

TEST_F(DoScsiIo, ATimeOutAbove31BitsIsNegative) {
    send({}, 0xFFFFFFFF);
    expectTimeOut(187);
    EXPECT_EQ(mKernel.commands.at(0).timeout, 0xFFFFFFFFU);
}

TEST_F(DoScsiIo, AHostStatusOf1To3IsATimeOutThatLeavesAt201) {
    for (uint16 hostStatus = 1; hostStatus <= 3; ++hostStatus) {
        SCOPED_TRACE(hostStatus);
        SgAnswer answer;
        answer.hostStatus = hostStatus;
        send(answer);
        expectTimeOut(201);
        EXPECT_EQ(mRecord->ioctlState, kIoctlSucceeded);
    }
}

TEST_F(DoScsiIo, TheDriversTimeOutLeavesAt201WhateverItsSuggestion) {
    for (const uint16 driverStatus : std::initializer_list<uint16>{0x06, 0x16, 0xF6}) {
        SCOPED_TRACE(driverStatus);
        SgAnswer answer;
        answer.driverStatus = driverStatus;
        send(answer);
        expectTimeOut(201);
    }
}

TEST_F(DoScsiIo, OtherHostAndDriverFailuresAreTheContextsToTell) {
    for (const uint16 hostStatus : std::initializer_list<uint16>{0, 4, 7, 259}) {
        SgAnswer answer;
        answer.hostStatus = hostStatus;
        send(answer);
        expectReturn(261);
    }
    for (const uint16 driverStatus : std::initializer_list<uint16>{1, 5, 7, 9, 15}) {
        SgAnswer answer;
        answer.driverStatus = driverStatus;
        send(answer);
        expectReturn(261);
    }
}

TEST_F(DoScsiIo, CheckConditionAloneDoesNotLeadToTheSenseData) {
    SgAnswer answer;
    answer.status = 0x02;
    answer.sense = fixedSense(5, 10, 0x20, 0);
    send(answer);
    expectReturn(261);
}

TEST_F(DoScsiIo, TheDoubledStatusLeadsToTheSenseData) {
    // CONDITION MET halves (01h, 11h, 41h, 91h): what is left of the doubled byte is 02h or 22h.
    for (const uint8 status : Bytes{0x01, 0x11, 0x41, 0x81, 0x91}) {
        SCOPED_TRACE(status);
        SgAnswer answer;
        answer.status = status;
        answer.sense = fixedSense(5, 10, 0x20, 0);
        send(answer);
        expectNotSupported(249, "Invalid opcode in CDB\n");
    }
    for (const uint8 status : Bytes{0x00, 0x04, 0x08, 0x18, 0x22, 0x28}) {
        SCOPED_TRACE(status);
        SgAnswer answer;
        answer.status = status;
        answer.sense = fixedSense(5, 10, 0x20, 0);
        send(answer);
        expectReturn(261);
    }
}

TEST_F(DoScsiIo, SenseOfFewerThanThreeBytesIsNone) {
    for (const Bytes& sense : {Bytes{}, Bytes{0x70}, Bytes{0x70, 0x05}}) {
        send(driverSense(sense));
        expectReturn(261);
    }
}

TEST_F(DoScsiIo, AMalformedResponseCodeLeavesAt220WithATextAndNoException) {
    for (const uint8 first : Bytes{0x00, 0x10, 0x60, 0x80}) {
        SCOPED_TRACE(first);
        Bytes sense = fixedSense(5, 10, 0x20, 0);
        sense[0] = first;
        send(driverSense(sense));
        expectReturn(220, "No sensep or sb_len 0\n");
    }
}

TEST_F(DoScsiIo, AnInvalidOpcodeLeavesAt249) {
    send(driverSense(fixedSense(5, 10, 0x20, 0)));
    expectNotSupported(249, "Invalid opcode in CDB\n");
    EXPECT_EQ(mRecord->ioctlState, kIoctlSucceeded);
}

TEST_F(DoScsiIo, AnyOtherIllegalRequestLeavesAt253) {
    for (const auto& [asc, ascq] : {std::pair<uint8, uint8>{0x24, 0}, {0x20, 1}, {0, 0}}) {
        send(driverSense(fixedSense(5, 10, asc, ascq)));
        expectNotSupported(253, "Illegal request in CDB\n");
    }
}

TEST_F(DoScsiIo, AnIllegalRequestWithoutCodesLeavesAt253) {
    send(driverSense({0x70, 0, 0x05}));
    expectNotSupported(253, "Illegal request in CDB\n");
}

TEST_F(DoScsiIo, AnAdditionalSenseLengthOf4CutsTheCodesOff) {
    send(driverSense(fixedSense(5, 4, 0x20, 0)));
    expectNotSupported(253, "Illegal request in CDB\n");
}

TEST_F(DoScsiIo, ReadsDescriptorSenseToo) {
    send(driverSense({0x72, 0x05, 0x20, 0x00, 0, 0, 0, 0}));
    expectNotSupported(249, "Invalid opcode in CDB\n");
    send(driverSense({0x72, 0x05, 0x24, 0x00, 0, 0, 0, 0}));
    expectNotSupported(253, "Illegal request in CDB\n");
}

TEST_F(DoScsiIo, OtherSenseKeysAreTheContextsToTell) {
    for (uint8 senseKey = 0; senseKey < 16; ++senseKey) {
        if (senseKey != 5) {
            SCOPED_TRACE(static_cast<int>(senseKey));
            send(driverSense(fixedSense(senseKey, 10, 0x20, 0)));
            expectReturn(261);
        }
    }
}

TEST_F(DoScsiIo, ATimeOutComesBeforeTheSenseData) {
    SgAnswer answer = driverSense(fixedSense(5, 10, 0x20, 0));
    answer.hostStatus = 3;
    send(answer);
    expectTimeOut(201);
    answer.elapsedMs = 10001;
    send(answer);
    expectTimeOut(187);
}

TEST_F(DoScsiIo, ChangesNothingElseInTheRecord) {
    const sg_io_hdr before = mRecord->header;
    send({}, 4711);
    const sg_io_hdr& after = mRecord->header;
    EXPECT_EQ(after.cmdp, before.cmdp);
    EXPECT_EQ(after.dxferp, before.dxferp);
    EXPECT_EQ(after.sbp, before.sbp);
    EXPECT_EQ(after.mx_sb_len, before.mx_sb_len);
    EXPECT_EQ(after.flags, before.flags);
    EXPECT_EQ(mRecord->reserved, 0U);
}

} // namespace
