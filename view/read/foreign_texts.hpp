#pragma once

#include <cstddef>
#include <set>
#include <string>
#include <string_view>

#include "view/read/text_matcher.hpp"

namespace view {

// The texts of devices in a log that hold line ends. The log shows them as they are, so what stands behind
// their line ends may look like texts of the log's own; but it dumps the same bytes first, which tells where
// such a text ends.
class ForeignTexts {
public:
    // Said of bytes that end inside a foreign text.
    static constexpr std::size_t kUnending = std::string_view::npos;

    // Takes a text of the log. Learns a designator from its dump.
    void take(const TextMatch& match);

    // The length of the longest foreign text that begins `bytes`, without the blanks at its end; 0 when there
    // is none, kUnending when `bytes` may be the beginning of one.
    [[nodiscard]] std::size_t lengthAt(std::string_view bytes) const;

private:
    std::string mDump; // the bytes of the last dump, as far as a designator may reach
    std::set<std::string, std::less<>> mTexts;
};

} // namespace view
