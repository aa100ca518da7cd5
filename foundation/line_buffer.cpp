#include "foundation/line_buffer.hpp"

#include <cstdlib>

namespace {

constexpr std::size_t kFirstSize = 1024;

} // namespace

LineBuffer::LineBuffer()
    : mLine(static_cast<char*>(std::malloc(kFirstSize))), mSize(mLine != nullptr ? kFirstSize : 0) {}

LineBuffer::~LineBuffer() {
    std::free(mLine);
}

char* LineBuffer::next(std::FILE* stream) {
    return getline(&mLine, &mSize, stream) >= 0 ? mLine : nullptr;
}
