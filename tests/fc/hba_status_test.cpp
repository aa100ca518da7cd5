#include "fc/hba_status.hpp"

#include <string>

#include <gtest/gtest.h>

namespace {

TEST(HbaStatusName, IsTheStandardsNameOfEachStatus) {
    const char* const expected[] = {
        "HBA_STATUS_OK",
        "HBA_STATUS_ERROR",
        "HBA_STATUS_ERROR_NOT_SUPPORTED",
        "HBA_STATUS_ERROR_INVALID_HANDLE",
        "HBA_STATUS_ERROR_ARG",
        "HBA_STATUS_ERROR_ILLEGAL_WWN",
        "HBA_STATUS_ERROR_ILLEGAL_INDEX",
        "HBA_STATUS_ERROR_MORE_DATA",
        "HBA_STATUS_ERROR_STALE_DATA",
        "HBA_STATUS_SCSI_CHECK_CONDITION",
        "HBA_STATUS_ERROR_BUSY",
        "HBA_STATUS_ERROR_TRY_AGAIN",
        "HBA_STATUS_ERROR_UNAVAILABLE",
        "HBA_STATUS_ERROR_ELS_REJECT",
        "HBA_STATUS_ERROR_INVALID_LUN",
        "HBA_STATUS_ERROR_INCOMPATIBLE",
        "HBA_STATUS_ERROR_AMBIGUOUS_WWN",
        "HBA_STATUS_ERROR_LOCAL_BUS",
        "HBA_STATUS_ERROR_LOCAL_TARGET",
        "HBA_STATUS_ERROR_LOCAL_LUN",
        "HBA_STATUS_ERROR_LOCAL_SCSIID_BOUND",
        "HBA_STATUS_ERROR_TARGET_FCID",
        "HBA_STATUS_ERROR_TARGET_NODE_WWN",
        "HBA_STATUS_ERROR_TARGET_PORT_WWN",
        "HBA_STATUS_ERROR_TARGET_LUN",
        "HBA_STATUS_ERROR_TARGET_LUID",
        "HBA_STATUS_ERROR_NO_SUCH_BINDING",
        "HBA_STATUS_ERROR_NOT_A_TARGET",
        "HBA_STATUS_ERROR_UNSUPPORTED_FC4",
        "HBA_STATUS_ERROR_INCAPABLE",
        "HBA_STATUS_ERROR_TARGET_BUSY",
    };
    HBA_STATUS status = 0;
    for (const char* const name : expected) {
        EXPECT_STREQ(hbaStatusName(status), name) << status;
        ++status;
    }
}

// The list and the header's numbers are the same standard's.
TEST(HbaStatusName, AgreesWithTheHeadersNumbers) {
    EXPECT_STREQ(hbaStatusName(HBA_STATUS_ERROR_NOT_SUPPORTED), "HBA_STATUS_ERROR_NOT_SUPPORTED");
    EXPECT_STREQ(hbaStatusName(HBA_STATUS_ERROR_MORE_DATA), "HBA_STATUS_ERROR_MORE_DATA");
    EXPECT_STREQ(hbaStatusName(HBA_STATUS_ERROR_INCAPABLE), "HBA_STATUS_ERROR_INCAPABLE");
}

TEST(HbaStatusName, IsInvalidFrom31On) {
    EXPECT_STREQ(hbaStatusName(31), "Invalid Hbaapi Status Code");
    EXPECT_STREQ(hbaStatusName(0xFFFFFFFF), "Invalid Hbaapi Status Code");
}

} // namespace
