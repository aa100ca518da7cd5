// The log: its stream, and the ways to write to it.
//
// The first text that the stream refuses is the last one it is offered: from then on every write fails, so a
// log that could not take something has no hole, and no device can be blamed for it.
#pragma once

#include <cstddef>
#include <cstdio>
#include <cstring>

#include "foundation/integers.hpp"

// Destination of every trace and report line; null until the run has opened its log file, and standard error
// stands in for it then. Set once by the entry, never closed. Not owned by anybody else.
extern std::FILE* gLogStream;

// Writes a line of the trace: formats like printf. Returns the number of characters written. Throws
// WriteFailedEx "File write failed\n" when the stream refuses them. Nothing is flushed and nothing is added
// to the text.
int logPrintf(const char* format, ...) __attribute__((format(printf, 1, 2)));

// Writes a line of the report, in the same way. Throws WriteFailedEx "File write failed".
int reportPrintf(const char* format, ...) __attribute__((format(printf, 1, 2)));

// Puts a line of the trace together piece by piece, without printf: for the lines that make most of a log.
// They are gathered, and go to the stream many at a time, before anything else does; a stream without a
// buffer of its own gets each at once.
class LogText {
public:
    // A literal, whose length the compiler knows.
    template <std::size_t Size>
    LogText& text(const char (&literal)[Size]) noexcept {
        return bytes(literal, Size - 1);
    }
    LogText& string(const char* text) noexcept { return bytes(text, std::strlen(text)); } // as "%s"
    LogText& decimal(uint32 number) noexcept;                                             // as "%u"
    LogText& hex(uint8 byte) noexcept;                                                    // as "%x"

    // Ends what was put together. Throws as logPrintf.
    void write();

    // The same for where no exception may leave: a text that the stream refuses is lost.
    void writeNoThrow() noexcept;

private:
    LogText& bytes(const char* text, std::size_t length) noexcept {
        if (length > sizeof sGathered - sLength) {
            return pass(text, length);
        }
        std::memcpy(sGathered + sLength, text, length);
        sLength += length;
        return *this;
    }
    LogText& pass(const char* text, std::size_t length) noexcept;

    friend struct GatheredText;
    static char sGathered[2048];
    static std::size_t sLength;
};

// Hands what is gathered to the stream, for somebody who writes to the stream itself. Throws as logPrintf.
void passLog();

// Hands everything written so far to the kernel. Called before whatever can wait (a command, a device, a
// library), so that the log of a run that is killed there ends with it. Throws as logPrintf.
void flushLog();

// The error number of the first text that the log stream refused; 0 while it has taken everything.
int logError();
