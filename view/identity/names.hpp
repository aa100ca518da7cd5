#pragma once

#include <cstdint>
#include <span>
#include <string>
#include <string_view>
#include <vector>

namespace view {

// What other programs of the host call a logical unit, each by its own preference among the designators of
// VPD page 83h. Texts are as the programs print them; an empty one: by this page the program has no name for
// it.
struct Names {
    std::string multipath; // multipath-tools, reading the page itself; a map is named so, or by an alias
    std::string kernel;    // the attribute `wwid` of the SCSI device in sysfs
    std::string scsiId;    // the program scsi_id of udev
    std::string
        sg3Rules; // ID_SERIAL by the udev rules of sg3-utils; empty where they leave the name to scsi_id

    // The links below /dev/disk/by-id that udev makes of the page, whichever of its rules are installed.
    std::vector<std::string> links;

    bool operator==(const Names&) const = default;
};

// The names that programs make of `page83`, a VPD page 83h with its header, which may be of any length and
// hold anything. `vendor` and `product` are those of the standard INQUIRY data without blanks at their ends;
// they are needed only for a unit whose sole designators are vendor specific, which without them stays
// without a name.
Names namesOf(std::span<const std::uint8_t> page83, std::string_view vendor, std::string_view product);

} // namespace view
