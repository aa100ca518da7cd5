// The byte buffer of SCSI commands, responses and sense data: it owns a zero-filled block, or wraps memory
// that is somebody else's. Every operation but length() is traced, and every broken precondition is fatal.
#pragma once

#include "foundation/integers.hpp"

// Whose memory a buffer speaks of. The names say the opposite of what one expects; the log's texts do too.
enum ZebBufferPersistence : uint32 {
    ZebBP_Persistent = 1,   // the caller's: only read, never freed
    ZebBP_NonPersistent = 2 // the buffer's own block, freed with it
};

// What can wait in a queue.
class ZebQueueable {
public:
    ZebQueueable() = default;
    ZebQueueable(const ZebQueueable&) = delete;
    ZebQueueable& operator=(const ZebQueueable&) = delete;
    virtual ~ZebQueueable() = default;
};

class ZebBuffer : public ZebQueueable {
public:
    // Owns a new zero-filled block of `acMaxLength` bytes (of `acUseLength` when that is 0), of which
    // `acUseLength` are in use. Throws NoMemoryEx "No Memory\n".
    ZebBuffer(uint32 acUseLength, uint32 acMaxLength);

    // Wraps `acLength` bytes of the caller's, which must outlive the buffer.
    ZebBuffer(const uint8* acpPointer, uint32 acLength);

    ZebBuffer(const ZebBuffer&) = delete;
    ZebBuffer& operator=(const ZebBuffer&) = delete;
    ~ZebBuffer() override;

    // The byte in use at `acOffset`.
    virtual uint8 byte(uint32 acOffset) const;
    // The first byte; owned as the block is. The trace shows the two conversions as operators.
    virtual operator const uint8*() const; // NOLINT(google-explicit-constructor)
    // The number of bytes in use.
    virtual uint32 length() const { return mUseLength; }
    // The first byte of an owned block, to write to.
    virtual operator uint8*(); // NOLINT(google-explicit-constructor)
    // Puts `acLength` bytes of an owned block in use and fills the whole block with zeros: the content is
    // gone.
    virtual void setLength(uint32 acLength);

    // Copies bytes to the start of an owned block, within the bytes in use.
    void copy(const uint8* acpSource, uint32 acLength);
    // Copies bytes behind those in use, which grow by them. The block may not become quite full.
    void append(const uint8* acpSource, uint32 acBytes);
    // Fills an owned block with zeros.
    void erase();

    // Appends a dump of the bytes in use to the NUL-terminated text at `acpOutput`: 16 bytes a line, as
    // offset, hex and ASCII, 76 characters at most with the line feed. The caller has room for every line and
    // a NUL. Throws WriteFailedEx "String Write failed\n".
    void writeAscii(char* acpOutput) const;

    // Frees an owned block or lets go of the wrapped memory, and leaves the buffer empty: every access is
    // fatal from then on. The destructor's work.
    void _destroy() noexcept; // NOLINT(bugprone-reserved-identifier): the name that the trace shows

private:
    uint8* mpPointer = nullptr;
    const uint8* mcpPointer = nullptr;
    uint32 mUseLength = 0;
    uint32 mMaxLength = 0;
    ZebBufferPersistence mPersistence{};
};

// A buffer that wraps from the start.
class ZebLocalBuffer : public ZebBuffer {
public:
    ZebLocalBuffer(const uint8* acpPointer, uint32 acLength) : ZebBuffer(acpPointer, acLength) {}
};
