#pragma once

#include <charconv>
#include <limits>
#include <string>
#include <string_view>
#include <system_error>
#include <vector>

namespace view {

// The number that a field's digits stand for; the greatest when it is too great, 0 when there are none.
template <typename Number>
Number toNumber(std::string_view digits) {
    Number number = 0;
    const auto [end, error] = std::from_chars(digits.data(), digits.data() + digits.size(), number);
    return error == std::errc::result_out_of_range ? std::numeric_limits<Number>::max() : number;
}

// The number of a text such as "1.50", the largest one for what is too large. Not with from_chars, which
// older C++ libraries have for whole numbers only; the program sets no locale.
double toMilliseconds(std::string_view digits);

// The number that a field's hexadecimal digits stand for; 0 when it is too great.
unsigned hexToNumber(std::string_view digits);

// A field's bytes, as their owner.
std::string text(std::string_view field);

// An exception's message, which may end with line ends, without them.
std::string withoutLineEnd(std::string_view message);

// Joins parts with `between` between them.
std::string join(const std::vector<std::string>& parts, std::string_view between);

} // namespace view
