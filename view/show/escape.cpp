#include "view/show/escape.hpp"

#include <cstddef>
#include <cstdint>

namespace view {

namespace {

struct Character {
    std::uint32_t code = 0;
    std::size_t length = 0; // in bytes; 0 when there is no well-formed UTF-8
};

Character firstCharacter(std::string_view bytes) {
    const auto byte = [bytes](std::size_t i) { return static_cast<unsigned char>(bytes[i]); };
    const unsigned lead = byte(0);
    if (lead < 0x80) {
        return {lead, 1};
    }
    std::size_t length = 0;
    std::uint32_t code = 0;
    std::uint32_t smallest = 0;
    if ((lead & 0xe0U) == 0xc0) {
        length = 2;
        code = lead & 0x1fU;
        smallest = 0x80;
    } else if ((lead & 0xf0U) == 0xe0) {
        length = 3;
        code = lead & 0x0fU;
        smallest = 0x800;
    } else if ((lead & 0xf8U) == 0xf0) {
        length = 4;
        code = lead & 0x07U;
        smallest = 0x10000;
    } else {
        return {};
    }
    if (bytes.size() < length) {
        return {};
    }
    for (std::size_t i = 1; i < length; ++i) {
        if ((byte(i) & 0xc0U) != 0x80) {
            return {};
        }
        code = (code << 6U) | (byte(i) & 0x3fU);
    }
    const bool isSurrogate = code >= 0xd800 && code <= 0xdfff;
    return code < smallest || code > 0x10ffff || isSurrogate ? Character{} : Character{code, length};
}

bool isShown(std::uint32_t code) {
    const bool isControl = code < 0x20 || (code >= 0x7f && code < 0xa0);
    const bool turnsWriting = code == 0x61c || code == 0x200e || code == 0x200f ||
                              (code >= 0x2028 && code <= 0x202e) || (code >= 0x2066 && code <= 0x2069) ||
                              code == 0xfeff;
    return !isControl && !turnsWriting;
}

} // namespace

std::string printable(std::string_view bytes) {
    static constexpr std::string_view kDigits = "0123456789ABCDEF";
    std::string shown;
    shown.reserve(bytes.size());
    while (!bytes.empty()) {
        const Character character = firstCharacter(bytes);
        const std::size_t length = character.length == 0 ? 1 : character.length;
        if (character.length == 0 || !isShown(character.code)) {
            for (const char c : bytes.substr(0, length)) {
                const auto byte = static_cast<unsigned char>(c);
                shown += "\\x";
                shown += kDigits[byte >> 4U];
                shown += kDigits[byte & 0x0fU];
            }
        } else if (character.code == '\\') {
            shown += "\\\\";
        } else {
            shown += bytes.substr(0, length);
        }
        bytes.remove_prefix(length);
    }
    return shown;
}

} // namespace view
