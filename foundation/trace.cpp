#include "foundation/trace.hpp"

#include <cstdarg>
#include <cstdlib>

#include "foundation/clib_stream.hpp"
#include "foundation/exceptions.hpp"

std::FILE* gLogStream = nullptr;

namespace {

std::FILE* logStream() {
    return gLogStream != nullptr ? gLogStream : stderr;
}

} // namespace

int logPrintf(const char* format, ...) {
    va_list arguments;
    va_start(arguments, format);
    try {
        const int written = Clib_vfprintf(logStream(), format, arguments);
        va_end(arguments);
        return written;
    } catch (...) {
        va_end(arguments);
        throw;
    }
}

void TRACE_ENTRY(const char* name, unsigned line) {
    logPrintf("Entered Function %s Line %u\n", name, line);
}

void TRACE_EXIT(const char* name, unsigned line) {
    logPrintf("Left Function %s Line %u\n", name, line);
}

void logPrintfNoThrow(const char* format, ...) noexcept {
    va_list arguments;
    va_start(arguments, format);
    static_cast<void>(std::vfprintf(logStream(), format, arguments));
    va_end(arguments);
}

void traceEntryNoThrow(const char* name, unsigned line) noexcept {
    logPrintfNoThrow("Entered Function %s Line %u\n", name, line);
}

void traceExitNoThrow(const char* name, unsigned line) noexcept {
    logPrintfNoThrow("Left Function %s Line %u\n", name, line);
}

void assertionFailed(const char* conditionText) {
    // The process ends here whether or not the log still takes the line.
    logPrintfNoThrow("Assertion [ %s ] failed\n", conditionText);
    std::exit(1);
}
