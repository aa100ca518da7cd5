#include "foundation/clib_memory.hpp"

#include "foundation/exceptions.hpp"

char* Clib_strdup(const char* text) {
    char* const copy = strdup(text);
    if (copy == nullptr) {
        throw NoMemoryEx("No memory available for strdup()\n");
    }
    return copy;
}
