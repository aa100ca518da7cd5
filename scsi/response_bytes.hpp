// Reading a response without leaving it.
#pragma once

#include "foundation/buffer.hpp"
#include "foundation/integers.hpp"
#include "foundation/zeb_string.hpp"

// The bytes of a response buffer, which stays the owner. A byte behind the buffer's end, one that no device
// can have sent, counts as zero.
class ResponseBytes {
public:
    explicit ResponseBytes(const ZebBuffer& response) : mBytes(response), mLength(response.length()) {}

    uint8 operator[](uint32 offset) const { return offset < mLength ? mBytes[offset] : uint8{0}; }
    const uint8* data() const { return mBytes; }
    uint32 length() const { return mLength; }

private:
    const uint8* mBytes;
    uint32 mLength;
};

// The text of `count` bytes from `offset` on, which ends early at a NUL. Throws NoMemoryEx "No Memory\n".
ZebString asciiText(const ResponseBytes& bytes, uint32 offset, uint32 count);

// `count` bytes from `offset` on as upper-case hex digits, two a byte, nothing between them.
ZebString hexText(const ResponseBytes& bytes, uint32 offset, uint32 count);
