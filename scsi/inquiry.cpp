#include "scsi/inquiry.hpp"

#include <new>

#include "foundation/clib_stream.hpp"
#include "foundation/trace.hpp"
#include "scsi/io_context_linux.hpp"
#include "scsi/response_bytes.hpp"
#include "scsi/scsi_exceptions.hpp"

namespace {

constexpr uint8 kInquiryOpcode = 0x12;
constexpr uint32 kInquiryCdbLength = 6;
constexpr uint8 kUnitSerialNumberPage = 0x80;
constexpr uint8 kDeviceIdentificationPage = 0x83;
constexpr uint32 kVpdHeaderLength = 4;
constexpr uint32 kStdInquiryLength = 36;
constexpr uint32 kLeastAdditionalLength = 31; // byte 4 of a 36-byte standard response
constexpr uint32 kNotDefined = 0xFFFFFFFF;    // type and association of a designator of unknown code set

ZebScsiInquiry::Context makeContext() {
    ZebScsiInquiry::Context lContext;
    lContext.create(new (std::nothrow) ZebScsiIoContextLinux, ZebPST_Individual, ZebPAT_New);
    return lContext;
}

template <typename Byte>
void dumpBytes(uint32 count, Byte byteAt) {
    logPrintf("Going to dump %u bytes\n", count);
    for (uint32 i = 0; i < count; ++i) {
        logPrintf("Byte %u: 0x%x", i, byteAt(i));
    }
    logPrintf("\n");
}

void dumpBytes(const ResponseBytes& bytes, uint32 offset, uint32 count) {
    dumpBytes(count, [&](uint32 i) { return bytes[offset + i]; });
}

// The length of a VPD page behind its header (SPC, VPD page format: bytes 2 and 3).
uint32 pageLength(const ResponseBytes& page) {
    return page[2] * 256U + page[3];
}

} // namespace

void ZebScsiInquiry::createInquiryCDB(Context& context, uint8 evpd, uint8 pageCode, uint16 allocLength) {
    TRACE_ENTRY("createInquiryCDB");
    logPrintf("Going to create the Inquiry command\n");
    const uint8 lCdb[kInquiryCdbLength] = {kInquiryOpcode,
                                           static_cast<uint8>(evpd & 0x01),
                                           pageCode,
                                           static_cast<uint8>(allocLength >> 8),
                                           static_cast<uint8>(allocLength & 0xFF),
                                           0};
    logPrintf("SCSI Inquiry CDB Dump:");
    dumpBytes(kInquiryCdbLength, [&](uint32 i) { return lCdb[i]; });
    ZebCountedPointer<ZebBuffer> lCdbBuffer;
    lCdbBuffer.create(new (std::nothrow) ZebBuffer(kInquiryCdbLength, 0), ZebPST_Individual, ZebPAT_New);
    lCdbBuffer->copy(lCdb, kInquiryCdbLength);
    context->addDataInScsiCdb(lCdbBuffer, allocLength);
    TRACE_EXIT("createInquiryCDB");
}

void ZebScsiInquiry::processResponse(Context& context, Response& responseOut) {
    TRACE_ENTRY("processResponse");
    uint32 lCode = 0;
    const uint32 lCategory = context->getScsiStatus(lCode);
    switch (lCategory) {
    case kResultGood:
        logPrintf("Got a scsi inquiry response\n");
        context->getResponseData(responseOut);
        TRACE_EXIT("processResponse");
        return;
    case kResultOtherStatus:
        logPrintf("GotStatus:Category=%u; Code=%u;\n", lCategory, lCode);
        TRACE_EXIT("processResponse");
        throw ScsiStatusEx("Scsi Inquiry failed\n");
    case kResultSenseAvailable: {
        uint32 lSenseCode = 0;
        Response lSense;
        context->getSenseData(lSenseCode, lSense);
        logPrintf("Category=%u; Code=%u;\n", lCategory, lCode);
        logPrintf("Sense code=%u\n", lSenseCode);
        // The dump's condition has always stood this way round: readers of the log expect no sense bytes
        // here.
        for (uint32 i = 0; lSense->length() < i; ++i) {
            logPrintf("Sense Buffer Byte %u: 0x%x\n", i, lSense->byte(i));
        }
        TRACE_EXIT("processResponse");
        throw ScsiStatusEx("Scsi Inquiry failed\n");
    }
    case kResultTransportError:
        logPrintf("TransportError: Category=%u; Code=%u;\n", lCategory, lCode);
        TRACE_EXIT("processResponse");
        throw ScsiStatusEx("Scsi Inquiry failed\n");
    default:
        logPrintf("OtherError: Category=%u; Code=%u\n", lCategory, lCode);
        TRACE_EXIT("processResponse");
        throw ScsiStatusEx("ScsiInquiry failed");
    }
}

void ZebScsiInquiry::sendInquiry(Context& context, int32 fd, const Handler& handler, uint32 timeout_ms,
                                 uint8 evpd, uint8 pageCode, uint16 allocLength, Response& responseOut) {
    createInquiryCDB(context, evpd, pageCode, allocLength);
    Handler lHandler(handler);
    lHandler->doScsiIo(fd, timeout_ms, context);
    processResponse(context, responseOut);
}

void ZebScsiInquiry::doStandardInquiry(int32 fd, const Handler& handler, uint32 timeout_ms,
                                       Response& responseOut) {
    TRACE_ENTRY("doStandardInquiry");
    Context lContext = makeContext();
    logPrintf("lcAllocLength = %u\n", kStdInquiryLength);
    sendInquiry(lContext, fd, handler, timeout_ms, 0, 0, kStdInquiryLength, responseOut);
    TRACE_EXIT("doStandardInquiry");
}

void ZebScsiInquiry::validateResponse(const Response& response) {
    TRACE_ENTRY("validateResponse");
    const ResponseBytes lBytes(*response);
    if (lBytes[4] < kLeastAdditionalLength) {
        logPrintf("Standard Inquiry Response is malformed");
        logPrintf("Expected Response length >= %u bytes", kLeastAdditionalLength);
        logPrintf("Actual Response length = %u bytes", lBytes[4]);
        TRACE_EXIT("validateResponse");
        throw InvalidEx("Input does not represent std inquiry response");
    }
    TRACE_EXIT("validateResponse");
}

bool ZebScsiInquiry::isDeviceTypeSupported(int32 fd, const Handler& handler, uint32 timeout_ms,
                                           Response& responseOut) {
    // SPC, peripheral device types
    constexpr uint32 kDirectAccessBlockDevice = 0x00;
    constexpr uint32 kStorageArrayController = 0x0C;
    TRACE_ENTRY("isDeviceTypeSupported");
    doStandardInquiry(fd, handler, timeout_ms, responseOut);
    validateResponse(responseOut);
    const ResponseBytes lBytes(*responseOut);
    const uint32 lType = lBytes[0] & 0x1FU;
    TRACE_EXIT("isDeviceTypeSupported");
    return lType == kDirectAccessBlockDevice || lType == kStorageArrayController;
}

void ZebScsiInquiry::getInquiryFieldAscii(const Response& response, uint32 fieldType, ZebString& stringOut) {
    TRACE_ENTRY("getInquiryFieldAscii");
    const ResponseBytes lBytes(*response);
    logPrintf("Peripheral type from standard enquiry = %u\n", lBytes[0] & 0x1FU);
    const uint32 lAdditionalLength = lBytes[4];
    if (lAdditionalLength < kLeastAdditionalLength) {
        logPrintf("Standard Inquiry Response is malformed\n");
        logPrintf("Expected Response length >= %u bytes\n", kLeastAdditionalLength);
        logPrintf("Actual Response length = %u bytes\n", lAdditionalLength);
        TRACE_EXIT("getInquiryFieldAscii");
        throw InvalidEx("Input does not represent std inquiry response\n");
    }
    logPrintf("Going to extract Inquiry data for field type: %u\n", fieldType);
    switch (fieldType) {
    case VendorId:
        stringOut = asciiText(lBytes, 8, 8);
        break;
    case ProductId:
        stringOut = asciiText(lBytes, 16, 16);
        break;
    case ProductRevision:
        stringOut = asciiText(lBytes, 32, 4);
        break;
    case UndocumentedId: {
        const uint32 lMost = lAdditionalLength - kLeastAdditionalLength;
        if (lMost == 0) {
            logPrintf("No bytes for undocumented ID\n");
            TRACE_EXIT("getInquiryFieldAscii");
            throw InvalidEx("No bytes for undocumented ID\n");
        }
        uint32 lCount = 0;
        bool lEnded = false;
        while (lCount < lMost && !lEnded) {
            lEnded = lBytes[kStdInquiryLength + lCount] > 127;
            ++lCount;
        }
        stringOut = asciiText(lBytes, kStdInquiryLength, lCount);
        break;
    }
    default: {
        char lText[64] = {};
        Clib_snprintf(lText, sizeof lText, "Field type %u is not supported\n", fieldType);
        logPrintf("%s\n", lText);
        TRACE_EXIT("getInquiryFieldAscii");
        throw NotFoundEx(lText);
    }
    }
    TRACE_EXIT("getInquiryFieldAscii");
}

void ZebScsiInquiry::getInquiryFieldBinary() {
    TRACE_ENTRY("getInquiryFieldBinary");
    TRACE_EXIT("getInquiryFieldBinary");
}

void ZebScsiInquiry::getUnitSerialNumberVpd(int32 fd, const Handler& handler, uint32 timeout_ms,
                                            Response& responseOut) {
    TRACE_ENTRY("getUnitSerialNumberVpd");
    Context lContext = makeContext();
    logPrintf("lcAllocLength = %u\n", kVpdHeaderLength);
    sendInquiry(lContext, fd, handler, timeout_ms, 1, kUnitSerialNumberPage, kVpdHeaderLength, responseOut);
    logPrintf("Going to Determine the length of product serial number\n");
    const uint32 lLength = ResponseBytes(*responseOut)[3];
    logPrintf("USN length is: %u bytes\n", lLength);
    if (lLength == 0) {
        logPrintf("Unit serial number not returned\n");
        TRACE_EXIT("getUnitSerialNumberVpd");
        throw NotSupportedEx("Unit serial number not returned\n");
    }
    const auto lAllocLength = static_cast<uint16>(lLength + kVpdHeaderLength);
    logPrintf("Sending Inquiry again with alloc length: %u bytes\n", lAllocLength);
    sendInquiry(lContext, fd, handler, timeout_ms, 1, kUnitSerialNumberPage, lAllocLength, responseOut);
    TRACE_EXIT("getUnitSerialNumberVpd");
}

void ZebScsiInquiry::getUsnPageFieldAscii(const Response& response, ZebString& stringOut) {
    TRACE_ENTRY("getUsnPageFieldAscii");
    const ResponseBytes lPage(*response);
    if (lPage[1] != kUnitSerialNumberPage) {
        logPrintf("Buffer does not represent a USN VPD page\n");
        TRACE_EXIT("getUsnPageFieldAscii");
        throw InvalidEx("Buffer does not represent a USN VPD page\n");
    }
    stringOut = asciiText(lPage, kVpdHeaderLength, lPage[3]);
    logPrintf("USN is %s\n", stringOut.c_str());
    TRACE_EXIT("getUsnPageFieldAscii");
}

void ZebScsiInquiry::getUsnPageFieldBinary() {
    TRACE_ENTRY("getUsnPageFieldBinary");
    TRACE_EXIT("getUsnPageFieldBinary");
}

void ZebScsiInquiry::getDeviceIdentificationVpd(int32 fd, const Handler& handler, uint32 timeout_ms,
                                                Response& responseOut) {
    TRACE_ENTRY("getDeviceIdentificationVpd");
    Context lContext = makeContext();
    logPrintf("lcAllocLength = %u\n", kVpdHeaderLength);
    sendInquiry(lContext, fd, handler, timeout_ms, 1, kDeviceIdentificationPage, kVpdHeaderLength,
                responseOut);
    logPrintf("Determining the length of Identification descriptor list\n");
    logPrintf("Going to dump the DI VPD page heder\n");
    const ResponseBytes lHeader(*responseOut);
    const uint8* const lcpResponse = lHeader.data();
    ASSERT_OR_EXIT(__null != lcpResponse);
    dumpBytes(lHeader, 0, kVpdHeaderLength);
    // Taken now: the second command erases the buffer that these bytes stand in.
    const uint32 lLength = pageLength(lHeader);
    logPrintf("Identification descriptor list length is: %u bytes\n", lLength);
    if (lLength == 0) {
        logPrintf("Identification descriptor list not returned\n");
        TRACE_EXIT("getDeviceIdentificationVpd");
        throw NotSupportedEx("Identification descriptor list not returned\n");
    }
    // The CDB's field has 16 bits; a list longer than they can ask for wraps.
    const auto lAllocLength = static_cast<uint16>(lLength + kVpdHeaderLength);
    logPrintf("Sending Inquiry again with alloc length: %u bytes\n", lAllocLength);
    sendInquiry(lContext, fd, handler, timeout_ms, 1, kDeviceIdentificationPage, lAllocLength, responseOut);
    logPrintf("Going to dump entire DI VPD page\n");
    const Response& lcDiPage = responseOut;
    const ResponseBytes lPage(*lcDiPage);
    dumpBytes(lPage, 0, lAllocLength);
    // The blanks show in the assertion's text.
    // clang-format off
    ASSERT_OR_EXIT(__null != static_cast<const uint8 *> (*lcDiPage));
    // clang-format on
    logPrintf("Peripheral type from vpd page = %u\n", lPage[0] & 0x1FU);
    TRACE_EXIT("getDeviceIdentificationVpd");
}

void ZebScsiInquiry::getDiPageIdentifierAscii(const Response& response, uint32& offsetInOut,
                                              uint32& idTypeOut, uint32& associationOut,
                                              ZebString& stringOut) {
    constexpr uint32 kDescriptorHeaderLength = 4;
    TRACE_ENTRY("getDiPageIdentifierAscii");
    const ResponseBytes lPage(*response);
    const uint8* const lcpHeader = lPage.data();
    ASSERT_OR_EXIT(__null != lcpHeader);
    if (lPage[1] != kDeviceIdentificationPage) {
        logPrintf("Input buffer does not contain a DI VPD Page\n");
        TRACE_EXIT("getDiPageIdentifierAscii");
        throw InvalidEx("Input buffer does not contain a DI VPD Page\n");
    }
    const uint32 lcListLength = pageLength(lPage);
    ASSERT_OR_EXIT(0 != lcListLength);
    const uint32 lPageEnd = lcListLength + kVpdHeaderLength;
    if (lPage.length() < lPageEnd) {
        char lText[64] = {};
        Clib_snprintf(lText, sizeof lText, "length %d morethan expected %d\n", static_cast<int32>(lPageEnd),
                      static_cast<int32>(lPage.length()));
        logPrintf("%s\n", lText);
        TRACE_EXIT("getDiPageIdentifierAscii");
        throw InvalidEx(lText);
    }
    if (offsetInOut == lPageEnd) {
        logPrintf("No more descriptors left in DI page to read\n");
        TRACE_EXIT("getDiPageIdentifierAscii");
        throw NotFoundEx("No more descriptors left in DI page\n");
    }
    if (offsetInOut == 0) {
        offsetInOut = kVpdHeaderLength;
    }
    const uint32 lOffset = offsetInOut;
    const uint32 lIdentifierLength = lPage[lOffset + 3];
    const uint32 lDescriptorLength = lIdentifierLength + kDescriptorHeaderLength;
    if (lOffset > lPageEnd || lDescriptorLength > lPageEnd - lOffset) {
        logPrintf("Device Identification Data is malformed\n");
        TRACE_EXIT("getDiPageIdentifierAscii");
        throw InvalidEx("Device Identification Data is malformed\n");
    }
    logPrintf("Going to Extract Data from Descriptor @ %u\n", lOffset);
    dumpBytes(lPage, lOffset, lDescriptorLength);

    // SPC, designation descriptor: code set, association and type, then the designator behind byte 3.
    enum CodeSet : uint8 { kBinary = 1, kAscii = 2, kUtf8 = 3 };
    idTypeOut = lPage[lOffset + 1] & 0x0FU;
    associationOut = (lPage[lOffset + 1] >> 4) & 0x03U;
    switch (lPage[lOffset] & 0x0F) {
    case kBinary:
        logPrintf("Going to store identifier in Binary format\n");
        stringOut = hexText(lPage, lOffset + kDescriptorHeaderLength, lIdentifierLength);
        break;
    case kAscii:
    case kUtf8:
        logPrintf("Going to store identifier in ASCII format\n");
        stringOut = asciiText(lPage, lOffset + kDescriptorHeaderLength, lIdentifierLength);
        break;
    default:
        logPrintf("Identifier format is undefined.\n");
        idTypeOut = kNotDefined;
        associationOut = kNotDefined;
        break;
    }
    logPrintf("ID Type: 0%x; Association type: 0%x; Identifier: '%s'\n", idTypeOut, associationOut,
              stringOut.c_str());
    offsetInOut = lOffset + lDescriptorLength;
    TRACE_EXIT("getDiPageIdentifierAscii");
}

void ZebScsiInquiry::getDiPageIdentifierBinary() {
    TRACE_ENTRY("getDiPageIdentifierBinary");
    TRACE_EXIT("getDiPageIdentifierBinary");
}
