// What devices answer to INQUIRY (SPC, standard INQUIRY data and VPD pages).
#pragma once

#include <initializer_list>
#include <string>

#include "foundation/buffer.hpp"
#include "foundation/counted_pointer.hpp"
#include "tests/support/fake_kernel.hpp"

inline Bytes bytesOf(const std::string& text) {
    return {text.begin(), text.end()};
}

inline Bytes joined(std::initializer_list<Bytes> parts) {
    Bytes all;
    for (const Bytes& part : parts) {
        all.insert(all.end(), part.begin(), part.end());
    }
    return all;
}

inline std::string padded(const std::string& text, std::size_t width) {
    return text + std::string(width - text.size(), ' ');
}

// Standard data whose additional length counts `beyond`, the bytes from 36 on.
inline Bytes standardData(uint8 firstByte, const std::string& vendor, const std::string& product,
                          const std::string& revision, const Bytes& beyond) {
    return joined({{firstByte, 0, 6, 2, static_cast<uint8>(31 + beyond.size()), 0, 0, 0},
                   bytesOf(padded(vendor, 8)),
                   bytesOf(padded(product, 16)),
                   bytesOf(padded(revision, 4)),
                   beyond});
}

inline Bytes vpdPage(uint8 pageCode, const Bytes& content) {
    return joined(
        {{0, pageCode, static_cast<uint8>(content.size() / 256), static_cast<uint8>(content.size())},
         content});
}

constexpr uint8 kBinaryCodeSet = 1;
constexpr uint8 kAsciiCodeSet = 2;
constexpr uint8 kUtf8CodeSet = 3;

// A designation descriptor of page 83h.
inline Bytes designator(uint8 codeSet, uint8 association, uint8 type, const Bytes& identifier) {
    return joined(
        {{codeSet, static_cast<uint8>(association * 16 + type), 0, static_cast<uint8>(identifier.size())},
         identifier});
}

// A buffer of `length` bytes that starts with `bytes`.
inline ZebCountedPointer<ZebBuffer> responseOf(const Bytes& bytes, uint32 length = 256) {
    ZebCountedPointer<ZebBuffer> response;
    response.create(new ZebBuffer(length, 0), ZebPST_Individual, ZebPAT_New);
    response->copy(bytes.data(), static_cast<uint32>(bytes.size()));
    return response;
}
