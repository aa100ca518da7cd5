#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <span>
#include <string>
#include <string_view>

namespace view {

// The bytes of a VPD page 83h (SPC, device identification), to be read as programs do that keep it in a
// larger buffer of zeros: behind its end there are only zeros.
class Page83Bytes {
public:
    static constexpr std::size_t kHeader = 4;           // of the page
    static constexpr std::size_t kDesignatorHeader = 4; // code set; association and type; reserved; length

    // `bytes` outlive this.
    explicit Page83Bytes(std::span<const std::uint8_t> bytes) : mBytes(bytes) {}

    [[nodiscard]] std::size_t size() const { return mBytes.size(); }
    [[nodiscard]] unsigned operator[](std::size_t at) const { return at < mBytes.size() ? mBytes[at] : 0U; }

    // Whether it is a page 83h at all: most programs look at the page code, and refuse what says another.
    [[nodiscard]] bool isPage83() const { return (*this)[1] == 0x83; }

    // Whether it has the format of before SPC-3, as devices of one vendor have it: the bare identifier
    // instead of designators. In a designator's header the byte is reserved.
    [[nodiscard]] bool isBareIdentifier() const { return (*this)[kHeader + 2] != 0; }

    // Where the list of designators ends, as the header says.
    [[nodiscard]] std::size_t listEnd() const { return kHeader + ((*this)[2] << 8U) + (*this)[3]; }

    // The page as a program has it that keeps at most `most` bytes.
    [[nodiscard]] Page83Bytes first(std::size_t most) const {
        return Page83Bytes(mBytes.first(std::min(mBytes.size(), most)));
    }

    // `length` bytes from `at` on, zeros included.
    [[nodiscard]] std::string text(std::size_t at, std::size_t length) const;

    // The same in lower-case hexadecimal.
    [[nodiscard]] std::string hex(std::size_t at, std::size_t length) const;

private:
    std::span<const std::uint8_t> mBytes;
};

// A designator in a page.
struct Designator {
    enum CodeSet : unsigned char { kBinary = 1, kAscii = 2, kUtf8 = 3 };
    enum Type : unsigned char { kVendorSpecific = 0, kT10 = 1, kEui64 = 2, kNaa = 3, kScsiName = 8 };

    std::size_t at = 0;     // its first byte, behind its header
    std::size_t length = 0; // as its header says
    unsigned codeSet = 0;
    unsigned type = 0;
    unsigned association = 0; // 0: the logical unit
    unsigned naaFormat = 0;   // of type kNaa: the first four bits (6: IEEE registered extended)

    // The one whose header stands at `offset` of `page`.
    static Designator read(const Page83Bytes& page, std::size_t offset);

    // Behind its last byte.
    [[nodiscard]] std::size_t end() const { return at + length; }
};

// Whether udev and sg3-utils leave an ASCII character in a name as it is.
bool isSafe(char c);

// A text up to its first NUL, which ends it for a program in C.
std::string upToNul(std::string text);

} // namespace view
