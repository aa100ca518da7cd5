#include "scsi/io_context_linux.hpp"

#include <algorithm>
#include <memory>
#include <new>

#include "foundation/clib_memory.hpp"
#include "foundation/log.hpp"
#include "foundation/trace.hpp"
#include "scsi/scsi_exceptions.hpp"
#include "scsi/sense.hpp"

namespace {

constexpr uint32 kFirstDataLength = 256;
constexpr uint8 kSenseLength = 32;

// Tells what keeps a command's response from being read, or null. In the order of the checks.
const char* noResponseReason(uint32 ioctlState) {
    switch (ioctlState) {
    case kIoctlNotDone:
        return "Ioctl not done, so no response\n";
    case kIoctlFailed:
        return "Ioctl done, but failed, so no response\n";
    default:
        return nullptr;
    }
}

} // namespace

ZebScsiIoContextLinux::ZebScsiIoContextLinux() {
    _create();
}

void ZebScsiIoContextLinux::_create() {
    const FunctionTrace trace("_create");
    // What is made before an allocation fails goes with these.
    std::unique_ptr<ZebBuffer> data;
    std::unique_ptr<ZebBuffer> sense;
    std::unique_ptr<IoObject> ioObject;
    data.reset(new (std::nothrow) ZebBuffer(kFirstDataLength, 0));
    if (data) {
        sense.reset(new (std::nothrow) ZebBuffer(kSenseLength, 0));
    }
    if (sense) {
        ioObject.reset(new (std::nothrow) IoObject());
    }
    if (!ioObject) {
        trace.fail<NoMemoryEx>("No Memory\n");
    }
    mDataBuffer.create(data.release(), ZebPST_Individual, ZebPAT_New);
    mSenseBuffer.create(sense.release(), ZebPST_Individual, ZebPAT_New);
    mIoObject.create(ioObject.release(), ZebPST_Individual, ZebPAT_New);
    _init();
    trace.exit();
}

void ZebScsiIoContextLinux::_init() {
    const FunctionTrace trace("_init");
    IoObject& ioObject = *mIoObject;
    ioObject = IoObject();
    mDataBuffer->erase();
    mSenseBuffer->erase();
    sg_io_hdr& header = ioObject.header;
    header.interface_id = 'S';
    header.flags = SG_FLAG_LUN_INHIBIT;
    setData(*mDataBuffer, SG_DXFER_FROM_DEV);
    header.sbp = *mSenseBuffer;
    header.mx_sb_len = kSenseLength;
    header.sb_len_wr = kSenseLength; // the driver's to write, but the I/O handler refuses a zero here
    ioObject.ioctlState = kIoctlNotDone;
    mResultCategory = kResultNone;
    trace.exit();
}

void ZebScsiIoContextLinux::setData(ZebBuffer& data, int direction) {
    sg_io_hdr& header = mIoObject->header;
    header.dxfer_direction = direction;
    header.dxferp = static_cast<uint8*>(data);
    header.dxfer_len = data.length();
}

void ZebScsiIoContextLinux::setCdb(const ZebCountedPointer<ZebBuffer>& cdb) {
    mCdb = cdb;
    sg_io_hdr& header = mIoObject->header;
    header.cmdp = *mCdb;
    header.cmd_len = static_cast<uint8>(mCdb->length());
}

void ZebScsiIoContextLinux::addDataInScsiCdb(const ZebCountedPointer<ZebBuffer>& cdb, uint32 allocLength) {
    const FunctionTrace trace("addDataInScsiCdb");
    if (mDataBuffer->length() < allocLength) {
        std::unique_ptr<ZebBuffer> longer(new (std::nothrow) ZebBuffer(allocLength, 0));
        if (!longer) {
            trace.fail<NoMemoryEx>("No Memory");
        }
        ZebCountedPointer<ZebBuffer> dataBuffer;
        dataBuffer.create(longer.release(), ZebPST_Individual, ZebPAT_New);
        mDataBuffer = dataBuffer;
    }
    _init();
    setCdb(cdb);
    setData(*mDataBuffer, SG_DXFER_FROM_DEV);
    trace.exit();
}

void ZebScsiIoContextLinux::addDataOutScsiCdb(const ZebCountedPointer<ZebBuffer>& cdb,
                                              const ZebCountedPointer<ZebBuffer>& data) {
    const FunctionTrace trace("addDataOutScsiCdb");
    _init();
    setCdb(cdb);
    mDataOut = data;
    setData(*mDataOut, SG_DXFER_TO_DEV);
    trace.exit();
}

uint32 ZebScsiIoContextLinux::getScsiStatus(uint32& statusOut) {
    constexpr uint32 kCheckCondition = 0x02;
    constexpr uint32 kCommandTerminated = 0x22;
    constexpr uint32 kDriverSense = 0x08;
    const FunctionTrace trace("getScsiStatus");
    const IoObject& ioObject = *mIoObject;
    if (ioObject.ioctlState != kIoctlSucceeded) {
        trace.fail<NotAllowedEx>("IOCTL should be called before processing response\n");
    }
    const uint32 status = ioObject.header.status & 0x7EU;
    const uint32 driver = ioObject.header.driver_status & 0x0FU;
    statusOut = status;
    if (ioObject.header.host_status != 0 || (driver != 0 && driver != kDriverSense)) {
        mResultCategory = kResultTransportError;
    } else if (driver == kDriverSense || status == kCheckCondition || status == kCommandTerminated) {
        mResultCategory = kResultSenseAvailable;
    } else if (status == 0) {
        mResultCategory = kResultGood;
    } else {
        mResultCategory = kResultOtherStatus;
    }
    trace.exit();
    return mResultCategory;
}

void ZebScsiIoContextLinux::getResponseData(ZebCountedPointer<ZebBuffer>& bufferOut) {
    const FunctionTrace trace("getResponseData");
    const char* const reason = noResponseReason(mIoObject->ioctlState);
    if (reason != nullptr) {
        trace.logAndFail<NotAllowedEx>(reason);
    }
    if (mResultCategory != kResultGood) {
        trace.logAndFail<NotSupportedEx>("Ioctl succeeded, but SCSI response returned with failure\n");
    }
    bufferOut = mDataBuffer;
    trace.exit();
}

void ZebScsiIoContextLinux::getSenseData(uint32& codeOut, ZebCountedPointer<ZebBuffer>& bufferOut) {
    // The classes by sense key (20 no sense, 21 recovered, 2 not ready, 3 medium, hardware or blank, 5 or 9
    // illegal request, 6 unit attention, 11 aborted) have always run one into the next down to this one, and
    // readers of the log know no other.
    constexpr uint32 kUnclassifiedSense = 99;
    const FunctionTrace trace("getSenseData");
    const IoObject& ioObject = *mIoObject;
    const char* const reason = noResponseReason(ioObject.ioctlState);
    if (reason != nullptr) {
        trace.logAndFail<NotAllowedEx>(reason);
    }
    if (mResultCategory != kResultSenseAvailable) {
        trace.fail<NotAllowedEx>("Processing result is not sense\n");
    }
    const uint8* const sense = ioObject.header.sbp;
    const uint32 length = std::min(ioObject.header.sb_len_wr, ioObject.header.mx_sb_len);
    ZebCountedPointer<ZebBuffer> view;
    view.create(new (std::nothrow) ZebLocalBuffer(sense, length), ZebPST_Individual, ZebPAT_New);
    bufferOut = view;
    if (isSensePresent(sense, length)) {
        if (!isSenseWellFormed(sense)) {
            logPrintf("sensep NULL or 0 sb_len");
            return;
        }
        codeOut = kUnclassifiedSense;
    }
    trace.exit();
}
