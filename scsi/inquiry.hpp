// The SCSI INQUIRY command and its answers: standard data and the vital product data (VPD) pages 80h and 83h.
// Byte layouts are those of SPC.
#pragma once

#include "foundation/counted_pointer.hpp"
#include "foundation/integers.hpp"
#include "foundation/zeb_string.hpp"
#include "scsi/io_context.hpp"
#include "scsi/io_handler.hpp"

// Text fields of standard INQUIRY data (SPC, standard INQUIRY data format).
enum StdInquiryField : uint32 {
    VendorId = 0,        // bytes 8 to 15
    ProductId = 1,       // bytes 16 to 31
    ProductRevision = 2, // bytes 32 to 35
    UndocumentedId = 3   // from byte 36: to the first byte above 127, that one included, or to the data's end
};

// Buffers handed out as `responseOut` are the command's whole data buffer, not cut to what the device sent.
// Every operation is traced. All throw NoMemoryEx; the commands throw what ZebScsiIoHandler::doScsiIo throws,
// and ScsiStatusEx when the command came through but did not end well.
class ZebScsiInquiry {
public:
    using Context = ZebCountedPointer<ZebScsiIoContext>;
    using Handler = ZebCountedPointer<ZebScsiIoHandler>;
    using Response = ZebCountedPointer<ZebBuffer>;

    ZebScsiInquiry() = default;
    ZebScsiInquiry(const ZebScsiInquiry&) = delete;
    ZebScsiInquiry& operator=(const ZebScsiInquiry&) = delete;
    virtual ~ZebScsiInquiry() = default;

    // Reads 36 bytes of standard data from the device open as `fd`, within `timeout_ms` milliseconds.
    virtual void doStandardInquiry(int32 fd, const Handler& handler, uint32 timeout_ms,
                                   Response& responseOut);
    // One field of standard data (a StdInquiryField), trailing blanks included. Throws InvalidEx (not
    // standard data, or no such bytes), NotFoundEx (no such field).
    virtual void getInquiryFieldAscii(const Response& response, uint32 fieldType, ZebString& stringOut);
    virtual void getInquiryFieldBinary();

    // Reads the Unit Serial Number page (80h): its header, then all of it. Throws NotSupportedEx when empty.
    virtual void getUnitSerialNumberVpd(int32 fd, const Handler& handler, uint32 timeout_ms,
                                        Response& responseOut);
    // The serial number of that page. Throws InvalidEx when the page is another.
    virtual void getUsnPageFieldAscii(const Response& response, ZebString& stringOut);
    virtual void getUsnPageFieldBinary();

    // Reads the Device Identification page (83h): its header, then all of it. Throws NotSupportedEx when
    // empty.
    virtual void getDeviceIdentificationVpd(int32 fd, const Handler& handler, uint32 timeout_ms,
                                            Response& responseOut);
    // The designator of that page at `offsetInOut` (0 at first), which moves on to the next: its type and
    // association, both all ones when its code set is undefined, and its text: as it stands (ASCII, UTF-8),
    // in upper-case hex (binary), or `stringOut` left as it was (undefined code set). Throws NotFoundEx
    // behind the last one, InvalidEx on another page or a malformed one.
    virtual void getDiPageIdentifierAscii(const Response& response, uint32& offsetInOut, uint32& idTypeOut,
                                          uint32& associationOut, ZebString& stringOut);
    virtual void getDiPageIdentifierBinary();

    // Puts an INQUIRY CDB into the context.
    void createInquiryCDB(Context& context, uint8 evpd, uint8 pageCode, uint16 allocLength);
    // Shares the response of a command that ended well. Throws ScsiStatusEx for any other.
    void processResponse(Context& context, Response& responseOut);
    // Throws InvalidEx when the response is no standard data of 36 bytes or more.
    void validateResponse(const Response& response);
    // Reads standard data, and tells whether the device is a block device or an array controller.
    bool isDeviceTypeSupported(int32 fd, const Handler& handler, uint32 timeout_ms, Response& responseOut);

private:
    void sendInquiry(Context& context, int32 fd, const Handler& handler, uint32 timeout_ms, uint8 evpd,
                     uint8 pageCode, uint16 allocLength, Response& responseOut);
};
