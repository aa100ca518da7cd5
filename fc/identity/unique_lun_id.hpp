// The identifier of a LUN that is the same on every path to it, read from the device itself.
#pragma once

#include "foundation/integers.hpp"
#include "foundation/zeb_string.hpp"
#include "scsi/inquiry.hpp"

// Set by HA_GetScsiUniqueLunId when it accepts a device of the DAS tree without an identifier; read and
// cleared by the report of that device.
extern bool gDirectAttachedFlag;

// Reads the unique identifier of the device `deviceName` (a node's path; what follows a ';' is left out) into
// `identifier`: the designator of VPD page 83h that ranks first (NAA, T10 vendor id, EUI-64, SCSI name, MD5),
// or, without one, a text made of standard INQUIRY data. `requestFlag` is the tree that asks: a device of the
// DAS tree (2) may also be accepted without an identifier, which sets gDirectAttachedFlag.
// Throws NotFoundEx (cannot be opened, or failed while it was asked), NotSupportedEx (not a disk, or no node
// to ask), ExpiredEx, and as the standard INQUIRY of the fallback does: TimeOutEx, ScsiIoctlEx, ScsiStatusEx,
// InvalidEx.
void HA_GetScsiUniqueLunId(const ZebString& deviceName, ZebString& identifier, uint32& requestFlag);

// Logs vendor, product and revision of the device `deviceName`. Throws as above.
void HA_PrintVendorProductId(const ZebString& deviceName);

// One field of standard INQUIRY data (a StdInquiryField) without its trailing blanks. Throws InvalidEx,
// NotFoundEx, NoMemoryEx.
void sGetStdInqField(ZebScsiInquiry& inquiry, const ZebScsiInquiry::Response& response, uint32 fieldIndex,
                     ZebString& fieldOut);
