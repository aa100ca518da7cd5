#include "foundation/clib_file.hpp"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "foundation/exceptions.hpp"
#include "tests/support/temporary_directory.hpp"
#include "tests/support/thrown.hpp"

namespace {

constexpr const char* kBadDescriptor = "Bad file descriptor";
constexpr const char* kNoSuchFile = "No such file or directory";
constexpr const char* kTryAgain = "Resource temporarily unavailable";

struct Pipe {
    explicit Pipe(int flags = 0) { EXPECT_EQ(pipe2(ends, flags), 0); }
    Pipe(const Pipe&) = delete;
    Pipe& operator=(const Pipe&) = delete;
    ~Pipe() {
        close(ends[0]);
        closeWriter();
    }
    int reader() const { return ends[0]; }
    int writer() const { return ends[1]; }
    void closeWriter() {
        if (ends[1] != -1) {
            close(ends[1]);
        }
        ends[1] = -1;
    }

    int ends[2] = {-1, -1};
};

TEST(ClibOpen, GivesADescriptorToCloseAgain) {
    const TemporaryDirectory directory;
    const int fd = Clib_open(directory.file("f", "text").c_str(), O_RDONLY, 0);
    char text[4];
    EXPECT_EQ(Clib_read(fd, text, 4), 4);
    EXPECT_EQ(std::string(text, 4), "text");
    EXPECT_EQ(Clib_close(fd), 0);
    EXPECT_EQ(fcntl(fd, F_GETFD), -1);
}

TEST(ClibOpen, PassesTheModeOfANewFileOn) {
    const TemporaryDirectory directory;
    const int fd = Clib_open(directory.path("f").c_str(), O_RDWR | O_CREAT, 0400);
    struct stat status {};
    fstat(fd, &status);
    EXPECT_EQ(status.st_mode & 0777, 0400U);
    Clib_close(fd);
}

TEST(ClibOpen, ThrowsOpenFailedExWithTheSystemsText) {
    const TemporaryDirectory directory;
    EXPECT_EQ(messageOf<OpenFailedEx>([&] { Clib_open(directory.path("none").c_str(), O_RDONLY, 0); }),
              kNoSuchFile);
}

TEST(ClibCreat, MakesAnEmptyFile) {
    const TemporaryDirectory directory;
    const int fd = Clib_creat(directory.file("f", "old text").c_str(), 0644);
    EXPECT_GE(fd, 0);
    Clib_close(fd);
    EXPECT_EQ(directory.textOf("f"), "");
}

TEST(ClibCreat, ThrowsCreateFailedExWithTheSystemsText) {
    const TemporaryDirectory directory;
    EXPECT_EQ(messageOf<CreateFailedEx>([&] { Clib_creat(directory.path("none/f").c_str(), 0644); }),
              kNoSuchFile);
}

TEST(ClibClose, ThrowsCloseFailedExWithTheSystemsText) {
    EXPECT_EQ(messageOf<CloseFailedEx>([] { Clib_close(-1); }), kBadDescriptor);
}

TEST(ClibRead, GivesZeroAtTheEndOfTheFile) {
    Pipe pipe;
    pipe.closeWriter();
    char byte = 0;
    EXPECT_EQ(Clib_read(pipe.reader(), &byte, 1), 0);
}

TEST(ClibRead, ThrowsReadFailedExWithTheSystemsText) {
    char byte = 0;
    EXPECT_EQ(messageOf<ReadFailedEx>([&] { Clib_read(-1, &byte, 1); }), kBadDescriptor);
}

TEST(ClibRead, ThrowsReadFailedExEvenWhenThereIsNothingYet) {
    const Pipe pipe(O_NONBLOCK);
    char byte = 0;
    EXPECT_EQ(messageOf<ReadFailedEx>([&] { Clib_read(pipe.reader(), &byte, 1); }), kTryAgain);
}

TEST(ClibRead, LeavesTheDescriptorOpenWhenItFails) {
    const TemporaryDirectory directory;
    const int fd = Clib_open(directory.path().c_str(), O_RDONLY | O_DIRECTORY, 0);
    char byte = 0;
    EXPECT_EQ(messageOf<ReadFailedEx>([&] { Clib_read(fd, &byte, 1); }), "Is a directory");
    EXPECT_EQ(Clib_close(fd), 0);
}

TEST(ClibDup, GivesASecondDescriptor) {
    Pipe pipe;
    const int copy = Clib_dup(pipe.writer());
    EXPECT_NE(copy, pipe.writer());
    EXPECT_EQ(Clib_writeAll(copy, "x", 1), 1U);
    Clib_close(copy);
    char byte = 0;
    EXPECT_EQ(Clib_read(pipe.reader(), &byte, 1), 1);
    EXPECT_EQ(byte, 'x');
}

TEST(ClibDup, ThrowsClibDupFailedExWithTheSystemsText) {
    EXPECT_EQ(messageOf<ClibDupFailedEx>([] { Clib_dup(-1); }), kBadDescriptor);
}

TEST(ClibDup2, GivesTheDescriptorAsked) {
    Pipe pipe;
    Pipe other;
    EXPECT_EQ(Clib_dup2(pipe.writer(), other.writer()), other.writer());
    EXPECT_EQ(Clib_writeAll(other.writer(), "x", 1), 1U);
    char byte = 0;
    EXPECT_EQ(Clib_read(pipe.reader(), &byte, 1), 1);
    EXPECT_EQ(byte, 'x');
}

TEST(ClibDup2, ThrowsClibDup2FailedExWithTheSystemsText) {
    EXPECT_EQ(messageOf<ClibDup2FailedEx>([] { Clib_dup2(-1, 0); }), kBadDescriptor);
}

TEST(ClibReadAll, ReadsUntilEverythingIsThere) {
    const Pipe pipe;
    Clib_writeAll(pipe.writer(), "0123456789ab", 12);
    char text[10];
    EXPECT_EQ(Clib_readAll(pipe.reader(), text, 10), 10U);
    EXPECT_EQ(std::string(text, 10), "0123456789");
}

TEST(ClibReadAll, GivesWhatThereIsWhenTheFileEndsEarly) {
    Pipe pipe;
    Clib_writeAll(pipe.writer(), "abc", 3);
    pipe.closeWriter();
    char text[10];
    EXPECT_EQ(Clib_readAll(pipe.reader(), text, 10), 3U);
    EXPECT_EQ(std::string(text, 3), "abc");
}

TEST(ClibReadAll, GivesZeroAtTheEndOfTheFile) {
    Pipe pipe;
    pipe.closeWriter();
    char text[10];
    EXPECT_EQ(Clib_readAll(pipe.reader(), text, 10), 0U);
}

TEST(ClibReadAll, ThrowsTryAgainExWhenThereIsNothingYet) {
    const Pipe pipe(O_NONBLOCK);
    char text[10];
    EXPECT_EQ(messageOf<TryAgainEx>([&] { Clib_readAll(pipe.reader(), text, 10); }), kTryAgain);
}

TEST(ClibReadAll, ThrowsReadFailedExOnAnyOtherErrorBeforeTheFirstByte) {
    char text[10];
    EXPECT_EQ(messageOf<ReadFailedEx>([&] { Clib_readAll(-1, text, 10); }), kBadDescriptor);
}

TEST(ClibReadAll, DoesNotReportAnErrorAfterTheFirstByte) {
    const Pipe pipe(O_NONBLOCK);
    Clib_writeAll(pipe.writer(), "abc", 3);
    char text[10];
    EXPECT_EQ(Clib_readAll(pipe.reader(), text, 10), 3U);
}

TEST(ClibReadAll, ReadsNothingWhenAskedForNothing) {
    EXPECT_EQ(Clib_readAll(-1, nullptr, 0), 0U);
}

TEST(ClibWriteAll, WritesEverything) {
    const TemporaryDirectory directory;
    const int fd = Clib_creat(directory.path("f").c_str(), 0644);
    EXPECT_EQ(Clib_writeAll(fd, "text", 4), 4U);
    Clib_close(fd);
    EXPECT_EQ(directory.textOf("f"), "text");
}

TEST(ClibWriteAll, ThrowsWriteFailedExWithTheSystemsText) {
    EXPECT_EQ(messageOf<WriteFailedEx>([] { Clib_writeAll(-1, "text", 4); }), kBadDescriptor);
    const int full = Clib_open("/dev/full", O_WRONLY, 0);
    EXPECT_EQ(messageOf<WriteFailedEx>([&] { Clib_writeAll(full, "text", 4); }), "No space left on device");
    Clib_close(full);
}

TEST(ClibWriteAll, GivesAShortCountAndThenWriteFailedExWhenAPipeFillsUp) {
    const Pipe pipe(O_NONBLOCK);
    const std::vector<char> text(1 << 20, 'x');
    const std::size_t written = Clib_writeAll(pipe.writer(), text.data(), text.size());
    EXPECT_GT(written, 0U);
    EXPECT_LT(written, text.size());
    EXPECT_EQ(messageOf<WriteFailedEx>([&] { Clib_writeAll(pipe.writer(), "x", 1); }), kTryAgain);
}

TEST(ClibWriteAll, WritesNothingWhenAskedForNothing) {
    EXPECT_EQ(Clib_writeAll(-1, nullptr, 0), 0U);
}

} // namespace
