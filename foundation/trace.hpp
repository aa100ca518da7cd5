// The log: its stream, its printf, the entry and exit trace of every function, and the fatal assertion.
#pragma once

#include <cstdio>

// Destination of every trace and report line; null until the run has opened its log file, and standard error
// stands in for it then. Set once by the entry, never closed: exit flushes it. Not owned by anybody else.
extern std::FILE* gLogStream;

// Formats like printf and writes to the log. Returns the number of characters written. Throws WriteFailedEx
// "File write failed\n" when the stream refuses them. Nothing is flushed and nothing is added to the text.
int logPrintf(const char* format, ...) __attribute__((format(printf, 1, 2)));

// "Entered Function %s Line %u\n": the first statement of a traced function. `name` is the bare function
// name, `line` the line of the statement itself. Throws as logPrintf.
void TRACE_ENTRY(const char* name, unsigned line = __builtin_LINE());

// "Left Function %s Line %u\n": before each normal return, and before a throw of the function's own.
// Throws as logPrintf.
void TRACE_EXIT(const char* name, unsigned line = __builtin_LINE());

// logPrintf for destructors: a line that the stream refuses is lost, for an exception that leaves a
// destructor would end the program.
void logPrintfNoThrow(const char* format, ...) noexcept __attribute__((format(printf, 1, 2)));
void traceEntryNoThrow(const char* name, unsigned line = __builtin_LINE()) noexcept;
void traceExitNoThrow(const char* name, unsigned line = __builtin_LINE()) noexcept;

// Logs "Assertion [ %s ] failed\n" with the condition's text and ends the process with status 1.
[[noreturn]] void assertionFailed(const char* conditionText);

// Ends the process when `condition` does not hold, in every build. The condition's source text is the text
// that the log shows, so its spelling is part of the log's format.
// NOLINTNEXTLINE(cppcoreguidelines-macro-usage): only the preprocessor can spell a condition.
#define ASSERT_OR_EXIT(condition) ((condition) ? static_cast<void>(0) : assertionFailed(#condition))
