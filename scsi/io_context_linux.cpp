#include "scsi/io_context_linux.hpp"

#include <algorithm>
#include <memory>
#include <new>

#include "foundation/clib_memory.hpp"
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
    TRACE_ENTRY("_create");
    // What is made before an allocation fails goes with these.
    std::unique_ptr<ZebBuffer> lData;
    std::unique_ptr<ZebBuffer> lSense;
    std::unique_ptr<IoObject> lIoObject;
    lData.reset(new (std::nothrow) ZebBuffer(kFirstDataLength, 0));
    if (lData) {
        lSense.reset(new (std::nothrow) ZebBuffer(kSenseLength, 0));
    }
    if (lSense) {
        lIoObject.reset(new (std::nothrow) IoObject());
    }
    if (!lIoObject) {
        TRACE_EXIT("_create");
        throw NoMemoryEx("No Memory\n");
    }
    mDataBuffer.create(lData.release(), ZebPST_Individual, ZebPAT_New);
    mSenseBuffer.create(lSense.release(), ZebPST_Individual, ZebPAT_New);
    mIoObject.create(lIoObject.release(), ZebPST_Individual, ZebPAT_New);
    _init();
    TRACE_EXIT("_create");
}

void ZebScsiIoContextLinux::_init() {
    TRACE_ENTRY("_init");
    IoObject& lIoObject = *mIoObject;
    lIoObject = IoObject();
    mDataBuffer->erase();
    mSenseBuffer->erase();
    sg_io_hdr& lHeader = lIoObject.header;
    lHeader.interface_id = 'S';
    lHeader.flags = SG_FLAG_LUN_INHIBIT;
    setData(*mDataBuffer, SG_DXFER_FROM_DEV);
    lHeader.sbp = *mSenseBuffer;
    lHeader.mx_sb_len = kSenseLength;
    lHeader.sb_len_wr = kSenseLength; // the driver's to write, but the I/O handler refuses a zero here
    lIoObject.ioctlState = kIoctlNotDone;
    mResultCategory = kResultNone;
    TRACE_EXIT("_init");
}

void ZebScsiIoContextLinux::setData(ZebBuffer& data, int direction) {
    sg_io_hdr& lHeader = mIoObject->header;
    lHeader.dxfer_direction = direction;
    lHeader.dxferp = static_cast<uint8*>(data);
    lHeader.dxfer_len = data.length();
}

void ZebScsiIoContextLinux::setCdb(const ZebCountedPointer<ZebBuffer>& cdb) {
    mCdb = cdb;
    sg_io_hdr& lHeader = mIoObject->header;
    lHeader.cmdp = *mCdb;
    lHeader.cmd_len = static_cast<uint8>(mCdb->length());
}

void ZebScsiIoContextLinux::addDataInScsiCdb(const ZebCountedPointer<ZebBuffer>& cdb, uint32 allocLength) {
    TRACE_ENTRY("addDataInScsiCdb");
    if (mDataBuffer->length() < allocLength) {
        std::unique_ptr<ZebBuffer> lLonger(new (std::nothrow) ZebBuffer(allocLength, 0));
        if (!lLonger) {
            TRACE_EXIT("addDataInScsiCdb");
            throw NoMemoryEx("No Memory");
        }
        ZebCountedPointer<ZebBuffer> lDataBuffer;
        lDataBuffer.create(lLonger.release(), ZebPST_Individual, ZebPAT_New);
        mDataBuffer = lDataBuffer;
    }
    _init();
    setCdb(cdb);
    setData(*mDataBuffer, SG_DXFER_FROM_DEV);
    TRACE_EXIT("addDataInScsiCdb");
}

void ZebScsiIoContextLinux::addDataOutScsiCdb(const ZebCountedPointer<ZebBuffer>& cdb,
                                              const ZebCountedPointer<ZebBuffer>& data) {
    TRACE_ENTRY("addDataOutScsiCdb");
    _init();
    setCdb(cdb);
    ZebCountedPointer<ZebBuffer> lData(data);
    setData(*lData, SG_DXFER_TO_DEV);
    TRACE_EXIT("addDataOutScsiCdb");
}

uint32 ZebScsiIoContextLinux::getScsiStatus(uint32& statusOut) {
    constexpr uint32 kCheckCondition = 0x02;
    constexpr uint32 kCommandTerminated = 0x22;
    constexpr uint32 kDriverSense = 0x08;
    TRACE_ENTRY("getScsiStatus");
    const IoObject& lIoObject = *mIoObject;
    if (lIoObject.ioctlState != kIoctlSucceeded) {
        TRACE_EXIT("getScsiStatus");
        throw NotAllowedEx("IOCTL should be called before processing response\n");
    }
    const uint32 lStatus = lIoObject.header.status & 0x7EU;
    const uint32 lDriver = lIoObject.header.driver_status & 0x0FU;
    statusOut = lStatus;
    if (lIoObject.header.host_status != 0 || (lDriver != 0 && lDriver != kDriverSense)) {
        mResultCategory = kResultTransportError;
    } else if (lDriver == kDriverSense || lStatus == kCheckCondition || lStatus == kCommandTerminated) {
        mResultCategory = kResultSenseAvailable;
    } else if (lStatus == 0) {
        mResultCategory = kResultGood;
    } else {
        mResultCategory = kResultOtherStatus;
    }
    TRACE_EXIT("getScsiStatus");
    return mResultCategory;
}

void ZebScsiIoContextLinux::getResponseData(ZebCountedPointer<ZebBuffer>& bufferOut) {
    TRACE_ENTRY("getResponseData");
    const char* const lReason = noResponseReason(mIoObject->ioctlState);
    if (lReason != nullptr) {
        logPrintf("%s", lReason);
        TRACE_EXIT("getResponseData");
        throw NotAllowedEx(lReason);
    }
    if (mResultCategory != kResultGood) {
        const char* const lText = "Ioctl succeeded, but SCSI response returned with failure\n";
        logPrintf("%s", lText);
        TRACE_EXIT("getResponseData");
        throw NotSupportedEx(lText);
    }
    bufferOut = mDataBuffer;
    TRACE_EXIT("getResponseData");
}

void ZebScsiIoContextLinux::getSenseData(uint32& codeOut, ZebCountedPointer<ZebBuffer>& bufferOut) {
    // The classes by sense key (20 no sense, 21 recovered, 2 not ready, 3 medium, hardware or blank, 5 or 9
    // illegal request, 6 unit attention, 11 aborted) have always run one into the next down to this one, and
    // readers of the log know no other.
    constexpr uint32 kUnclassifiedSense = 99;
    TRACE_ENTRY("getSenseData");
    const IoObject& lIoObject = *mIoObject;
    const char* const lReason = noResponseReason(lIoObject.ioctlState);
    if (lReason != nullptr) {
        logPrintf("%s", lReason);
        TRACE_EXIT("getSenseData");
        throw NotAllowedEx(lReason);
    }
    if (mResultCategory != kResultSenseAvailable) {
        TRACE_EXIT("getSenseData");
        throw NotAllowedEx("Processing result is not sense\n");
    }
    const uint8* const lSense = lIoObject.header.sbp;
    const uint32 lLength = std::min(lIoObject.header.sb_len_wr, lIoObject.header.mx_sb_len);
    ZebCountedPointer<ZebBuffer> lView;
    lView.create(new (std::nothrow) ZebLocalBuffer(lSense, lLength), ZebPST_Individual, ZebPAT_New);
    bufferOut = lView;
    if (isSensePresent(lSense, lLength)) {
        if (!isSenseWellFormed(lSense)) {
            logPrintf("sensep NULL or 0 sb_len");
            return;
        }
        codeOut = kUnclassifiedSense;
    }
    TRACE_EXIT("getSenseData");
}
