// An INQUIRY object, the handler that it uses and the kernel behind them.
#pragma once

#include <string>

#include <gtest/gtest.h>

#include "scsi/inquiry.hpp"
#include "scsi/io_handler_linux.hpp"
#include "tests/support/fake_kernel.hpp"
#include "tests/support/inquiry_data.hpp"
#include "tests/support/log_capture.hpp"
#include "tests/support/scsi_log.hpp"

class InquiryFixture : public testing::Test {
protected:
    static constexpr int kFd = 7;
    static constexpr uint32 kTimeOutMs = 4321;

    void SetUp() override { mHandler.create(new ZebScsiIoHandlerLinux, ZebPST_Individual, ZebPAT_New); }
    void TearDown() override {
        const LogCapture unheard;
        mResponse.release();
    }

    // The CDBs of the commands sent so far, each of which must be right in everything else too.
    std::vector<Bytes> cdbs() const {
        std::vector<Bytes> all;
        for (const SgCommand& command : mKernel.commands) {
            EXPECT_EQ(command.fd, kFd);
            EXPECT_EQ(command.timeout, kTimeOutMs);
            EXPECT_EQ(command.direction, -3);
            all.push_back(command.cdb);
        }
        return all;
    }

    FakeKernel mKernel;
    ZebScsiInquiry mInquiry;
    ZebScsiInquiry::Handler mHandler;
    ZebScsiInquiry::Response mResponse;
};

// An answer with these bytes and good status.
inline SgAnswer good(const Bytes& data) {
    SgAnswer answer;
    answer.data = data;
    return answer;
}

// Answers that are no good ones.

inline SgAnswer statusOnly(uint8 status) {
    SgAnswer answer;
    answer.status = status;
    return answer;
}

inline SgAnswer hostFailure(uint16 hostStatus) {
    SgAnswer answer;
    answer.hostStatus = hostStatus;
    return answer;
}

inline SgAnswer senseAnswer(const Bytes& sense) {
    SgAnswer answer;
    answer.status = 0x02;
    answer.driverStatus = 8;
    answer.sense = sense;
    return answer;
}

// ILLEGAL REQUEST, invalid field in CDB: how a device refuses a page.
inline SgAnswer pageRefused() {
    return senseAnswer({0x70, 0, 0x05, 0, 0, 0, 0, 10, 0, 0, 0, 0, 0x24, 0, 0, 0, 0, 0});
}

inline SgAnswer refusedByDriver(int error) {
    SgAnswer answer;
    answer.ioctlError = error;
    return answer;
}

inline SgAnswer late(int elapsedMs) {
    SgAnswer answer;
    answer.elapsedMs = elapsedMs;
    return answer;
}
