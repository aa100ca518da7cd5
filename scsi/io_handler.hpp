// The one place where a SCSI command leaves the program, as its users see it.
#pragma once

#include "foundation/counted_pointer.hpp"
#include "foundation/integers.hpp"
#include "foundation/zeb_string.hpp"
#include "scsi/io_context.hpp"

class ZebScsiIoHandler {
public:
    ZebScsiIoHandler() = default;
    ZebScsiIoHandler(const ZebScsiIoHandler&) = delete;
    ZebScsiIoHandler& operator=(const ZebScsiIoHandler&) = delete;
    virtual ~ZebScsiIoHandler() = default;

    // Opens the device node `path` and stores its descriptor, the caller's to close. Throws OpenFailedEx.
    virtual void open(const ZebString& path, int32& fdOut) = 0;
    virtual void close(int32 fd) = 0; // throws CloseFailedEx
    // Sends the command that `context` holds and waits for its end. The outcome is in the context's record.
    // Throws NotSupportedEx (no complete command, or the device refused it as an illegal request),
    // ScsiIoctlEx (the driver refused it), TimeOutEx (it took more than `timeout_ms` milliseconds, or the
    // host or driver gave it up).
    virtual void doScsiIo(int32 fd, uint32 timeout_ms,
                          const ZebCountedPointer<ZebScsiIoContext>& context) = 0;
};
