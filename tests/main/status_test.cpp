#include "main/status.hpp"

#include <gtest/gtest.h>

namespace {

TEST(StatusString, NamesCodes0To3) {
    EXPECT_STREQ(getStatusString(0), "Success");
    EXPECT_STREQ(getStatusString(1), "Generic Error");
    EXPECT_STREQ(getStatusString(2), "Hbaapi Error");
    EXPECT_STREQ(getStatusString(3), "Not Implemented");
}

TEST(StatusString, DoesNotName4) {
    EXPECT_STREQ(getStatusString(4), "Invalid Status Code\n");
}

TEST(StatusString, IsInvalidForLargerCodes) {
    EXPECT_STREQ(getStatusString(5), "Invalid Status Code\n");
    EXPECT_STREQ(getStatusString(0xFFFFFFFF), "Invalid Status Code\n");
}

} // namespace
