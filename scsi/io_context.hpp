// One SCSI command on its way through the Linux sg driver, as the I/O handler sees it.
#pragma once

#include <scsi/sg.h>

#include "foundation/buffer.hpp"
#include "foundation/counted_pointer.hpp"
#include "foundation/integers.hpp"

// How far a command got.
enum IoctlState : uint32 {
    kIoctlNotDone = 0,
    kIoctlSucceeded = 1, // the driver took the command; its outcome stands in the header
    kIoctlFailed = 2
};

// The driver's request and reply, and how far it got.
struct IoObject {
    sg_io_hdr header;
    uint32 reserved; // always zero
    uint32 ioctlState;
};

// How a command ended, seen through all of its statuses.
enum ScsiResultCategory : uint32 {
    kResultNone = 0, // not classified yet
    kResultGood = 1,
    kResultOtherStatus = 2,    // a SCSI status that comes without sense data
    kResultSenseAvailable = 3, // CHECK CONDITION or COMMAND TERMINATED
    kResultTransportError = 4  // the command did not come through
};

class ZebScsiIoContext {
public:
    ZebScsiIoContext() = default;
    ZebScsiIoContext(const ZebScsiIoContext&) = delete;
    ZebScsiIoContext& operator=(const ZebScsiIoContext&) = delete;
    virtual ~ZebScsiIoContext() = default;

    // Prepare a command: the CDB in `cdb`, and room for at least `allocLength` bytes of response, or the
    // bytes of `data` to send. Either resets what an earlier command left, its response included. Throw
    // NoMemoryEx.
    virtual void addDataInScsiCdb(const ZebCountedPointer<ZebBuffer>& cdb, uint32 allocLength) = 0;
    virtual void addDataOutScsiCdb(const ZebCountedPointer<ZebBuffer>& cdb,
                                   const ZebCountedPointer<ZebBuffer>& data) = 0;

    // Shares the whole response buffer of a command that ended well; the next command erases it.
    // Throws NotAllowedEx, NotSupportedEx.
    virtual void getResponseData(ZebCountedPointer<ZebBuffer>& bufferOut) = 0;
    // Hands out a view of the sense bytes, valid as long as the context, and their code. Throws NotAllowedEx.
    virtual void getSenseData(uint32& codeOut, ZebCountedPointer<ZebBuffer>& bufferOut) = 0;
    // Classifies the outcome, and tells the SCSI status byte without its reserved bits. Throws NotAllowedEx.
    virtual uint32 getScsiStatus(uint32& statusOut) = 0;

    // The driver's record, empty in a context that was never set up.
    const ZebCountedPointer<IoObject>& ioObject() const { return mIoObject; }

protected:
    ZebCountedPointer<IoObject> mIoObject;
};
