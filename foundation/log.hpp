// The log: its stream, and the ways to write to it.
//
// The first text that the stream refuses is the last one it is offered: from then on every write fails, so a
// log that could not take something has no hole, and no device can be blamed for it.
#pragma once

#include <cstdio>
#include <initializer_list>

#include "foundation/integers.hpp"

// Destination of every trace and report line; null until the run has opened its log file, and standard error
// stands in for it then. Set once by the entry, never closed: exit flushes it. Not owned by anybody else.
extern std::FILE* gLogStream;

// Writes a line of the trace: formats like printf. Returns the number of characters written. Throws
// WriteFailedEx "File write failed\n" when the stream refuses them. Nothing is flushed and nothing is added
// to the text.
int logPrintf(const char* format, ...) __attribute__((format(printf, 1, 2)));

// Writes a line of the report, in the same way. Throws WriteFailedEx "File write failed".
int reportPrintf(const char* format, ...) __attribute__((format(printf, 1, 2)));

// What stands for one conversion of a line that logLine puts together.
class LogField {
public:
    // For "%s": a NUL-terminated text, which outlives the call.
    LogField(const char* text) : mText(text) {} // NOLINT(google-explicit-constructor): a field of a list
    // For "%u" and "%x".
    LogField(uint32 number) : mNumber(number) {} // NOLINT(google-explicit-constructor): a field of a list

    const char* text() const { return mText; }
    uint32 number() const { return mNumber; }

private:
    const char* mText = nullptr;
    uint32 mNumber = 0;
};

// logPrintf for the lines that make most of a log: knows "%s", "%u" and "%x" alone, a field for each, and is
// several times as fast. Throws as logPrintf.
void logLine(const char* format, std::initializer_list<LogField> fields = {});

// The same for where no exception may leave: a line that the stream refuses is lost.
void logLineNoThrow(const char* format, std::initializer_list<LogField> fields = {}) noexcept;

// Hands everything written so far to the kernel. Called before whatever can wait (a command, a device, a
// library), so that the log of a run that is killed there ends with it. Throws as logPrintf.
void flushLog();

// The error number of the first text that the log stream refused; 0 while it has taken everything.
int logError();
