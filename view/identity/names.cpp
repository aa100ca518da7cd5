#include "view/identity/names.hpp"

#include <algorithm>
#include <utility>

#include "view/identity/namers.hpp"
#include "view/identity/utf8.hpp"

namespace view {

namespace {

// A name as udev writes it into a link: blanks as underscores, one for a run of them and none at the ends,
// and one for each byte that a file name should not hold. \x escapes and UTF-8 stay.
std::string linkName(std::string_view name) {
    constexpr std::string_view kBlanks = " \t\n\v\f\r";
    name.remove_prefix(std::min(name.find_first_not_of(kBlanks), name.size()));
    name = name.substr(0, name.find_last_not_of(kBlanks) + 1);
    std::string link;
    bool afterBlank = false;
    while (!name.empty()) {
        const bool isBlank = kBlanks.find(name.front()) != std::string_view::npos;
        const std::size_t length = std::max<std::size_t>(firstCharacter(name).length, 1);
        const bool stays = length > 1 || isSafe(name.front()) || name.starts_with("\\x");
        if (!isBlank || !afterBlank) {
            link += stays ? name.substr(0, length) : "_";
        }
        afterBlank = isBlank;
        name.remove_prefix(length);
    }
    return link;
}

void addLink(std::vector<std::string>& links, std::string link) {
    if (std::find(links.begin(), links.end(), link) == links.end()) {
        links.push_back(std::move(link));
    }
}

} // namespace

Names namesOf(std::span<const std::uint8_t> page83, std::string_view vendor, std::string_view product) {
    const Page83Bytes page(page83);
    const ScsiIdName scsiId = scsiIdName(page, vendor, product);
    Sg3Names sg3 = sg3Names(page, vendor, product);
    Names names{multipathName(page), kernelName(page), scsiId.serial, sg3.serial, {}};
    if (!sg3.serial.empty()) {
        addLink(names.links, sg3.bus + '-' + linkName(sg3.serial));
    }
    for (const std::string& link : sg3.links) {
        addLink(names.links, linkName(link));
    }
    if (!scsiId.serial.empty()) {
        addLink(names.links, "scsi-" + linkName(scsiId.serial));
    }
    for (const std::string& wwn : {sg3.wwn, scsiId.wwn}) {
        if (!wwn.empty()) {
            addLink(names.links, "wwn-0x" + linkName(wwn));
        }
    }
    return names;
}

} // namespace view
