#include "fc/identity/unique_lun_id.hpp"

#include <exception>
#include <new>

#include "foundation/log.hpp"
#include "foundation/trace.hpp"
#include "scsi/io_handler_linux.hpp"
#include "scsi/response_bytes.hpp"
#include "scsi/scsi_exceptions.hpp"

bool gDirectAttachedFlag = false;

namespace {

constexpr uint32 kTimeOutMs = 10000;
constexpr uint32 kDirectAttachedRequest = 2;

// The handler and the inquiry that all calls of a run share, made at the first.
ZebScsiInquiry::Handler& sharedHandler() {
    static ZebScsiInquiry::Handler sHandler = [] {
        ZebScsiInquiry::Handler handler;
        handler.create(new (std::nothrow) ZebScsiIoHandlerLinux, ZebPST_Individual, ZebPAT_New);
        return handler;
    }();
    return sHandler;
}

ZebScsiInquiry& sharedInquiry() {
    static ZebCountedPointer<ZebScsiInquiry> sInquiry = [] {
        ZebCountedPointer<ZebScsiInquiry> inquiry;
        inquiry.create(new (std::nothrow) ZebScsiInquiry, ZebPST_Individual, ZebPAT_New);
        return inquiry;
    }();
    return *sInquiry;
}

// A device node that is open, and closed on every path but one that says otherwise.
class OpenDevice {
public:
    // Becomes the owner of `fd`.
    explicit OpenDevice(int32 fd) : mFd(fd) {}
    OpenDevice(const OpenDevice&) = delete;
    OpenDevice& operator=(const OpenDevice&) = delete;
    ~OpenDevice() { closeQuietly(); }

    int32 fd() const { return mFd; }

    // Throws CloseFailedEx; the node counts as closed then too.
    void close() {
        const int32 fd = mFd;
        leaveOpen();
        sharedHandler()->close(fd);
    }

    // For paths on which an exception travels that says more than a failure to close.
    void closeQuietly() noexcept {
        if (mFd != kClosed) {
            try {
                close();
            } catch (const std::exception&) {
                return;
            }
        }
    }

    void leaveOpen() { mFd = kClosed; }

private:
    static constexpr int32 kClosed = -1;
    int32 mFd;
};

ZebString withoutTrailingBlanks(const ZebString& text) {
    const ZebString::size_type last = text.find_last_not_of(" ");
    return last == ZebString::npos ? ZebString("") : text.substr(0, last + 1);
}

// The node's path: the device name up to its first ';'.
ZebString devicePath(const ZebString& deviceName) {
    const ZebString::size_type semicolon = deviceName.find_first_of(';');
    return semicolon == ZebString::npos ? deviceName : deviceName.substr(0, semicolon);
}

bool contains(const ZebString& text, const char* part) {
    return text.find(part) != ZebString::npos;
}

// The log line for the standard-INQUIRY failure that is being handled, or null for one that has none.
const char* stdInquiryFailureLine() {
    try {
        throw;
    } catch (const TimeOutEx&) {
        return "Time-out in Getting Std Inquiry Data\n";
    } catch (const NotSupportedEx&) {
        return "Std Inquiry Data not supported\n";
    } catch (const ScsiIoctlEx&) {
        return "SCSI Ioctl Failure for Std Inquiry Data\n";
    } catch (const ScsiStatusEx&) {
        return "SCSI Error for Std Inquiry Data\n";
    } catch (const InvalidEx&) {
        return "Unexpected Malformed Std Inquiry Data\n";
    } catch (const NotFoundEx&) {
        return "Problem parsing Std Inquiry Data\n";
    } catch (const ExpiredEx&) {
        return "Device entry in file system is stale.. ignoring it\n";
    } catch (...) {
        return nullptr;
    }
}

// What the designators of a device's page 83h say.
struct Designators {
    ZebString t10{""};
    ZebString eui64{""};
    ZebString scsiName{""};
    ZebString md5{""};
    ZebString firstSeen{""};
    bool isFound = false;            // an identifier is chosen
    bool hasScsiFailure = false;     // the page could not be read at all
    bool isPageNotSupported = false; // the device does not have it
};

void store(ZebString& candidate, const ZebString& text, Designators& designators) {
    candidate = text;
    if (designators.firstSeen.empty()) {
        designators.firstSeen = text;
    }
}

// Walks the page's designators to its first NAA one. Throws NotFoundEx behind the last.
void walkDesignators(const ZebScsiInquiry::Response& page, Designators& designators, ZebString& identifier) {
    // SPC, designation descriptor: designator types, and association 0 for the logical unit itself.
    enum DesignatorType : uint32 { kT10VendorId = 1, kEui64 = 2, kNaa = 3, kMd5 = 7, kScsiName = 8 };
    constexpr uint32 kFirstReservedType = 10;
    constexpr uint32 kLogicalUnit = 0;
    uint32 offset = 0;
    while (!designators.isFound) {
        uint32 type = 0;
        uint32 association = 0;
        ZebString rawText("");
        sharedInquiry().getDiPageIdentifierAscii(page, offset, type, association, rawText);
        if (association != kLogicalUnit || type >= kFirstReservedType) {
            continue;
        }
        const ZebString text = withoutTrailingBlanks(rawText);
        switch (type) {
        case kT10VendorId:
            store(designators.t10, text, designators);
            logPrintf("Found T10 Id: %s \n", text.c_str());
            break;
        case kEui64:
            store(designators.eui64, text, designators);
            logPrintf("Found Eui64Id: %s \n", text.c_str());
            break;
        case kNaa:
            store(identifier, text, designators);
            designators.isFound = true;
            logPrintf("Found NaaId: %s \n", text.c_str());
            break;
        case kMd5:
            store(designators.md5, text, designators);
            logPrintf("Found MD5ID: %s \n", text.c_str());
            break;
        case kScsiName:
            store(designators.scsiName, text, designators);
            logPrintf("Found ScsiName ID: %s \n", text.c_str());
            break;
        default:
            logPrintf("Default ID recieved");
            break;
        }
    }
}

// Reads page 83h into `page` and takes its designators. No failure of the page leaves this function.
void readDesignators(int32 fd, ZebScsiInquiry::Response& page, Designators& designators,
                     ZebString& identifier) {
    try {
        sharedInquiry().getDeviceIdentificationVpd(fd, sharedHandler(), kTimeOutMs, page);
        // Which object holds the page: its bytes stand in the dumps above.
        logPrintf("Vpd Page: %p\n", static_cast<const void*>(page.get()));
        walkDesignators(page, designators, identifier);
    } catch (const NotFoundEx&) {
        logPrintf("No LUN-association Descriptor found\n");
    } catch (const InvalidEx&) {
        logPrintf("Malformed VPD 0x83 Page\n");
    } catch (const ScsiStatusEx&) {
        logPrintf("SCSI Error for VPD 0x83 Inquiry\n");
        designators.hasScsiFailure = true;
    } catch (const ScsiIoctlEx&) {
        logPrintf("SCSI Ioctl Failure for VPD 0x83 Page\n");
        designators.hasScsiFailure = true;
    } catch (const NotSupportedEx&) {
        logPrintf("VPD Page 0x83 not supported\n");
        designators.isPageNotSupported = true;
    } catch (const TimeOutEx&) {
        logPrintf("Time-out in Reading VPD 0x83 Page\n");
        designators.hasScsiFailure = true;
    }
}

// Without NAA designator: the first non-empty candidate in the order of preference.
void choosePreferred(Designators& designators, ZebString& identifier) {
    if (designators.isFound || designators.firstSeen.empty()) {
        return;
    }
    for (const ZebString* candidate :
         {&designators.t10, &designators.eui64, &designators.scsiName, &designators.md5}) {
        if (!candidate->empty()) {
            identifier = *candidate;
            break;
        }
    }
    designators.isFound = true;
}

// Whether the device is one that has an identifier: a disk or array controller, or one of the DAS tree that
// cannot even be asked.
bool isDeviceAccepted(const OpenDevice& device, uint32 requestFlag, ZebScsiInquiry::Response& response) {
    try {
        return sharedInquiry().isDeviceTypeSupported(device.fd(), sharedHandler(), kTimeOutMs, response);
    } catch (const std::exception& exception) {
        logPrintf("Caught exception -> %s : Adding host name as LUN ID if the device is DAS and rejecting "
                  "otherwise...\n",
                  exception.what());
        return requestFlag == kDirectAttachedRequest;
    }
}

// The 16 bytes behind the header of page 83h, where old arrays put their identifier without a descriptor, in
// hex. Bytes that the device did not send are zeros, all of them when there was no page.
ZebString rawPageIdentifier(const ZebScsiInquiry::Response& page) {
    constexpr uint32 kHeaderLength = 4;
    constexpr uint32 kIdentifierLength = 16;
    if (page != nullptr) {
        return hexText(ResponseBytes(*page), kHeaderLength, kIdentifierLength);
    }
    return {"00000000000000000000000000000000"};
}

// Makes an identifier of standard INQUIRY data. Throws as the inquiry, and ExpiredEx.
ZebString identifierFromStdInquiry(int32 fd, const Designators& designators,
                                   const ZebScsiInquiry::Response& page,
                                   ZebScsiInquiry::Response& stdResponse) {
    ZebScsiInquiry& inquiry = sharedInquiry();
    inquiry.doStandardInquiry(fd, sharedHandler(), kTimeOutMs, stdResponse);
    ZebString vendor("");
    sGetStdInqField(inquiry, stdResponse, VendorId, vendor);
    logPrintf("InqBuffer %p Vendor %s \n", static_cast<const void*>(stdResponse.get()), vendor.c_str());
    if (vendor == "NETAPP" && designators.isPageNotSupported) {
        throw ExpiredEx("Netapp device has expired\n");
    }
    if (vendor == "EMC") {
        return rawPageIdentifier(page);
    }
    ZebString identifier(vendor);
    for (const uint32 field : {ProductId, ProductRevision, UndocumentedId}) {
        ZebString text("");
        sGetStdInqField(inquiry, stdResponse, field, text);
        identifier += ":";
        identifier += text;
    }
    return identifier;
}

// Opens the node for the function that `trace` is of. Throws NotFoundEx.
int32 openForInquiry(const ZebString& path, const FunctionTrace& trace) {
    int32 fd = -1;
    try {
        sharedHandler()->open(path, fd);
    } catch (const OpenFailedEx& exception) {
        logPrintf("Cannot do Scsi Inquiry on %s - %s\n", path.c_str(), exception.what());
        trace.fail<NotFoundEx>("Cannot open device for Scsi Inquiry\n");
    }
    return fd;
}

// Logs the standard-INQUIRY failure that is being handled, closes the device and leaves the function that
// `trace` is of, which throws the failure on. An expired device stays open.
void leaveAfterStdInquiryFailure(OpenDevice& device, const FunctionTrace& trace) {
    const char* const line = stdInquiryFailureLine();
    if (line != nullptr) {
        logPrintf("%s", line);
        device.closeQuietly();
        trace.exit();
    }
}

} // namespace

void sGetStdInqField(ZebScsiInquiry& inquiry, const ZebScsiInquiry::Response& response, uint32 fieldIndex,
                     ZebString& fieldOut) {
    const FunctionTrace trace("sGetStdInqField");
    ZebString text("");
    inquiry.getInquiryFieldAscii(response, fieldIndex, text);
    fieldOut = withoutTrailingBlanks(text);
    trace.exit();
}

void HA_GetScsiUniqueLunId(const ZebString& deviceName, ZebString& identifier, uint32& requestFlag) {
    const FunctionTrace trace("HA_GetScsiUniqueLunId");
    const ZebString path = devicePath(deviceName);
    if (contains(path, "/sg")) {
        trace.fail<NotSupportedEx>("The /sg? device is not supported");
    }
    OpenDevice device(openForInquiry(path, trace));

    ZebScsiInquiry::Response page;
    ZebScsiInquiry::Response stdResponse;
    if (!isDeviceAccepted(device, requestFlag, stdResponse)) {
        try {
            device.close();
        } catch (const CloseFailedEx&) {
            logPrintf("Failed to close device handle opened for scsi inquiry");
        }
        trace.fail<NotSupportedEx>("Device type not supported");
    }

    logPrintf("Get LunID\n");
    Designators designators;
    readDesignators(device.fd(), page, designators, identifier);
    choosePreferred(designators, identifier);
    if (designators.isFound) {
        logPrintf("Old Unique LunId = %s, New Unique LunId = %s\n", designators.firstSeen.c_str(),
                  identifier.c_str());
    } else {
        logPrintf("Could not find UniqueLunId from VPD Page 83, for device %s\n", deviceName.c_str());
    }
    if (!designators.isFound && requestFlag == kDirectAttachedRequest) {
        gDirectAttachedFlag = true;
        identifier = "";
        designators.isFound = true;
    }
    if (!designators.isFound && designators.hasScsiFailure) {
        device.close();
        trace.logAndFail<NotFoundEx>("Can't get ULID using Scsi\n", "Can't get ULID using SCSI\n");
    }
    if (designators.isFound) {
        device.close();
        logPrintf("Got ULID\n");
        trace.exit();
        return;
    }

    try {
        identifier = identifierFromStdInquiry(device.fd(), designators, page, stdResponse);
    } catch (const ExpiredEx&) {
        device.leaveOpen();
        leaveAfterStdInquiryFailure(device, trace);
        throw;
    } catch (const TException&) {
        leaveAfterStdInquiryFailure(device, trace);
        throw;
    }
    logPrintf("UniqueLunId from Standard Inquiry = %s\n", identifier.c_str());
    device.close();
    trace.exit();
}

void HA_PrintVendorProductId(const ZebString& deviceName) {
    const FunctionTrace trace("HA_PrintVendorProductId");
    const ZebString path = devicePath(deviceName);
    if (contains(path, "/sg")) {
        trace.fail<NotSupportedEx>("The /sg? device is not supported");
    }
    if (contains(path, "/dev/hdiskpower")) {
        trace.fail<NotSupportedEx>("The EMC PowerPath /dev/hdiskpower device is not supported");
    }
    OpenDevice device(openForInquiry(path, trace));
    ZebScsiInquiry::Response response; // lives until the trace has left the function
    try {
        ZebScsiInquiry& inquiry = sharedInquiry();
        inquiry.doStandardInquiry(device.fd(), sharedHandler(), kTimeOutMs, response);
        ZebString vendor("");
        ZebString product("");
        ZebString revision("");
        sGetStdInqField(inquiry, response, VendorId, vendor);
        sGetStdInqField(inquiry, response, ProductId, product);
        sGetStdInqField(inquiry, response, ProductRevision, revision);
        logPrintf("Vendor %s ProductId %s ProductRev %s\n", vendor.c_str(), product.c_str(),
                  revision.c_str());
    } catch (const TException&) {
        leaveAfterStdInquiryFailure(device, trace);
        throw;
    }
    device.close();
    trace.exit();
}
