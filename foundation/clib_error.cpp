#include "foundation/clib_error.hpp"

char* Clib_strerror(char* buffer, std::size_t length) {
    if (length == 0) {
        return buffer;
    }
    const ErrnoText lText;
    std::strncpy(buffer, lText.text, length - 1);
    buffer[length - 1] = '\0';
    return buffer;
}
