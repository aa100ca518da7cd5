#include "scsi/response_bytes.hpp"

#include <cstdlib>
#include <memory>
#include <string>

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
    constexpr char kDigits[] = "0123456789ABCDEF";
    std::string text;
    text.reserve(2 * static_cast<std::size_t>(count));
    for (uint32 i = 0; i < count; ++i) {
        const uint8 byte = bytes[offset + i];
        text += kDigits[byte >> 4];
        text += kDigits[byte & 0x0F];
    }
    return {text.c_str()};
}
