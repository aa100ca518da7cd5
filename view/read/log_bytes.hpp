#pragma once

#include <array>
#include <cstdint>
#include <istream>
#include <memory>
#include <string>
#include <string_view>

struct archive;

namespace view {

// Thrown for input that unpacks to so much more than itself that it was made to, and is no log.
struct UnpacksTooFar {};

// The bytes of a log, from a stream that holds it as it is, or packed by gzip, bzip2, xz or zstd: its content
// tells which, not a name. Holds a piece at a time.
class LogBytes {
public:
    // The stream must outlive this. Throws std::bad_alloc.
    explicit LogBytes(std::istream& input);

    // The next bytes, valid until the next call; none at the end, which is where a damaged or cut file can no
    // longer be unpacked, too. Throws UnpacksTooFar.
    std::string_view next();

    // Why the end came before that of the packed log; empty when it did not.
    [[nodiscard]] const std::string& damage() const { return mDamage; }

private:
    struct Closer {
        void operator()(archive* unpacker) const;
    };

    std::string_view endWith(int result);

    std::unique_ptr<archive, Closer> mUnpacker;
    std::uint64_t mUnpacked = 0;
    bool mIsOpen = false;
    std::string mDamage;
};

} // namespace view
