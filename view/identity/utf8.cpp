#include "view/identity/utf8.hpp"

namespace view {

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

} // namespace view
