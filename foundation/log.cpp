#include "foundation/log.hpp"

#include <stdio_ext.h>

#include <cerrno>
#include <charconv>
#include <cstdarg>
#include <cstddef>
#include <cstring>

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
    if (std::ferror(stream) == 0) {
        return true;
    }
    refused(stream);
    return false;
}

bool put(std::FILE* stream, const char* text, std::size_t length) noexcept {
    if (fwrite_unlocked(text, 1, length, stream) == length) {
        return true;
    }
    refused(stream);
    return false;
}

// A line on its way to a stream, gathered so that the stream is called once for most lines.
class Line {
public:
    explicit Line(std::FILE* stream) : mStream(stream), mIsTaken(isWhole(stream)) {}

    void add(const char* text, std::size_t length) noexcept {
        if (length > sizeof mText - mLength) {
            pass();
        }
        if (length > sizeof mText) {
            mIsTaken = mIsTaken && put(mStream, text, length);
            return;
        }
        std::memcpy(mText + mLength, text, length);
        mLength += length;
    }

    void add(uint32 number, int base) noexcept {
        char digits[10]; // of the largest decimal number
        const auto end = std::to_chars(digits, digits + sizeof digits, number, base).ptr;
        add(digits, static_cast<std::size_t>(end - digits));
    }

    // Whether the stream took the line.
    bool end() noexcept {
        pass();
        return mIsTaken;
    }

private:
    void pass() noexcept {
        mIsTaken = mIsTaken && put(mStream, mText, mLength);
        mLength = 0;
    }

    std::FILE* mStream;
    bool mIsTaken;
    std::size_t mLength = 0;
    char mText[256];
};

bool putLine(const char* format, std::initializer_list<LogField> fields) noexcept {
    Line line(logStream());
    const LogField* field = fields.begin();
    for (const char* rest = format; *rest != '\0';) {
        const std::size_t literal = std::strcspn(rest, "%");
        line.add(rest, literal);
        rest += literal;
        if (field == fields.end()) {
            break;
        }
        switch (rest[1]) {
        case 's':
            line.add(field->text(), std::strlen(field->text()));
            break;
        case 'u':
            line.add(field->number(), 10);
            break;
        default: // 'x'
            line.add(field->number(), 16);
            break;
        }
        ++field;
        rest += 2;
    }
    return line.end();
}

// The number of characters, or a negative number when the stream refuses them.
int putFormatted(const char* format, std::va_list arguments) noexcept {
    std::FILE* const stream = logStream();
    if (!isWhole(stream)) {
        return -1;
    }
    const int written = std::vfprintf(stream, format, arguments);
    if (written < 0) {
        refused(stream);
    }
    return written;
}

[[noreturn]] void fail() {
    throw WriteFailedEx("File write failed\n");
}

} // namespace

int logPrintf(const char* format, ...) {
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

void logLine(const char* format, std::initializer_list<LogField> fields) {
    if (!putLine(format, fields)) {
        fail();
    }
}

void logLineNoThrow(const char* format, std::initializer_list<LogField> fields) noexcept {
    static_cast<void>(putLine(format, fields));
}

void flushLog() {
    std::FILE* const stream = logStream();
    if (!isWhole(stream)) {
        fail();
    }
    if (std::fflush(stream) != 0) {
        refused(stream);
        fail();
    }
}

int logError() {
    return gLogError;
}
