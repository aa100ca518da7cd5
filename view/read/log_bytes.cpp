#include "view/read/log_bytes.hpp"

#include <archive.h>

#include <new>
#include <vector>

namespace view {

namespace {

// Where the packed bytes come from. Its buffer is libarchive's between two calls.
struct Source {
    explicit Source(std::istream& stream) : input(stream), buffer(256UL * 1024) {}

    std::istream& input;
    std::vector<char> buffer;
};

la_ssize_t readSource(archive* /*unpacker*/, void* data, const void** bytes) {
    auto& source = *static_cast<Source*>(data);
    source.input.read(source.buffer.data(), static_cast<std::streamsize>(source.buffer.size()));
    *bytes = source.buffer.data();
    return static_cast<la_ssize_t>(source.input.gcount());
}

int closeSource(archive* /*unpacker*/, void* data) {
    delete static_cast<Source*>(data);
    return ARCHIVE_OK;
}

// Logs of ten thousand LUNs that are alike but for their numbers pack to 1/93 (gzip) to 1/340 (xz).
constexpr std::uint64_t kFurthest = 2000;
constexpr std::uint64_t kAlwaysFine = 1U << 26U; // bytes: read in seconds, whatever they were packed into

} // namespace

void LogBytes::Closer::operator()(archive* unpacker) const {
    archive_read_free(unpacker);
}

LogBytes::LogBytes(std::istream& input) : mUnpacker(archive_read_new()) {
    if (mUnpacker == nullptr) {
        throw std::bad_alloc();
    }
    archive* const unpacker = mUnpacker.get();
    archive_read_support_filter_gzip(unpacker);
    archive_read_support_filter_bzip2(unpacker);
    archive_read_support_filter_xz(unpacker);
    archive_read_support_filter_zstd(unpacker);
    archive_read_support_format_empty(unpacker);
    archive_read_support_format_raw(unpacker); // a stream of bytes, not a folder of files
    mIsOpen = archive_read_open(unpacker, new Source(input), nullptr, readSource, closeSource) == ARCHIVE_OK;
    archive_entry* entry = nullptr;
    const int result = mIsOpen ? archive_read_next_header(unpacker, &entry) : ARCHIVE_FATAL;
    if (result != ARCHIVE_OK) {
        endWith(result);
    }
}

std::string_view LogBytes::next() {
    const void* bytes = nullptr;
    std::size_t size = 0;
    la_int64_t offset = 0;
    while (mIsOpen && size == 0) {
        const int result = archive_read_data_block(mUnpacker.get(), &bytes, &size, &offset);
        if (result != ARCHIVE_OK) {
            return endWith(result);
        }
    }
    mUnpacked += size;
    if (mUnpacked > kAlwaysFine &&
        mUnpacked / kFurthest > static_cast<std::uint64_t>(archive_filter_bytes(mUnpacker.get(), -1))) {
        throw UnpacksTooFar();
    }
    return {static_cast<const char*>(bytes), size};
}

std::string_view LogBytes::endWith(int result) {
    mIsOpen = false;
    if (result != ARCHIVE_EOF) {
        const char* const reason = archive_error_string(mUnpacker.get());
        mDamage = reason != nullptr ? reason : "it cannot be unpacked";
    }
    return {};
}

} // namespace view
