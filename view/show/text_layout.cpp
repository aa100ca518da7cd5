#include "view/show/text_layout.hpp"

#include <algorithm>
#include <cstddef>
#include <utility>

namespace view {

namespace {

// A longer cell pushes the rest of its line on instead of every other line's.
constexpr std::size_t kWidestColumn = 64;

// The number of characters in well-formed UTF-8.
std::size_t width(std::string_view text) {
    return static_cast<std::size_t>(std::count_if(
        text.begin(), text.end(), [](char c) { return (static_cast<unsigned char>(c) & 0xc0U) != 0x80; }));
}

} // namespace

Style Style::of(bool colour) {
    if (!colour) {
        return {};
    }
    return {"\033[1m", "\033[1;31m", "\033[32m", "\033[2m", "\033[0m"};
}

void Columns::add(std::vector<std::string> cells) {
    mLines.push_back(std::move(cells));
}

void Columns::write(std::ostream& output, std::string_view indent) const {
    std::vector<std::size_t> widths;
    for (const std::vector<std::string>& cells : mLines) {
        widths.resize(std::max(widths.size(), cells.size()));
        for (std::size_t i = 0; i < cells.size(); ++i) {
            const std::size_t cell = width(cells[i]);
            widths[i] = std::max(widths[i], std::min(cell, kWidestColumn));
        }
    }
    for (const std::vector<std::string>& cells : mLines) {
        std::string line(indent);
        for (std::size_t i = 0; i < cells.size(); ++i) {
            if (widths[i] > 0) {
                const std::size_t cell = width(cells[i]);
                line += cells[i] + std::string(std::max(widths[i], cell) - cell + 2, ' ');
            }
        }
        line.resize(line.find_last_not_of(' ') + 1);
        output << line << '\n';
    }
}

void writeHeading(std::ostream& output, const Style& style, std::string_view heading) {
    output << '\n' << style.heading << heading << style.end << '\n';
}

} // namespace view
