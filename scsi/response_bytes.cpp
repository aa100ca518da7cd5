#include "scsi/response_bytes.hpp"

#include <cstdlib>
#include <memory>
#include <string>

#include "foundation/clib_stream.hpp"
#include "foundation/exceptions.hpp"

ZebString asciiText(const ResponseBytes& bytes, uint32 offset, uint32 count) {
    const std::unique_ptr<char, decltype(&std::free)> lText(static_cast<char*>(std::calloc(count + 1, 1)),
                                                            &std::free);
    if (!lText) {
        throw NoMemoryEx("No Memory\n");
    }
    for (uint32 i = 0; i < count; ++i) {
        lText.get()[i] = static_cast<char>(bytes[offset + i]);
    }
    return {lText.get()};
}

ZebString hexText(const ResponseBytes& bytes, uint32 offset, uint32 count) {
    std::string lText;
    for (uint32 i = 0; i < count; ++i) {
        char lDigits[3] = {};
        const uint8 lByte = bytes[offset + i];
        Clib_snprintf(lDigits, sizeof lDigits, lByte > 15 ? "%X" : "0%X", lByte);
        lText += lDigits;
    }
    return {lText.c_str()};
}
