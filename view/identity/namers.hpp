#pragma once

#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "view/identity/page83.hpp"

// The programs that name a logical unit by its page 83h, one function each. Every one of them takes any
// bytes.
namespace view {

// The attribute `wwid` in sysfs; empty when the kernel finds no designator for it.
std::string kernelName(const Page83Bytes& page);

// The identifier that multipath-tools makes of the page; empty when it finds none.
std::string multipathName(const Page83Bytes& page);

// What udev's program scsi_id prints.
struct ScsiIdName {
    std::string serial; // empty when it finds no designator
    std::string wwn;    // ID_WWN_WITH_EXTENSION without its 0x; empty unless the name is an NAA one
};

// `vendor` and `product` are the fields of the standard INQUIRY data without blanks at their ends; with both
// empty they are not known, and vendor specific designators give no name.
ScsiIdName scsiIdName(const Page83Bytes& page, std::string_view vendor, std::string_view product);

// The udev rules of sg3-utils.
struct Sg3Names {
    std::string serial;             // ID_SERIAL; empty where they set none
    std::string bus;                // ID_BUS, which goes with it
    std::string wwn;                // ID_WWN_WITH_EXTENSION; empty without an NAA designator
    std::vector<std::string> links; // below /dev/disk/by-id, those of `serial` and `wwn` left out
};

// `vendor` and `product` as for scsiIdName.
Sg3Names sg3Names(const Page83Bytes& page, std::string_view vendor, std::string_view product);

} // namespace view
