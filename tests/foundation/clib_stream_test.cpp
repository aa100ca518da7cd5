#include "foundation/clib_stream.hpp"

#include <fcntl.h>
#include <unistd.h>

#include <cstdarg>
#include <cstdio>
#include <cstring>
#include <string>

#include <gtest/gtest.h>

#include "foundation/exceptions.hpp"
#include "tests/support/temporary_directory.hpp"
#include "tests/support/thrown.hpp"

namespace {

constexpr const char* kInvalid = "Invalid argument";
constexpr const char* kNoSuchFile = "No such file or directory";

// Text that the C locale cannot convert: formatting it fails.
const wchar_t kUnconvertible[] = {0x20ac, 0};

// A stream that is closed with its test.
class Stream {
public:
    explicit Stream(std::FILE* stream) : mStream(stream) { EXPECT_NE(stream, nullptr); }
    Stream(const Stream&) = delete;
    Stream& operator=(const Stream&) = delete;
    ~Stream() { static_cast<void>(std::fclose(mStream)); }
    operator std::FILE*() const { return mStream; } // NOLINT(google-explicit-constructor): it is one

private:
    std::FILE* mStream;
};

std::FILE* readOnly() {
    return std::fopen("/dev/null", "r");
}

// A directory: it opens, but reading it fails.
std::FILE* unreadable() {
    return std::fopen("/", "r");
}

std::FILE* holding(const char* text) {
    std::FILE* const stream = std::tmpfile();
    static_cast<void>(std::fputs(text, stream));
    std::rewind(stream);
    return stream;
}

std::string contentOf(std::FILE* stream) {
    std::rewind(stream);
    char text[200] = "";
    return {text, std::fread(text, 1, sizeof text, stream)};
}

// Puts another stream in place of stdin or stdout for as long as it lives.
class InPlaceOf {
public:
    InPlaceOf(std::FILE*& standard, std::FILE* other) : mStandard(standard), mPrevious(standard) {
        standard = other;
    }
    InPlaceOf(const InPlaceOf&) = delete;
    InPlaceOf& operator=(const InPlaceOf&) = delete;
    ~InPlaceOf() { mStandard = mPrevious; }

private:
    std::FILE*& mStandard;
    std::FILE* mPrevious;
};

__attribute__((format(printf, 2, 3))) int viaVfprintf(std::FILE* stream, const char* format, ...) {
    struct End {
        std::va_list& arguments;
        ~End() { va_end(arguments); }
    };
    std::va_list arguments;
    va_start(arguments, format);
    const End end{arguments};
    return Clib_vfprintf(stream, format, arguments);
}

__attribute__((format(printf, 1, 2))) int viaVprintf(const char* format, ...) {
    struct End {
        std::va_list& arguments;
        ~End() { va_end(arguments); }
    };
    std::va_list arguments;
    va_start(arguments, format);
    const End end{arguments};
    return Clib_vprintf(format, arguments);
}

__attribute__((format(printf, 2, 3))) int viaVsprintf(char* buffer, const char* format, ...) {
    struct End {
        std::va_list& arguments;
        ~End() { va_end(arguments); }
    };
    std::va_list arguments;
    va_start(arguments, format);
    const End end{arguments};
    return Clib_vsprintf(buffer, format, arguments);
}

TEST(ClibFopen, MakesANewFileToWriteAndReadWithCodeFive) {
    const TemporaryDirectory directory;
    std::FILE* const stream = Clib_fopen(directory.path("f").c_str(), 5);
    EXPECT_EQ(std::fputs("text", stream), 1);
    EXPECT_EQ(contentOf(stream), "text");
    EXPECT_EQ(Clib_fclose(stream), 0);
    EXPECT_EQ(directory.textOf("f"), "text");
}

TEST(ClibFopen, EmptiesAnExistingFileWithCodeFive) {
    const TemporaryDirectory directory;
    Clib_fclose(Clib_fopen(directory.file("f", "old").c_str(), ClibFM_WriteUpdate));
    EXPECT_EQ(directory.textOf("f"), "");
}

TEST(ClibFopen, OnlyReadsWithCodeOne) {
    const TemporaryDirectory directory;
    const Stream stream(Clib_fopen(directory.file("f", "text").c_str(), ClibFM_Read));
    EXPECT_EQ(std::fputs("x", stream), EOF);
    EXPECT_EQ(contentOf(stream), "text");
}

TEST(ClibFopen, OnlyWritesANewTextWithCodeTwo) {
    const TemporaryDirectory directory;
    const Stream stream(Clib_fopen(directory.file("f", "text").c_str(), ClibFM_Write));
    EXPECT_EQ(std::fputs("new", stream), 1);
    EXPECT_EQ(std::fflush(stream), 0);
    EXPECT_EQ(directory.textOf("f"), "new");
    EXPECT_EQ(std::fgetc(stream), EOF);
    EXPECT_NE(std::ferror(stream), 0);
}

TEST(ClibFopen, UpdatesTheTextThatIsThereWithCodeThree) {
    const TemporaryDirectory directory;
    const Stream stream(Clib_fopen(directory.file("f", "text").c_str(), ClibFM_ReadUpdate));
    EXPECT_EQ(std::fputs("n", stream), 1);
    EXPECT_EQ(contentOf(stream), "next");
}

TEST(ClibFopen, AppendsWithCodeFour) {
    const TemporaryDirectory directory;
    Clib_fclose(Clib_fopen(directory.file("f", "text").c_str(), ClibFM_Append));
    const Stream stream(Clib_fopen(directory.path("f").c_str(), ClibFM_Append));
    EXPECT_EQ(std::fputs(" and more", stream), 1);
    EXPECT_EQ(std::fflush(stream), 0);
    EXPECT_EQ(directory.textOf("f"), "text and more");
}

TEST(ClibFopen, ThrowsOpenFailedExForAnyOtherCode) {
    const TemporaryDirectory directory;
    const std::string path = directory.file("f", "text");
    EXPECT_EQ(messageOf<OpenFailedEx>([&] { Clib_fopen(path.c_str(), 0); }), kInvalid);
    EXPECT_EQ(messageOf<OpenFailedEx>([&] { Clib_fopen(path.c_str(), 6); }), kInvalid);
    EXPECT_EQ(messageOf<OpenFailedEx>([&] { Clib_fopen(path.c_str(), -1); }), kInvalid);
}

TEST(ClibFopen, ThrowsOpenFailedExWithTheSystemsText) {
    EXPECT_EQ(messageOf<OpenFailedEx>([] { Clib_fopen("/nowhere/f", ClibFM_Read); }), kNoSuchFile);
}

TEST(ClibFdopen, PutsAStreamOnADescriptor) {
    const TemporaryDirectory directory;
    const int fd = open(directory.path("f").c_str(), O_RDWR | O_CREAT, 0644);
    const Stream stream(Clib_fdopen(fd, ClibFM_WriteUpdate));
    EXPECT_EQ(std::fputs("text", stream), 1);
    EXPECT_EQ(contentOf(stream), "text");
}

TEST(ClibFdopen, ThrowsOpenFailedExAndLeavesTheDescriptorOpen) {
    const int fd = open("/dev/null", O_RDONLY);
    EXPECT_EQ(messageOf<OpenFailedEx>([&] { Clib_fdopen(fd, 6); }), kInvalid);
    EXPECT_EQ(close(fd), 0);
    EXPECT_EQ(messageOf<OpenFailedEx>([] { Clib_fdopen(-1, ClibFM_Read); }), "Bad file descriptor");
}

TEST(ClibFreopen, PutsAnotherFileBehindAStream) {
    const TemporaryDirectory directory;
    std::FILE* const stream = readOnly();
    EXPECT_EQ(Clib_freopen(directory.file("f", "text").c_str(), ClibFM_Read, stream), stream);
    EXPECT_EQ(contentOf(stream), "text");
    Clib_fclose(stream);
}

TEST(ClibFreopen, KnowsCodesOneToFour) {
    const TemporaryDirectory directory;
    const Stream stream(readOnly());
    Clib_freopen(directory.path("f").c_str(), ClibFM_Write, stream);
    EXPECT_EQ(std::fputs("text", stream), 1);
    Clib_freopen(directory.path("f").c_str(), ClibFM_ReadUpdate, stream);
    EXPECT_EQ(std::fputs("n", stream), 1);
    Clib_freopen(directory.path("f").c_str(), ClibFM_Append, stream);
    EXPECT_EQ(std::fputs("!", stream), 1);
    Clib_freopen(directory.path("f").c_str(), ClibFM_Read, stream);
    EXPECT_EQ(contentOf(stream), "next!");
}

TEST(ClibFreopen, ThrowsOpenFailedExForCodeFive) {
    const TemporaryDirectory directory;
    const Stream stream(readOnly());
    const std::string path = directory.file("f", "text");
    EXPECT_EQ(messageOf<OpenFailedEx>([&] { Clib_freopen(path.c_str(), 5, stream); }), kInvalid);
    EXPECT_EQ(directory.textOf("f"), "text");
}

TEST(ClibFreopen, ThrowsOpenFailedExWithTheSystemsText) {
    const Stream stream(readOnly());
    EXPECT_EQ(messageOf<OpenFailedEx>([&] { Clib_freopen("/nowhere/f", ClibFM_Read, stream); }), kNoSuchFile);
}

TEST(ClibFclose, ThrowsCloseFailedExWhenTheRestCannotBeWritten) {
    std::FILE* const stream = std::fopen("/dev/full", "w");
    EXPECT_EQ(std::fputs("text", stream), 1);
    EXPECT_EQ(messageOf<CloseFailedEx>([&] { Clib_fclose(stream); }), "No space left on device");
}

TEST(ClibFread, GivesTheNumberOfItemsAndAShortCountAtTheEnd) {
    const Stream stream(holding("abcdefg"));
    char text[8] = "";
    EXPECT_EQ(Clib_fread(text, 2, 2, stream), 2U);
    EXPECT_EQ(std::string(text), "abcd");
    EXPECT_EQ(Clib_fread(text, 1, 8, stream), 3U);
    EXPECT_EQ(Clib_fread(text, 1, 8, stream), 0U);
}

TEST(ClibFread, ThrowsReadFailedEx) {
    const Stream stream(unreadable());
    char byte = 0;
    EXPECT_EQ(messageOf<ReadFailedEx>([&] { Clib_fread(&byte, 1, 1, stream); }), "File read failed");
}

TEST(ClibFgets, GivesALineWithItsLineEnd) {
    const Stream stream(holding("first\nlast"));
    char line[20] = "";
    EXPECT_EQ(Clib_fgets(line, sizeof line, stream), line);
    EXPECT_STREQ(line, "first\n");
    EXPECT_EQ(Clib_fgets(line, sizeof line, stream), line);
    EXPECT_STREQ(line, "last");
}

TEST(ClibFgets, GivesNullAtTheEndOfTheFile) {
    const Stream stream(holding(""));
    char line[20] = "";
    EXPECT_EQ(Clib_fgets(line, sizeof line, stream), nullptr);
}

TEST(ClibFgets, ThrowsReadFailedEx) {
    const Stream stream(unreadable());
    char line[20] = "";
    EXPECT_EQ(messageOf<ReadFailedEx>([&] { Clib_fgets(line, sizeof line, stream); }), "File read failed");
}

TEST(ClibFscanf, GivesTheNumberOfConversions) {
    const Stream stream(holding("sda 8"));
    char name[10] = "";
    int number = 0;
    EXPECT_EQ(Clib_fscanf(stream, "%9s %d", name, &number), 2);
    EXPECT_STREQ(name, "sda");
    EXPECT_EQ(number, 8);
}

TEST(ClibFscanf, DoesNotTakeTheEndOfTheFileForAFailure) {
    const Stream stream(holding(""));
    int number = 0;
    EXPECT_EQ(Clib_fscanf(stream, "%d", &number), EOF);
}

TEST(ClibFscanf, ThrowsReadFailedEx) {
    const Stream stream(unreadable());
    int number = 0;
    EXPECT_EQ(messageOf<ReadFailedEx>([&] { Clib_fscanf(stream, "%d", &number); }), "File read failed");
}

TEST(ClibScanf, GivesTheNumberOfConversions) {
    const Stream stream(holding("8"));
    const InPlaceOf input(stdin, stream);
    int number = 0;
    EXPECT_EQ(Clib_scanf("%d", &number), 1);
    EXPECT_EQ(number, 8);
}

TEST(ClibScanf, ThrowsReadFailedExWithALineEnd) {
    const Stream stream(unreadable());
    const InPlaceOf input(stdin, stream);
    int number = 0;
    EXPECT_EQ(messageOf<ReadFailedEx>([&] { Clib_scanf("%d", &number); }), "File read failed\n");
}

TEST(ClibSscanf, GivesTheNumberOfConversions) {
    int number = 0;
    EXPECT_EQ(Clib_sscanf("8", "%d", &number), 1);
    EXPECT_EQ(number, 8);
    EXPECT_EQ(Clib_sscanf("x", "%d", &number), 0);
}

TEST(ClibSscanf, ThrowsReadFailedExWhenTheTextEndsFirst) {
    int number = 0;
    EXPECT_EQ(messageOf<ReadFailedEx>([&] { Clib_sscanf("", "%d", &number); }), "String Read failed\n");
}

TEST(ClibFwrite, GivesTheNumberOfItems) {
    const Stream stream(std::tmpfile());
    EXPECT_EQ(Clib_fwrite("abcd", 2, 2, stream), 2U);
    EXPECT_EQ(contentOf(stream), "abcd");
}

TEST(ClibFwrite, ThrowsWriteFailedEx) {
    const Stream stream(readOnly());
    EXPECT_EQ(messageOf<WriteFailedEx>([&] { Clib_fwrite("abcd", 2, 2, stream); }), "File write failed");
}

TEST(ClibFprintf, GivesTheNumberOfCharacters) {
    const Stream stream(std::tmpfile());
    EXPECT_EQ(Clib_fprintf(stream, "%s %d\n", "sda", 8), 6);
    EXPECT_EQ(contentOf(stream), "sda 8\n");
}

TEST(ClibFprintf, ThrowsWriteFailedExWithoutALineEnd) {
    const Stream stream(readOnly());
    EXPECT_EQ(messageOf<WriteFailedEx>([&] { Clib_fprintf(stream, "%d", 8); }), "File write failed");
}

TEST(ClibVfprintf, GivesTheNumberOfCharacters) {
    const Stream stream(std::tmpfile());
    EXPECT_EQ(viaVfprintf(stream, "%s %d\n", "sda", 8), 6);
    EXPECT_EQ(contentOf(stream), "sda 8\n");
}

TEST(ClibVfprintf, ThrowsWriteFailedExWithALineEnd) {
    const Stream stream(readOnly());
    EXPECT_EQ(messageOf<WriteFailedEx>([&] { viaVfprintf(stream, "%d", 8); }), "File write failed\n");
}

TEST(ClibPrintf, WritesToStandardOutput) {
    const Stream stream(std::tmpfile());
    {
        const InPlaceOf output(stdout, stream);
        EXPECT_EQ(Clib_printf("%s\n", "Test completed."), 16);
    }
    EXPECT_EQ(contentOf(stream), "Test completed.\n");
}

TEST(ClibPrintf, ThrowsWriteFailedExWithoutALineEnd) {
    const Stream stream(readOnly());
    const InPlaceOf output(stdout, stream);
    EXPECT_EQ(messageOf<WriteFailedEx>([] { Clib_printf("%d", 8); }), "Stdout Write failed");
}

TEST(ClibVprintf, WritesToStandardOutput) {
    const Stream stream(std::tmpfile());
    {
        const InPlaceOf output(stdout, stream);
        EXPECT_EQ(viaVprintf("%d\n", 8), 2);
    }
    EXPECT_EQ(contentOf(stream), "8\n");
}

TEST(ClibVprintf, ThrowsWriteFailedExWithALineEnd) {
    const Stream stream(readOnly());
    const InPlaceOf output(stdout, stream);
    EXPECT_EQ(messageOf<WriteFailedEx>([] { viaVprintf("%d", 8); }), "Stdout Write failed\n");
}

TEST(ClibPutchar, WritesToStandardOutput) {
    const Stream stream(std::tmpfile());
    {
        const InPlaceOf output(stdout, stream);
        EXPECT_EQ(Clib_putchar('x'), 'x');
    }
    EXPECT_EQ(contentOf(stream), "x");
}

TEST(ClibPutchar, ThrowsWriteFailedEx) {
    const Stream stream(readOnly());
    const InPlaceOf output(stdout, stream);
    EXPECT_EQ(messageOf<WriteFailedEx>([] { Clib_putchar('x'); }), "Putting character on Stdout failed");
}

TEST(ClibSnprintf, CutsTheTextAndGivesItsWholeLength) {
    char text[4] = "";
    EXPECT_EQ(Clib_snprintf(text, sizeof text, "%s", "sda10"), 5);
    EXPECT_STREQ(text, "sda");
}

TEST(ClibSnprintf, ThrowsWriteFailedEx) {
    char text[20] = "";
    EXPECT_EQ(messageOf<WriteFailedEx>([&] { Clib_snprintf(text, sizeof text, "%ls", kUnconvertible); }),
              "String Write failed\n");
}

TEST(ClibSprintf, GivesTheNumberOfCharacters) {
    char text[20] = "";
    EXPECT_EQ(Clib_sprintf(text, "/dev/%s", "sda"), 8);
    EXPECT_STREQ(text, "/dev/sda");
}

TEST(ClibSprintf, ThrowsWriteFailedEx) {
    char text[20] = "";
    EXPECT_EQ(messageOf<WriteFailedEx>([&] { Clib_sprintf(text, "%ls", kUnconvertible); }),
              "String Write failed\n");
}

TEST(ClibVsprintf, GivesTheNumberOfCharacters) {
    char text[20] = "";
    EXPECT_EQ(viaVsprintf(text, "/dev/%s", "sda"), 8);
    EXPECT_STREQ(text, "/dev/sda");
}

TEST(ClibVsprintf, ThrowsWriteFailedEx) {
    char text[20] = "";
    EXPECT_EQ(messageOf<WriteFailedEx>([&] { viaVsprintf(text, "%ls", kUnconvertible); }),
              "String Write failed\n");
}

} // namespace
