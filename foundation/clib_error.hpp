// How a failed system call becomes a message text.
#pragma once

#include <cerrno>
#include <cstddef>
#include <cstring>

// Longest system error text that an exception carries, with its NUL.
constexpr std::size_t kErrnoTextSize = 256;

// The system's text for an errno value, cut to 255 characters.
struct ErrnoText {
    explicit ErrnoText(int error = errno) {
        char scratch[kErrnoTextSize] = {};
        std::strncpy(text, strerror_r(error, scratch, sizeof scratch), sizeof text - 1);
    }
    char text[kErrnoTextSize] = {};
};

// Throws `Exception` with the system's text for the current errno.
template <typename Exception>
[[noreturn]] void throwErrno() {
    throw Exception(ErrnoText().text);
}

// Copies the system's text for the current errno, with its NUL, into `buffer` of `length` bytes and returns
// `buffer`; a text that does not fit is cut.
char* Clib_strerror(char* buffer, std::size_t length);
