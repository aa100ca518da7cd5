#include "fc/wwn.hpp"

#include "foundation/clib_memory.hpp"
#include "foundation/clib_stream.hpp"
#include "foundation/integers.hpp"

WwnText::WwnText(const HBA_WWN& wwn) {
    char* position = text;
    for (const uint8 byte : wwn.wwn) {
        if (position != text) {
            *position++ = ':';
        }
        Clib_snprintf(position, 3, byte < 16 ? "0%x" : "%x", byte);
        position += 2;
    }
}

bool isSameWwn(const HBA_WWN& a, const HBA_WWN& b) {
    return std::memcmp(a.wwn, b.wwn, sizeof a.wwn) == 0;
}
