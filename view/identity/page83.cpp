#include "view/identity/page83.hpp"

namespace view {

std::string Page83Bytes::text(std::size_t at, std::size_t length) const {
    std::string text;
    for (std::size_t i = at; i < at + length; ++i) {
        text += static_cast<char>((*this)[i]);
    }
    return text;
}

std::string Page83Bytes::hex(std::size_t at, std::size_t length) const {
    constexpr std::string_view kDigits = "0123456789abcdef";
    std::string text;
    for (std::size_t i = at; i < at + length; ++i) {
        text += kDigits[(*this)[i] >> 4U];
        text += kDigits[(*this)[i] & 0xFU];
    }
    return text;
}

Designator Designator::read(const Page83Bytes& page, std::size_t offset) {
    Designator designator;
    designator.at = offset + Page83Bytes::kDesignatorHeader;
    designator.length = page[offset + 3];
    designator.codeSet = page[offset] & 0xFU;
    designator.type = page[offset + 1] & 0xFU;
    designator.association = (page[offset + 1] >> 4U) & 3U;
    designator.naaFormat = page[designator.at] >> 4U;
    return designator;
}

bool isSafe(char c) {
    return (c >= '0' && c <= '9') || (c >= 'A' && c <= 'Z') || (c >= 'a' && c <= 'z') ||
           std::string_view("#+-.:=@_").find(c) != std::string_view::npos;
}

std::string upToNul(std::string text) {
    text.resize(std::min(text.find('\0'), text.size()));
    return text;
}

} // namespace view
