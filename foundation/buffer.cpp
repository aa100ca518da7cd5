#include "foundation/buffer.hpp"

#include <cctype>
#include <cstdlib>

#include "foundation/clib_memory.hpp"
#include "foundation/clib_stream.hpp"
#include "foundation/exceptions.hpp"
#include "foundation/trace.hpp"

// The bodies spell "this->", "__null" and redundant brackets where the text of a failed assertion shows them.
// NOLINTBEGIN(modernize-use-nullptr)

ZebBuffer::ZebBuffer(uint32 acUseLength, uint32 acMaxLength) {
    TRACE_ENTRY("ZebBuffer");
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
        TRACE_EXIT("ZebBuffer");
    } catch (...) {
        std::free(mpPointer); // no destructor runs for an object whose constructor throws
        throw;
    }
}

ZebBuffer::ZebBuffer(const uint8* acpPointer, uint32 acLength)
    : mcpPointer(acpPointer), mUseLength(acLength), mMaxLength(acLength), mPersistence(ZebBP_Persistent) {
    TRACE_ENTRY("ZebBuffer");
    TRACE_EXIT("ZebBuffer");
}

ZebBuffer::~ZebBuffer() {
    traceEntryNoThrow("~ZebBuffer");
    _destroy();
    traceExitNoThrow("~ZebBuffer");
}

void ZebBuffer::_destroy() noexcept {
    traceEntryNoThrow("_destroy");
    if (mPersistence == ZebBP_NonPersistent && mpPointer != nullptr) {
        logPrintfNoThrow("Freeing persistent allocated buffer\n");
        std::free(mpPointer);
    } else {
        logPrintfNoThrow("Not freeing non-persistent buffer, nullifying pointer\n");
    }
    mpPointer = nullptr;
    mcpPointer = nullptr;
    mUseLength = 0;
    mMaxLength = 0;
    mPersistence = {};
    traceExitNoThrow("_destroy");
}

uint8 ZebBuffer::byte(uint32 acOffset) const {
    TRACE_ENTRY("byte");
    ASSERT_OR_EXIT(acOffset < this->mUseLength);
    if (mPersistence == ZebBP_NonPersistent) {
        ASSERT_OR_EXIT(this->mpPointer != __null);
        return mpPointer[acOffset];
    }
    ASSERT_OR_EXIT(this->mcpPointer != __null);
    return mcpPointer[acOffset];
}

ZebBuffer::operator const uint8*() const {
    TRACE_ENTRY("operator const uint8*");
    if (mPersistence == ZebBP_NonPersistent) {
        ASSERT_OR_EXIT(this->mpPointer != __null);
        return mpPointer;
    }
    ASSERT_OR_EXIT(this->mcpPointer != __null);
    return mcpPointer;
}

ZebBuffer::operator uint8*() {
    TRACE_ENTRY("operator uint8*");
    ASSERT_OR_EXIT(ZebBP_NonPersistent == this->mPersistence);
    ASSERT_OR_EXIT(__null != this->mpPointer);
    TRACE_EXIT("operator uint8*");
    return mpPointer;
}

void ZebBuffer::setLength(uint32 acLength) {
    TRACE_ENTRY("setLength");
    ASSERT_OR_EXIT(ZebBP_NonPersistent == this->mPersistence);
    ASSERT_OR_EXIT(acLength <= this->mMaxLength);
    ASSERT_OR_EXIT(__null != this->mpPointer);
    mUseLength = acLength;
    Clib_memset(mpPointer, 0, mMaxLength);
    TRACE_EXIT("setLength");
}

void ZebBuffer::copy(const uint8* acpSource, uint32 acLength) {
    TRACE_ENTRY("copy");
    ASSERT_OR_EXIT(acLength != 0 && acLength <= this->mUseLength);
    ASSERT_OR_EXIT(__null != this->mpPointer);
    Clib_memcpy(mpPointer, acpSource, acLength);
    TRACE_EXIT("copy");
}

void ZebBuffer::append(const uint8* acpSource, uint32 acBytes) {
    TRACE_ENTRY("append");
    const uint64 acLength = acBytes; // a sum that cannot wrap
    ASSERT_OR_EXIT(acLength != 0 && (acLength + this->mUseLength) < this->mMaxLength);
    ASSERT_OR_EXIT(__null != this->mpPointer);
    Clib_memcpy(mpPointer + mUseLength, acpSource, acBytes);
    mUseLength += acBytes;
    TRACE_EXIT("append");
}

void ZebBuffer::erase() {
    TRACE_ENTRY("erase");
    ASSERT_OR_EXIT(ZebBP_NonPersistent == this->mPersistence);
    ASSERT_OR_EXIT(__null != this->mpPointer);
    Clib_memset(mpPointer, 0, mMaxLength);
    TRACE_EXIT("erase");
}

void ZebBuffer::writeAscii(char* acpOutput) const {
    constexpr uint32 kColumns = 16;
    TRACE_ENTRY("writeAscii");
    const uint32 lLength = length();
    const uint8* const lcpData = mPersistence == ZebBP_NonPersistent ? mpPointer : mcpPointer;
    const uint32 lRows = lLength / kColumns + (lLength % kColumns != 0 ? 1 : 0);
    for (uint32 row = 0; row < lRows; ++row) {
        char lHex[3 * kColumns + 1] = {};
        char lAscii[kColumns + 1] = {};
        for (uint32 column = 0; column < kColumns && row * kColumns + column < lLength; ++column) {
            const uint8 lByte = lcpData[row * kColumns + column];
            Clib_sprintf(lHex + 3 * static_cast<std::size_t>(column), lByte > 15 ? "%X " : "0%X ", lByte);
            lAscii[column] = std::isprint(lByte) != 0 ? static_cast<char>(lByte) : '.';
        }
        Clib_sprintf(acpOutput + Clib_strlen(acpOutput), "%8u: %s %s\n", row * kColumns, lHex, lAscii);
    }
    TRACE_EXIT("writeAscii");
}

// NOLINTEND(modernize-use-nullptr)
