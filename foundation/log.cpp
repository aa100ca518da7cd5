#include "foundation/log.hpp"

#include <cstdarg>

#include "foundation/exceptions.hpp"

std::FILE* gLogStream = nullptr;

namespace {

std::FILE* logStream() {
    return gLogStream != nullptr ? gLogStream : stderr;
}

// A negative result when the stream refuses the text.
int writeFormatted(const char* format, std::va_list arguments) noexcept {
    return std::vfprintf(logStream(), format, arguments);
}

} // namespace

int logPrintf(const char* format, ...) {
    std::va_list arguments;
    va_start(arguments, format);
    const int written = writeFormatted(format, arguments);
    va_end(arguments);
    if (written < 0) {
        throw WriteFailedEx("File write failed\n");
    }
    return written;
}

int reportPrintf(const char* format, ...) {
    std::va_list arguments;
    va_start(arguments, format);
    const int written = writeFormatted(format, arguments);
    va_end(arguments);
    if (written < 0) {
        throw WriteFailedEx("File write failed");
    }
    return written;
}

void logPrintfNoThrow(const char* format, ...) noexcept {
    std::va_list arguments;
    va_start(arguments, format);
    static_cast<void>(writeFormatted(format, arguments));
    va_end(arguments);
}
