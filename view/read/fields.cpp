#include "view/read/fields.hpp"

#include <cmath>
#include <cstdlib>
#include <limits>
#include <string>

namespace view {

unsigned hexToNumber(std::string_view digits) {
    unsigned number = 0;
    std::from_chars(digits.data(), digits.data() + digits.size(), number, 16);
    return number;
}

std::string text(std::string_view field) {
    return std::string(field);
}

std::string withoutLineEnd(std::string_view message) {
    while (message.ends_with('\n')) {
        message.remove_suffix(1);
    }
    return std::string(message);
}

std::string join(const std::vector<std::string>& parts, std::string_view between) {
    std::string joined;
    for (const std::string& part : parts) {
        joined += joined.empty() ? part : std::string(between) + part;
    }
    return joined;
}

double toMilliseconds(std::string_view digits) {
    const double number = std::strtod(std::string(digits).c_str(), nullptr);
    return std::isfinite(number) ? number : std::numeric_limits<double>::max();
}

} // namespace view
