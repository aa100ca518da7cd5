#include "foundation/clib_error.hpp"

char* Clib_strerror(char* buffer, std::size_t length) {
    if (length == 0) {
        return buffer;
    }
    const ErrnoText text;
    std::strncpy(buffer, text.text, length - 1);
    buffer[length - 1] = '\0';
    return buffer;
}
