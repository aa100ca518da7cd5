#include "scsi/io_handler_linux.hpp"

#include <fcntl.h>
#include <sys/ioctl.h>
#include <sys/timeb.h>

#include <algorithm>
#include <cerrno>

#include "foundation/clib_file.hpp"
#include "foundation/clib_stream.hpp"
#include "foundation/log.hpp"
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
    static const MissingField kCmdp = {"No cmdp in IoObject\n", "No cmdp in IoObject\n"};
    static const MissingField kSbp = {"No sbp in IoObject\n", "No sbp in IoObject\n"};
    static const MissingField kSbLen = {"No sb len In IoObject\n", "No sb len In IoObject\n"};
    static const MissingField kDxferp = {"No dxferp In IoObject\n", "No dxferp In IoObject\n"};
    static const MissingField kDxferLen = {"No dxfer len in IoObject\n", "No dxfer len In IoObject\n"};
    static const MissingField kDirection = {"No dxfer direction in IoObject\n",
                                            "No dxfer direction  In IoObject\n"};
    if (header.cmdp == nullptr) {
        return &kCmdp;
    }
    if (header.sbp == nullptr) {
        return &kSbp;
    }
    if (header.sb_len_wr == 0) { // not mx_sb_len: the context presets both
        return &kSbLen;
    }
    if (header.dxferp == nullptr) {
        return &kDxferp;
    }
    if (header.dxfer_len == 0) {
        return &kDxferLen;
    }
    return header.dxfer_direction == 0 ? &kDirection : nullptr;
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

// Leaves doScsiIo, whose last line stands behind its exit.
template <typename Exception>
[[noreturn]] void failAfterExit(const FunctionTrace& trace, DoScsiIoExit exit, const char* text) {
    trace.exit(exit);
    trace.log(text);
    throw Exception(text);
}

} // namespace

void ZebScsiIoHandlerLinux::open(const ZebString& path, int32& fdOut) {
    const FunctionTrace trace("open");
    flushLog();
    fdOut = Clib_open(path.c_str(), O_RDONLY | O_NONBLOCK | O_CLOEXEC, 0);
    trace.exit();
}

void ZebScsiIoHandlerLinux::close(int32 fd) {
    const FunctionTrace trace("close");
    flushLog();
    Clib_close(fd);
    trace.exit();
}

void ZebScsiIoHandlerLinux::doScsiIo(int32 fd, uint32 timeout_ms,
                                     const ZebCountedPointer<ZebScsiIoContext>& context) {
    const FunctionTrace trace("doScsiIo");
    if (!(context->ioObject() != nullptr)) {
        trace.exit();
        logPrintf("No IoObject\n");
        throw NotSupportedEx("No IoObject\n");
    }
    ZebCountedPointer<IoObject> ioObject(context->ioObject());
    sg_io_hdr& header = ioObject->header;
    if (const MissingField* const missing = missingField(header)) {
        trace.exit();
        logPrintf("%s", missing->printed);
        throw NotSupportedEx(missing->thrown);
    }
    header.timeout = timeout_ms;
    flushLog(); // before the clock starts: a slow disk under the log is not the device's fault

    const timeb start = wallClock();
    const int result = ioctl(fd, SG_IO, ioObject.get());
    const int error = errno;
    const timeb end = wallClock();
    if (result < 0) {
        ioObject->ioctlState = kIoctlFailed;
        trace.exit(kExitIoctlFailed);
        char text[64] = {};
        Clib_snprintf(text, sizeof text, "ioctl failed, error code = %d\n", error);
        logPrintf("%s\n", text);
        throw ScsiIoctlEx(text);
    }
    ioObject->ioctlState = kIoctlSucceeded;
    if (elapsedMilliseconds(start, end) > static_cast<int32>(timeout_ms)) {
        failAfterExit<TimeOutEx>(trace, kExitTookTooLong, "Timeout\n");
    }

    const uint32 driver = header.driver_status & 0x0FU;
    if ((header.host_status >= kHostNoConnect && header.host_status <= kHostTimeOut) ||
        driver == kDriverTimeOut) {
        failAfterExit<TimeOutEx>(trace, kExitGivenUp, "Timeout\n");
    }

    // The doubled status byte, so CHECK CONDITION (02h) alone, without the driver's word for sense data, does
    // not count here: such a command is classified from its context.
    const uint32 status = (header.status * 2U) & 0x7EU;
    if (status != 0x02 && status != 0x22 && driver != kDriverSense) {
        trace.exit(kExitNormal);
        return;
    }
    const uint8* const sense = header.sbp;
    const uint32 senseLength = std::min(header.sb_len_wr, header.mx_sb_len);
    if (!isSensePresent(sense, senseLength)) {
        trace.exit(kExitNormal);
        return;
    }
    if (!isSenseWellFormed(sense)) {
        trace.exit(kExitMalformedSense);
        logPrintf("No sensep or sb_len 0\n");
        return;
    }
    const SenseHeader decoded = decodeSense(sense, senseLength);
    if (decoded.senseKey == kSenseKeyIllegalRequest) {
        if (decoded.asc == 0x20 && decoded.ascq == 0x00) {
            failAfterExit<NotSupportedEx>(trace, kExitInvalidOpcode, "Invalid opcode in CDB\n");
        }
        failAfterExit<NotSupportedEx>(trace, kExitIllegalRequest, "Illegal request in CDB\n");
    }
    trace.exit(kExitNormal);
}
