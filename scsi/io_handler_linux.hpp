// SCSI I/O through the SG_IO ioctl of Linux.
#pragma once

#include "scsi/io_handler.hpp"

class ZebScsiIoHandlerLinux : public ZebScsiIoHandler {
public:
    // Opens read-only and non-blocking: enough for INQUIRY, and it does not wait for a medium.
    void open(const ZebString& path, int32& fdOut) override;
    void close(int32 fd) override;
    void doScsiIo(int32 fd, uint32 timeout_ms, const ZebCountedPointer<ZebScsiIoContext>& context) override;
};
