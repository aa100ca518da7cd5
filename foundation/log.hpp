// The log: its stream, and the two ways to write to it.
#pragma once

#include <cstdio>

// Destination of every trace and report line; null until the run has opened its log file, and standard error
// stands in for it then. Set once by the entry, never closed: exit flushes it. Not owned by anybody else.
extern std::FILE* gLogStream;

// Writes a line of the trace: formats like printf. Returns the number of characters written. Throws
// WriteFailedEx "File write failed\n" when the stream refuses them. Nothing is flushed and nothing is added
// to the text.
int logPrintf(const char* format, ...) __attribute__((format(printf, 1, 2)));

// Writes a line of the report, in the same way. Throws WriteFailedEx "File write failed".
int reportPrintf(const char* format, ...) __attribute__((format(printf, 1, 2)));

// logPrintf for where no exception may leave: a line that the stream refuses is lost.
void logPrintfNoThrow(const char* format, ...) noexcept __attribute__((format(printf, 1, 2)));
