#include "scsi/response_bytes.hpp"

#include <cstdlib>
#include <memory>
#include <string>

#include "foundation/clib_stream.hpp"
#include "foundation/exceptions.hpp"

ZebString asciiText(const ResponseBytes& bytes, uint32 offset, uint32 count) {
    const std::unique_ptr<char, decltype(&std::free)> text(static_cast<char*>(std::calloc(count + 1, 1)),
                                                           &std::free);
    if (!text) {
        throw NoMemoryEx("No Memory\n");
    }
    for (uint32 i = 0; i < count; ++i) {
        text.get()[i] = static_cast<char>(bytes[offset + i]);
    }
    return {text.get()};
}

ZebString hexText(const ResponseBytes& bytes, uint32 offset, uint32 count) {
    std::string text;
    for (uint32 i = 0; i < count; ++i) {
        char digits[3] = {};
        const uint8 byte = bytes[offset + i];
        Clib_snprintf(digits, sizeof digits, byte > 15 ? "%X" : "0%X", byte);
        text += digits;
    }
    return {text.c_str()};
}
