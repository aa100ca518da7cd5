#include "view/read/foreign_texts.hpp"

#include <algorithm>

#include "view/read/fields.hpp"

namespace view {

namespace {

// A designation descriptor of page 0x83 (SPC): four bytes, the last of which is the designator's length.
constexpr std::size_t kDescriptorHeader = 4;
constexpr std::size_t kLongestDescriptor = kDescriptorHeader + 255;

// A designator as the log shows it: as a C string, and without the blanks at its end.
std::string_view shownDesignator(std::string_view descriptor) {
    descriptor.remove_prefix(std::min(kDescriptorHeader, descriptor.size()));
    descriptor = descriptor.substr(0, descriptor.find('\0'));
    return descriptor.substr(0, descriptor.find_last_not_of(' ') + 1);
}

} // namespace

void ForeignTexts::take(const TextMatch& match) {
    if (match.text == Text::Dump) {
        mDump.clear();
    } else if (match.text == Text::DumpByte && mDump.size() < kLongestDescriptor) {
        mDump += static_cast<char>(hexToNumber(match.fields[1]));
    } else if (match.text == Text::AsciiDesignator) {
        const std::string_view designator = shownDesignator(mDump);
        if (designator.find('\n') != std::string_view::npos) {
            mTexts.emplace(designator);
        }
    }
}

std::size_t ForeignTexts::lengthAt(std::string_view bytes) const {
    auto next = mTexts.upper_bound(bytes);
    if (next != mTexts.end() && next->starts_with(bytes)) {
        return kUnending;
    }
    // The texts that begin `bytes` stand before it in the order, but not all that do begin it: from each that
    // does not, the search goes on with what it has in common with `bytes`.
    while (next != mTexts.begin()) {
        const std::string& text = *std::prev(next);
        const auto common = std::mismatch(text.begin(), text.end(), bytes.begin(), bytes.end()).first;
        if (common == text.end()) {
            return text.size();
        }
        next = mTexts.upper_bound(bytes.substr(0, static_cast<std::size_t>(common - text.begin())));
    }
    return 0;
}

} // namespace view
