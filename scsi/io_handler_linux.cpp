#include "scsi/io_handler_linux.hpp"

#include <fcntl.h>
#include <sys/ioctl.h>
#include <sys/timeb.h>

#include <algorithm>
#include <cerrno>

#include "foundation/clib_file.hpp"
#include "foundation/clib_stream.hpp"
#include "foundation/trace.hpp"
#include "scsi/scsi_exceptions.hpp"
#include "scsi/sense.hpp"

namespace {

// The ways out of doScsiIo. Support knows each by its number in the trace, so the numbers stay what they are
// wherever the statements stand.
enum DoScsiIoExit : unsigned {
    kExitIoctlFailed = 168,
    kExitTookTooLong = 187,
    kExitGivenUp = 201,
    kExitMalformedSense = 220,
    kExitInvalidOpcode = 249,
    kExitIllegalRequest = 253,
    kExitNormal = 261
};

// The host adapter's (DID_) and driver's codes for a command that was given up.
constexpr uint32 kHostNoConnect = 1;
constexpr uint32 kHostTimeOut = 3;
constexpr uint32 kDriverTimeOut = 6;
constexpr uint32 kDriverSense = 8;

struct MissingField {
    const char* printed;
    const char* thrown;
};

// The first field without which a command cannot be sent, or null. Two of the printed texts differ from the
// exception's.
const MissingField* missingField(const sg_io_hdr& header) {
    static const MissingField sCmdp = {"No cmdp in IoObject\n", "No cmdp in IoObject\n"};
    static const MissingField sSbp = {"No sbp in IoObject\n", "No sbp in IoObject\n"};
    static const MissingField sSbLen = {"No sb len In IoObject\n", "No sb len In IoObject\n"};
    static const MissingField sDxferp = {"No dxferp In IoObject\n", "No dxferp In IoObject\n"};
    static const MissingField sDxferLen = {"No dxfer len in IoObject\n", "No dxfer len In IoObject\n"};
    static const MissingField sDirection = {"No dxfer direction in IoObject\n",
                                            "No dxfer direction  In IoObject\n"};
    if (header.cmdp == nullptr) {
        return &sCmdp;
    }
    if (header.sbp == nullptr) {
        return &sSbp;
    }
    if (header.sb_len_wr == 0) { // not mx_sb_len: the context presets both
        return &sSbLen;
    }
    if (header.dxferp == nullptr) {
        return &sDxferp;
    }
    if (header.dxfer_len == 0) {
        return &sDxferLen;
    }
    return header.dxfer_direction == 0 ? &sDirection : nullptr;
}

timeb wallClock() {
    timeb now = {};
#pragma GCC diagnostic push
#pragma GCC diagnostic ignored                                                                               \
    "-Wdeprecated-declarations" // its milliseconds are what elapsed times are made of
    ftime(&now);
#pragma GCC diagnostic pop
    return now;
}

int32 elapsedMilliseconds(const timeb& start, const timeb& end) {
    const int64 seconds = static_cast<int64>(end.time) - start.time;
    return static_cast<int32>(seconds * 1000 + end.millitm - start.millitm);
}

[[noreturn]] void throwTimeOut(DoScsiIoExit exit) {
    TRACE_EXIT("doScsiIo", exit);
    logPrintf("Timeout\n");
    throw TimeOutEx("Timeout\n");
}

[[noreturn]] void throwNotSupported(DoScsiIoExit exit, const char* text) {
    TRACE_EXIT("doScsiIo", exit);
    logPrintf("%s", text);
    throw NotSupportedEx(text);
}

} // namespace

void ZebScsiIoHandlerLinux::open(const ZebString& path, int32& fdOut) {
    TRACE_ENTRY("open");
    fdOut = Clib_open(path.c_str(), O_RDONLY | O_NONBLOCK, 0);
    TRACE_EXIT("open");
}

void ZebScsiIoHandlerLinux::close(int32 fd) {
    TRACE_ENTRY("close");
    Clib_close(fd);
    TRACE_EXIT("close");
}

void ZebScsiIoHandlerLinux::doScsiIo(int32 fd, uint32 timeout_ms,
                                     const ZebCountedPointer<ZebScsiIoContext>& context) {
    TRACE_ENTRY("doScsiIo");
    if (!(context->ioObject() != nullptr)) {
        TRACE_EXIT("doScsiIo");
        logPrintf("No IoObject\n");
        throw NotSupportedEx("No IoObject\n");
    }
    ZebCountedPointer<IoObject> lIoObject(context->ioObject());
    sg_io_hdr& lHeader = lIoObject->header;
    if (const MissingField* const lMissing = missingField(lHeader)) {
        TRACE_EXIT("doScsiIo");
        logPrintf("%s", lMissing->printed);
        throw NotSupportedEx(lMissing->thrown);
    }
    lHeader.timeout = timeout_ms;

    const timeb lStart = wallClock();
    const int lResult = ioctl(fd, SG_IO, lIoObject.get());
    const int lErrno = errno;
    const timeb lEnd = wallClock();
    if (lResult < 0) {
        lIoObject->ioctlState = kIoctlFailed;
        TRACE_EXIT("doScsiIo", kExitIoctlFailed);
        char lText[64] = {};
        Clib_snprintf(lText, sizeof lText, "ioctl failed, error code = %d\n", lErrno);
        logPrintf("%s\n", lText);
        throw ScsiIoctlEx(lText);
    }
    lIoObject->ioctlState = kIoctlSucceeded;
    if (elapsedMilliseconds(lStart, lEnd) > static_cast<int32>(timeout_ms)) {
        throwTimeOut(kExitTookTooLong);
    }

    const uint32 lDriver = lHeader.driver_status & 0x0FU;
    if ((lHeader.host_status >= kHostNoConnect && lHeader.host_status <= kHostTimeOut) ||
        lDriver == kDriverTimeOut) {
        throwTimeOut(kExitGivenUp);
    }

    // The doubled status byte, so CHECK CONDITION (02h) alone, without the driver's word for sense data, does
    // not count here: such a command is classified from its context.
    const uint32 lStatus = (lHeader.status * 2U) & 0x7EU;
    if (lStatus != 0x02 && lStatus != 0x22 && lDriver != kDriverSense) {
        TRACE_EXIT("doScsiIo", kExitNormal);
        return;
    }
    const uint8* const lSense = lHeader.sbp;
    const uint32 lSenseLength = std::min(lHeader.sb_len_wr, lHeader.mx_sb_len);
    if (!isSensePresent(lSense, lSenseLength)) {
        TRACE_EXIT("doScsiIo", kExitNormal);
        return;
    }
    if (!isSenseWellFormed(lSense)) {
        TRACE_EXIT("doScsiIo", kExitMalformedSense);
        logPrintf("No sensep or sb_len 0\n");
        return;
    }
    const SenseHeader lDecoded = decodeSense(lSense, lSenseLength);
    if (lDecoded.senseKey == kSenseKeyIllegalRequest) {
        if (lDecoded.asc == 0x20 && lDecoded.ascq == 0x00) {
            throwNotSupported(kExitInvalidOpcode, "Invalid opcode in CDB\n");
        }
        throwNotSupported(kExitIllegalRequest, "Illegal request in CDB\n");
    }
    TRACE_EXIT("doScsiIo", kExitNormal);
}
