// What the log says about buffers and INQUIRY commands, '#' standing for the numbers of trace lines.
#pragma once

#include <string>

#include "tests/support/fake_kernel.hpp"

inline std::string entered(const std::string& function) {
    return "Entered Function " + function + " Line #\n";
}

inline std::string left(const std::string& function) {
    return "Left Function " + function + " Line #\n";
}

// A function whose body logs `body`.
inline std::string traced(const std::string& function, const std::string& body = "") {
    return entered(function) + body + left(function);
}

inline std::string dumped(const Bytes& bytes) {
    static const char* const kDigits = "0123456789abcdef";
    std::string text = "Going to dump " + std::to_string(bytes.size()) + " bytes\n";
    for (std::size_t i = 0; i < bytes.size(); ++i) {
        text += "Byte " + std::to_string(i) + ": 0x";
        if (bytes[i] > 15) {
            text += kDigits[bytes[i] / 16];
        }
        text += kDigits[bytes[i] % 16];
    }
    return text + "\n";
}

// Buffers.

inline std::string madeBuffer() {
    return traced("ZebBuffer");
}

inline std::string freedBuffer() {
    return traced("~ZebBuffer", traced("_destroy", "Freeing persistent allocated buffer\n"));
}

inline std::string droppedView() {
    return traced("~ZebBuffer",
                  traced("_destroy", "Not freeing non-persistent buffer, nullifying pointer\n"));
}

inline std::string tookReadPointer() {
    return entered("operator const uint8*");
}

inline std::string tookWritePointer() {
    return traced("operator uint8*");
}

// The I/O context.

inline std::string resetContext() {
    return traced("_init", traced("erase") + traced("erase") + tookWritePointer() + tookWritePointer());
}

inline std::string madeContext() {
    return traced("_create", madeBuffer() + madeBuffer() + resetContext());
}

// `replacing` is what the log says when the data buffer has to grow, `letGo` when there was a CDB before.
inline std::string preparedDataIn(const std::string& replacing = "", const std::string& letGo = "") {
    return traced("addDataInScsiCdb",
                  replacing + resetContext() + letGo + tookWritePointer() + tookWritePointer());
}

// A context that goes with its CDB and sense buffers, while the response lives on elsewhere.
inline std::string freedContext() {
    return freedBuffer() + freedBuffer();
}

// The commands.

inline Bytes inquiryCdb(uint8 evpd, uint8 page, uint32 length) {
    return {0x12, evpd, page, static_cast<uint8>(length / 256), static_cast<uint8>(length), 0};
}

inline std::string createdCdb(const Bytes& cdb, const std::string& replacing = "",
                              const std::string& letGo = "") {
    return traced("createInquiryCDB",
                  "Going to create the Inquiry command\nSCSI Inquiry CDB Dump:" + dumped(cdb) + madeBuffer() +
                      traced("copy") + preparedDataIn(replacing, letGo));
}

// `letGo` is what the log says when the receiver of the response held the last share of another.
inline std::string gotResponse(const std::string& letGo = "") {
    return traced("processResponse", traced("getScsiStatus") + "Got a scsi inquiry response\n" +
                                         traced("getResponseData", letGo));
}

// A command that a context sends and a device carries out.
inline std::string carriedOut(const Bytes& cdb, const std::string& letGo = "") {
    return createdCdb(cdb) + traced("doScsiIo") + gotResponse(letGo);
}

// The same, sent a second time with a context whose data buffer is large enough.
inline std::string carriedOutAgain(const Bytes& cdb) {
    return createdCdb(cdb, "", freedBuffer()) + traced("doScsiIo") + gotResponse();
}

inline std::string didStandardInquiry(const std::string& letGo = "") {
    return traced("doStandardInquiry",
                  madeContext() + "lcAllocLength = 36\n" + carriedOut(inquiryCdb(0, 0, 36), letGo)) +
           freedContext();
}
