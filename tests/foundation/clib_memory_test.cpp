#include "foundation/clib_memory.hpp"

#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <string>

#include <gtest/gtest.h>

#include "foundation/clib_error.hpp"
#include "foundation/exceptions.hpp"
#include "tests/foundation/failing_calls.hpp"
#include "tests/support/thrown.hpp"

namespace {

TEST(ClibStrdup, GivesACopyToFree) {
    const char text[] = "text";
    char* const copy = Clib_strdup(text);
    EXPECT_STREQ(copy, "text");
    EXPECT_NE(copy, text);
    std::free(copy);
}

TEST(ClibStrdup, ThrowsNoMemoryExWithItsOwnText) {
    const ScopedFailures failures({.strdup = ENOMEM});
    EXPECT_EQ(messageOf<NoMemoryEx>([] { Clib_strdup("text"); }), "No memory available for strdup()\n");
}

TEST(ClibStrerror, GivesTheSystemsTextForErrno) {
    char text[256] = "";
    errno = ENOENT;
    EXPECT_EQ(Clib_strerror(text, sizeof text), text);
    EXPECT_STREQ(text, "No such file or directory");
    errno = 0;
    EXPECT_STREQ(Clib_strerror(text, sizeof text), "Success");
    errno = 99999;
    EXPECT_STREQ(Clib_strerror(text, sizeof text), "Unknown error 99999");
}

TEST(ClibStrerror, CutsATextThatDoesNotFit) {
    char text[8] = "#######";
    errno = ENOENT;
    EXPECT_STREQ(Clib_strerror(text, 4), "No ");
    EXPECT_STREQ(text + 4, "###");
    EXPECT_STREQ(Clib_strerror(text, 0), "No ");
}

TEST(ErrnoText, BecomesTheMessageOfAnException) {
    errno = EACCES;
    EXPECT_EQ(messageOf<OpenFailedEx>([] { throwErrno<OpenFailedEx>(); }), "Permission denied");
}

TEST(ClibMemory, CopiesMovesAndFills) {
    char bytes[8] = "abcdef";
    EXPECT_EQ(Clib_memmove(bytes + 1, bytes, 4), bytes + 1);
    EXPECT_STREQ(bytes, "aabcdf");
    EXPECT_EQ(Clib_memcpy(bytes, "xyz", 3), bytes);
    EXPECT_STREQ(bytes, "xyzcdf");
    EXPECT_EQ(Clib_memset(bytes, '-', 2), bytes);
    EXPECT_STREQ(bytes, "--zcdf");
}

TEST(ClibText, IsCopiedAndJoinedWithTheTargetAsResult) {
    const volatile std::size_t two = 2; // no constant, or the compiler complains of what the test is after
    char text[20] = "";
    EXPECT_EQ(Clib_strcpy(text, "/dev/"), text);
    EXPECT_EQ(Clib_strcat(text, "sda"), text);
    EXPECT_EQ(Clib_strncat(text, "1234", two), text);
    EXPECT_STREQ(text, "/dev/sda12");
    EXPECT_EQ(Clib_strncpy(text, "xyz", two), text);
    EXPECT_STREQ(text, "xyev/sda12");
    EXPECT_EQ(Clib_strlen(text), 10U);
}

TEST(ClibText, IsSearchedWithAndWithoutCase) {
    const char* const text = "Current Portal";
    EXPECT_EQ(Clib_strstr(text, "Portal"), text + 8);
    EXPECT_EQ(Clib_strstr(text, "portal"), nullptr);
    EXPECT_EQ(Clib_strcasestr(text, "portal"), text + 8);
    EXPECT_EQ(Clib_strcasestr(text, "none"), nullptr);
}

TEST(ClibText, IsComparedWithAndWithoutCase) {
    EXPECT_EQ(Clib_strcmp("sda", "sda"), 0);
    EXPECT_LT(Clib_strcmp("SDA", "sda"), 0);
    EXPECT_EQ(Clib_strncmp("sda1", "sda2", 3), 0);
    EXPECT_LT(Clib_strncmp("sda1", "sda2", 4), 0);
    EXPECT_EQ(Clib_strcasecmp("SDA", "sda"), 0);
    EXPECT_GT(Clib_strcasecmp("SDB", "sda"), 0);
    EXPECT_EQ(Clib_strncasecmp("SDA1", "sda2", 3), 0);
    EXPECT_LT(Clib_strncasecmp("SDA1", "sda2", 4), 0);
}

TEST(ClibText, IsTakenApartIntoTokens) {
    char text[] = "8  0 sda";
    char* state = nullptr;
    EXPECT_STREQ(Clib_strtok_r(text, " ", &state), "8");
    EXPECT_STREQ(Clib_strtok_r(nullptr, " ", &state), "0");
    EXPECT_STREQ(Clib_strtok_r(nullptr, " ", &state), "sda");
    EXPECT_EQ(Clib_strtok_r(nullptr, " ", &state), nullptr);
}

TEST(ClibByteOrder, ConvertsToAndFromTheNetworks) {
    const uint32_t word = Clib_htonl(0x01020304);
    const uint16_t half = Clib_htons(0x0102);
    EXPECT_EQ(std::memcmp(&word, "\1\2\3\4", 4), 0);
    EXPECT_EQ(std::memcmp(&half, "\1\2", 2), 0);
    EXPECT_EQ(Clib_ntohl(word), 0x01020304U);
    EXPECT_EQ(Clib_ntohs(half), 0x0102U);
}

TEST(ClibRand, GivesTheSequenceOfItsSeed) {
    std::srand(7); // NOLINT(cert-msc51-cpp): the seed is the test
    const int first = Clib_rand();
    std::srand(7); // NOLINT(cert-msc51-cpp): the seed is the test
    EXPECT_EQ(Clib_rand(), first);
    EXPECT_GE(first, 0);
}

} // namespace
