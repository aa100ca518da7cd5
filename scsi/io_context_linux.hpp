// The I/O context of the Linux sg driver's version 3 interface.
#pragma once

#include "scsi/io_context.hpp"

class ZebScsiIoContextLinux : public ZebScsiIoContext {
public:
    // Throws NoMemoryEx "No Memory\n".
    ZebScsiIoContextLinux();

    void addDataInScsiCdb(const ZebCountedPointer<ZebBuffer>& cdb, uint32 allocLength) override;
    void addDataOutScsiCdb(const ZebCountedPointer<ZebBuffer>& cdb,
                           const ZebCountedPointer<ZebBuffer>& data) override;
    void getResponseData(ZebCountedPointer<ZebBuffer>& bufferOut) override;
    void getSenseData(uint32& codeOut, ZebCountedPointer<ZebBuffer>& bufferOut) override;
    uint32 getScsiStatus(uint32& statusOut) override;

private:
    void _create(); // NOLINT(bugprone-reserved-identifier): the name that the trace shows
    void _init();   // NOLINT(bugprone-reserved-identifier): the name that the trace shows
    void setCdb(const ZebCountedPointer<ZebBuffer>& cdb);
    void setData(ZebBuffer& data, int direction);

    // Released from the last to the first.
    ZebCountedPointer<ZebBuffer> mDataOut; // the caller's: the driver's record points at its bytes
    ZebCountedPointer<ZebBuffer> mDataBuffer;
    ZebCountedPointer<ZebBuffer> mSenseBuffer;
    ZebCountedPointer<ZebBuffer> mCdb;
    uint32 mResultCategory = kResultNone;
};
