#include "view/show/escape.hpp"

#include <cstddef>
#include <cstdint>

#include "view/identity/utf8.hpp"

namespace view {

namespace {

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
