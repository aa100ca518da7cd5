// What every fuzz target shares: the input, and what must be true of it.
#pragma once

#include <cstddef>
#include <cstdio>
#include <cstdlib>
#include <string_view>

#include "foundation/integers.hpp"

// The bytes of one input, taken from the front. Behind the end stand zeros.
class Input {
public:
    Input(const uint8* data, std::size_t size) : mRest(reinterpret_cast<const char*>(data), size) {}

    uint8 byte() { return mRest.empty() ? uint8{0} : static_cast<uint8>(take(1)[0]); }
    uint16 word() { // little-endian
        const uint16 low = byte();
        return static_cast<uint16>(low | byte() << 8);
    }
    // At most `count` bytes.
    std::string_view take(std::size_t count) {
        const std::string_view front = mRest.substr(0, count);
        mRest.remove_prefix(front.size());
        return front;
    }
    std::string_view rest() { return take(mRest.size()); }

private:
    std::string_view mRest;
};

// Ends the fuzzer with the message unless `condition` holds: for what must be true of every input.
inline void require(bool condition, const char* message) {
    if (!condition) {
        static_cast<void>(std::fprintf(stderr, "broken: %s\n", message));
        std::abort();
    }
}
