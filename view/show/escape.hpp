#pragma once

#include <string>
#include <string_view>

namespace view {

// Bytes from a device or a command as text that is safe on a terminal and in JSON: well-formed UTF-8 stays, a
// control character, a character that changes the direction of writing and a byte that is no UTF-8 become
// \xHH byte by byte, and a backslash becomes two.
std::string printable(std::string_view bytes);

} // namespace view
