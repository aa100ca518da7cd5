#include "tests/hosts/log_comparison.hpp"

#include <gtest/gtest.h>

namespace test {
namespace {

TEST(LogComparison, hidesAddressesTimesAndTraceLineNumbers) {
    EXPECT_EQ(normalised("Entered Function main Line 12\n"
                         "Vpd Page: 0x55d0c8\n"
                         "InqBuffer 0xf7f0 Vendor DGC \n"
                         "Storing Target Mappings 0x5581\n"
                         "Deleting 0x5581\n"
                         "Time values: 1.00, 2.00, 3.00, 4.00\n"
                         "Time taken to load HBAAPI: 0.25 milliseconds\n"
                         "Time taken to build tree: 12.50 milliseconds\n"
                         "Left Function main Line 99\n"),
              "Entered Function main Line #\n"
              "Vpd Page: <address>\n"
              "InqBuffer <address> Vendor DGC \n"
              "Storing Target Mappings <address>\n"
              "Deleting 0x<address>\n"
              "Time values: <times>\n"
              "Time taken to load HBAAPI: <time> milliseconds\n"
              "Time taken to build tree: <time> milliseconds\n"
              "Left Function main Line #\n");
}

TEST(LogComparison, keepsTheNumbersThatAreFormat) {
    const std::string log = "Left Function doScsiIo Line 168\n"
                            "Deleting 2 port attributes...\n"
                            "Added to DevMap 2560771373 --> /dev/sda --> 2\n"
                            "no line end";
    EXPECT_EQ(normalised(log), log);
    EXPECT_EQ(normalised("Entered Function doScsiIo Line 140\n"), "Entered Function doScsiIo Line #\n");
}

TEST(LogComparison, hidesWhatFollowsATextWithoutLineEnd) {
    EXPECT_EQ(normalised("|README| is of no interest to us. IgnoringEntered Function f Line 7\n"),
              "|README| is of no interest to us. IgnoringEntered Function f Line #\n");
    EXPECT_EQ(normalised("Default ID recievedEntered Function f Line 7"),
              "Default ID recievedEntered Function f Line #");
}

TEST(LogComparison, pointsAtTheFirstDifferingLine) {
    EXPECT_EQ(firstDifference("a\nb\n", "a\nb\n"), "");
    EXPECT_EQ(firstDifference("a\nb\nc\n", "a\nB\tx\nc\n"), "first difference in line 2\n"
                                                            "expected:\n"
                                                            "    a\n"
                                                            "  > b\n"
                                                            "    c\n"
                                                            "actual:\n"
                                                            "    a\n"
                                                            "  > B\\x09x\n"
                                                            "    c\n");
    EXPECT_EQ(firstDifference("a\n", ""), "first difference in line 1\n"
                                          "expected:\n"
                                          "  > a\n"
                                          "actual:\n"
                                          "  > (end)\n");
}

} // namespace
} // namespace test
