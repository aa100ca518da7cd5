#include "foundation/log.hpp"

#include <stdio_ext.h>

#include <cerrno>
#include <cstdarg>
#include <cstddef>
#include <cstring>
#include <iterator>

#include "foundation/exceptions.hpp"

std::FILE* gLogStream = nullptr;

namespace {

int gLogError = 0;

std::FILE* logStream() {
    return gLogStream != nullptr ? gLogStream : stderr;
}

// Remembers why the stream refused a text. What it still holds is dropped: written later, it would stand
// behind a hole.
void refused(std::FILE* stream) noexcept {
    if (gLogError == 0) {
        gLogError = errno != 0 ? errno : EIO;
    }
    __fpurge(stream);
}

// Whether the stream has taken everything so far.
bool isWhole(std::FILE* stream) noexcept {
    if (ferror_unlocked(stream) == 0) {
        return true;
    }
    refused(stream);
    return false;
}

bool put(std::FILE* stream, const char* text, std::size_t length) noexcept {
    if (!isWhole(stream)) {
        return false;
    }
    if (fwrite_unlocked(text, 1, length, stream) != length) {
        refused(stream);
        return false;
    }
    return true;
}

[[noreturn]] void fail() {
    throw WriteFailedEx("File write failed\n");
}

} // namespace

// The texts that no stream has yet.
struct GatheredText {
    static bool pass(std::FILE* stream) noexcept {
        const bool isTaken = put(stream, LogText::sGathered, LogText::sLength);
        LogText::sLength = 0;
        return isTaken;
    }
};

namespace {

// The number of characters, or a negative number when the stream refuses them.
[[gnu::format(printf, 1, 0)]] int putFormatted(const char* format, std::va_list arguments) noexcept {
    std::FILE* const stream = logStream();
    if (!GatheredText::pass(stream)) {
        return -1;
    }
    const int written = std::vfprintf(stream, format, arguments);
    if (written < 0) {
        refused(stream);
    }
    return written;
}

} // namespace

char LogText::sGathered[];
std::size_t LogText::sLength = 0;

int logPrintf(const char* format, ...) {
    if (std::strchr(format, '%') == nullptr) { // most lines: nothing to be formatted
        LogText().string(format).write();
        return static_cast<int>(std::strlen(format));
    }
    std::va_list arguments;
    va_start(arguments, format);
    const int written = putFormatted(format, arguments);
    va_end(arguments);
    if (written < 0) {
        fail();
    }
    return written;
}

int reportPrintf(const char* format, ...) {
    std::va_list arguments;
    va_start(arguments, format);
    const int written = putFormatted(format, arguments);
    va_end(arguments);
    if (written < 0) {
        throw WriteFailedEx("File write failed");
    }
    return written;
}

LogText& LogText::decimal(uint32 number) noexcept {
    char digits[10]; // of the largest
    char* first = std::end(digits);
    do {
        *--first = static_cast<char>('0' + number % 10);
        number /= 10;
    } while (number != 0);
    return bytes(first, static_cast<std::size_t>(std::end(digits) - first));
}

LogText& LogText::hex(uint8 byte) noexcept {
    constexpr char kDigits[] = "0123456789abcdef";
    const char digits[] = {kDigits[byte >> 4], kDigits[byte & 0x0F]};
    return byte > 0x0F ? bytes(digits, 2) : bytes(digits + 1, 1);
}

void LogText::write() {
    std::FILE* const stream = logStream();
    if (__fbufsize(stream) <= 1 ? !GatheredText::pass(stream) : !isWhole(stream)) {
        fail();
    }
}

void LogText::writeNoThrow() noexcept {
    std::FILE* const stream = logStream();
    if (__fbufsize(stream) <= 1) {
        static_cast<void>(GatheredText::pass(stream));
    }
}

// For a text that finds no room among the gathered ones.
LogText& LogText::pass(const char* text, std::size_t length) noexcept {
    std::FILE* const stream = logStream();
    static_cast<void>(GatheredText::pass(stream) && put(stream, text, length));
    return *this;
}

void passLog() {
    if (!GatheredText::pass(logStream())) {
        fail();
    }
}

void flushLog() {
    passLog();
    std::FILE* const stream = logStream();
    if (std::fflush(stream) != 0) {
        refused(stream);
        fail();
    }
}

int logError() {
    return gLogError;
}
