#pragma once

#include <cstddef>
#include <cstdint>
#include <string_view>

namespace view {

// A character of UTF-8.
struct Character {
    std::uint32_t code = 0;
    std::size_t length = 0; // in bytes; 0 when there is no well-formed UTF-8
};

// The character that begins `bytes`, which are not empty.
Character firstCharacter(std::string_view bytes);

} // namespace view
