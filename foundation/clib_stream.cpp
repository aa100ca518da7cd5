#include "foundation/clib_stream.hpp"

#include "foundation/clib_error.hpp"
#include "foundation/exceptions.hpp"

namespace {

const char* modeString(int mode) {
    switch (mode) {
    case ClibFM_Read:
        return "r";
    case ClibFM_Write:
        return "w";
    case ClibFM_ReadUpdate:
        return "r+";
    case ClibFM_Append:
        return "a";
    case ClibFM_WriteUpdate:
        return "w+";
    default:
        return "";
    }
}

std::FILE* opened(std::FILE* stream) {
    if (stream == nullptr) {
        throwErrno<OpenFailedEx>();
    }
    return stream;
}

// The result of a call, unless it is negative.
template <typename Exception>
int unlessNegative(int result, const char* message) {
    if (result < 0) {
        throw Exception(message);
    }
    return result;
}

} // namespace

std::FILE* Clib_fopen(const char* path, int mode) {
    return opened(std::fopen(path, modeString(mode)));
}

std::FILE* Clib_fdopen(int fd, int mode) {
    return opened(fdopen(fd, modeString(mode)));
}

std::FILE* Clib_freopen(const char* path, int mode, std::FILE* stream) {
    return opened(std::freopen(path, mode == ClibFM_WriteUpdate ? "" : modeString(mode), stream));
}

int Clib_fclose(std::FILE* stream) {
    const int result = std::fclose(stream);
    if (result == -1) {
        throwErrno<CloseFailedEx>();
    }
    return result;
}

std::size_t Clib_fread(void* buffer, std::size_t size, std::size_t count, std::FILE* stream) {
    const std::size_t result = std::fread(buffer, size, count, stream);
    if (std::ferror(stream) != 0) {
        throw ReadFailedEx("File read failed");
    }
    return result;
}

char* Clib_fgets(char* buffer, int size, std::FILE* stream) {
    char* const result = std::fgets(buffer, size, stream);
    if (result == nullptr && std::ferror(stream) != 0) {
        throw ReadFailedEx("File read failed");
    }
    return result;
}

int Clib_fscanf(std::FILE* stream, const char* format, ...) {
    va_list arguments;
    va_start(arguments, format);
    const int result = std::vfscanf(stream, format, arguments);
    va_end(arguments);
    if (std::ferror(stream) != 0) {
        throw ReadFailedEx("File read failed");
    }
    return result;
}

int Clib_scanf(const char* format, ...) {
    va_list arguments;
    va_start(arguments, format);
    const int result = std::vscanf(format, arguments);
    va_end(arguments);
    if (std::ferror(stdin) != 0) {
        throw ReadFailedEx("File read failed\n");
    }
    return result;
}

int Clib_sscanf(const char* text, const char* format, ...) {
    va_list arguments;
    va_start(arguments, format);
    const int result = std::vsscanf(text, format, arguments);
    va_end(arguments);
    if (result == -1) {
        throw ReadFailedEx("String Read failed\n");
    }
    return result;
}

std::size_t Clib_fwrite(const void* buffer, std::size_t size, std::size_t count, std::FILE* stream) {
    const std::size_t result = std::fwrite(buffer, size, count, stream);
    if (result == 0) {
        throw WriteFailedEx("File write failed");
    }
    return result;
}

int Clib_fprintf(std::FILE* stream, const char* format, ...) {
    va_list arguments;
    va_start(arguments, format);
    const int result = std::vfprintf(stream, format, arguments);
    va_end(arguments);
    return unlessNegative<WriteFailedEx>(result, "File write failed");
}

int Clib_vfprintf(std::FILE* stream, const char* format, std::va_list arguments) {
    return unlessNegative<WriteFailedEx>(std::vfprintf(stream, format, arguments), "File write failed\n");
}

int Clib_printf(const char* format, ...) {
    va_list arguments;
    va_start(arguments, format);
    const int result = std::vprintf(format, arguments);
    va_end(arguments);
    return unlessNegative<WriteFailedEx>(result, "Stdout Write failed");
}

int Clib_vprintf(const char* format, std::va_list arguments) {
    return unlessNegative<WriteFailedEx>(std::vprintf(format, arguments), "Stdout Write failed\n");
}

int Clib_putchar(int character) {
    const int result = std::putchar(character);
    if (result == -1) {
        throw WriteFailedEx("Putting character on Stdout failed");
    }
    return result;
}

int Clib_snprintf(char* buffer, std::size_t size, const char* format, ...) {
    va_list arguments;
    va_start(arguments, format);
    const int result = std::vsnprintf(buffer, size, format, arguments);
    va_end(arguments);
    return unlessNegative<WriteFailedEx>(result, "String Write failed\n");
}

int Clib_sprintf(char* buffer, const char* format, ...) {
    va_list arguments;
    va_start(arguments, format);
    // NOLINTNEXTLINE(clang-analyzer-security.insecureAPI.*): the caller answers for the room
    const int result = std::vsprintf(buffer, format, arguments);
    va_end(arguments);
    return unlessNegative<WriteFailedEx>(result, "String Write failed\n");
}

int Clib_vsprintf(char* buffer, const char* format, std::va_list arguments) {
    // NOLINTNEXTLINE(clang-analyzer-security.insecureAPI.*): the caller answers for the room
    return unlessNegative<WriteFailedEx>(std::vsprintf(buffer, format, arguments), "String Write failed\n");
}
