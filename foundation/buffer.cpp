#include "foundation/buffer.hpp"

#include <cctype>
#include <cstdlib>

#include "foundation/assertion.hpp"
#include "foundation/clib_memory.hpp"
#include "foundation/clib_stream.hpp"
#include "foundation/exceptions.hpp"
#include "foundation/trace.hpp"

// The bodies spell "this->", "__null" and redundant brackets where the text of a failed assertion shows them.
// NOLINTBEGIN(modernize-use-nullptr)

ZebBuffer::ZebBuffer(uint32 acUseLength, uint32 acMaxLength) {
    const FunctionTrace trace("ZebBuffer");
    ASSERT_OR_EXIT((acMaxLength == 0 || acUseLength <= acMaxLength));
    const uint32 lMallocLength = acMaxLength != 0 ? acMaxLength : acUseLength;
    ASSERT_OR_EXIT(lMallocLength != 0);
    mpPointer = static_cast<uint8*>(std::malloc(lMallocLength));
    if (mpPointer == nullptr) {
        throw NoMemoryEx("No Memory\n");
    }
    Clib_memset(mpPointer, 0, lMallocLength);
    ASSERT_OR_EXIT(0 != this->mpPointer);
    mUseLength = acUseLength;
    mMaxLength = lMallocLength;
    mPersistence = ZebBP_NonPersistent;
    ASSERT_OR_EXIT(mUseLength <= mMaxLength);
    mcpPointer = nullptr;
    try {
        trace.exit();
    } catch (...) {
        std::free(mpPointer); // no destructor runs for an object whose constructor throws
        throw;
    }
}

ZebBuffer::ZebBuffer(const uint8* acpPointer, uint32 acLength)
    : mcpPointer(acpPointer), mUseLength(acLength), mMaxLength(acLength), mPersistence(ZebBP_Persistent) {
    const FunctionTrace trace("ZebBuffer");
    trace.exit();
}

ZebBuffer::~ZebBuffer() {
    const FunctionTrace trace(std::nothrow, "~ZebBuffer");
    _destroy();
    trace.exit();
}

void ZebBuffer::_destroy() noexcept {
    const FunctionTrace trace(std::nothrow, "_destroy");
    if (mPersistence == ZebBP_NonPersistent && mpPointer != nullptr) {
        trace.log("Freeing persistent allocated buffer\n");
        std::free(mpPointer);
    } else {
        trace.log("Not freeing non-persistent buffer, nullifying pointer\n");
    }
    mpPointer = nullptr;
    mcpPointer = nullptr;
    mUseLength = 0;
    mMaxLength = 0;
    mPersistence = {};
    trace.exit();
}

uint8 ZebBuffer::byte(uint32 acOffset) const {
    const FunctionTrace trace("byte");
    ASSERT_OR_EXIT(acOffset < this->mUseLength);
    if (mPersistence == ZebBP_NonPersistent) {
        ASSERT_OR_EXIT(this->mpPointer != __null);
        return mpPointer[acOffset];
    }
    ASSERT_OR_EXIT(this->mcpPointer != __null);
    return mcpPointer[acOffset];
}

ZebBuffer::operator const uint8*() const {
    const FunctionTrace trace("operator const uint8*");
    if (mPersistence == ZebBP_NonPersistent) {
        ASSERT_OR_EXIT(this->mpPointer != __null);
        return mpPointer;
    }
    ASSERT_OR_EXIT(this->mcpPointer != __null);
    return mcpPointer;
}

ZebBuffer::operator uint8*() {
    const FunctionTrace trace("operator uint8*");
    ASSERT_OR_EXIT(ZebBP_NonPersistent == this->mPersistence);
    ASSERT_OR_EXIT(__null != this->mpPointer);
    trace.exit();
    return mpPointer;
}

void ZebBuffer::setLength(uint32 acLength) {
    const FunctionTrace trace("setLength");
    ASSERT_OR_EXIT(ZebBP_NonPersistent == this->mPersistence);
    ASSERT_OR_EXIT(acLength <= this->mMaxLength);
    ASSERT_OR_EXIT(__null != this->mpPointer);
    mUseLength = acLength;
    Clib_memset(mpPointer, 0, mMaxLength);
    trace.exit();
}

void ZebBuffer::copy(const uint8* acpSource, uint32 acLength) {
    const FunctionTrace trace("copy");
    ASSERT_OR_EXIT(acLength != 0 && acLength <= this->mUseLength);
    ASSERT_OR_EXIT(__null != this->mpPointer);
    Clib_memcpy(mpPointer, acpSource, acLength);
    trace.exit();
}

void ZebBuffer::append(const uint8* acpSource, uint32 acBytes) {
    const FunctionTrace trace("append");
    const uint64 acLength = acBytes; // a sum that cannot wrap
    ASSERT_OR_EXIT(acLength != 0 && (acLength + this->mUseLength) < this->mMaxLength);
    ASSERT_OR_EXIT(__null != this->mpPointer);
    Clib_memcpy(mpPointer + mUseLength, acpSource, acBytes);
    mUseLength += acBytes;
    trace.exit();
}

void ZebBuffer::erase() {
    const FunctionTrace trace("erase");
    ASSERT_OR_EXIT(ZebBP_NonPersistent == this->mPersistence);
    ASSERT_OR_EXIT(__null != this->mpPointer);
    Clib_memset(mpPointer, 0, mMaxLength);
    trace.exit();
}

void ZebBuffer::writeAscii(char* acpOutput) const {
    constexpr uint32 kColumns = 16;
    const FunctionTrace trace("writeAscii");
    const uint32 used = length();
    const uint8* const lcpData = mPersistence == ZebBP_NonPersistent ? mpPointer : mcpPointer;
    const uint32 rows = used / kColumns + (used % kColumns != 0 ? 1 : 0);
    for (uint32 row = 0; row < rows; ++row) {
        char hex[3 * kColumns + 1] = {};
        char ascii[kColumns + 1] = {};
        for (uint32 column = 0; column < kColumns && row * kColumns + column < used; ++column) {
            const uint8 byte = lcpData[row * kColumns + column];
            Clib_sprintf(hex + 3 * static_cast<std::size_t>(column), byte > 15 ? "%X " : "0%X ", byte);
            ascii[column] = std::isprint(byte) != 0 ? static_cast<char>(byte) : '.';
        }
        Clib_sprintf(acpOutput + Clib_strlen(acpOutput), "%8u: %s %s\n", row * kColumns, hex, ascii);
    }
    trace.exit();
}

// NOLINTEND(modernize-use-nullptr)
