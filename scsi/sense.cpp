#include "scsi/sense.hpp"

#include <algorithm>

bool isSensePresent(const uint8* sense, uint32 length) {
    return sense != nullptr && length >= 3;
}

bool isSenseWellFormed(const uint8* sense) {
    return (sense[0] & 0x70) == 0x70;
}

SenseHeader decodeSense(const uint8* sense, uint32 length) {
    constexpr uint8 kFirstDescriptorFormat = 0x72;
    SenseHeader header;
    if ((sense[0] & 0x7F) < kFirstDescriptorFormat) {
        header.senseKey = sense[2] & 0x0F;
        if (length > 7) {
            length = std::min<uint32>(sense[7] + 8U, length);
        }
        header.asc = length > 12 ? sense[12] : 0;
        header.ascq = length > 13 ? sense[13] : 0;
    } else {
        header.senseKey = length > 1 ? sense[1] & 0x0F : 0;
        header.asc = length > 2 ? sense[2] : 0;
        header.ascq = length > 3 ? sense[3] : 0;
    }
    return header;
}
