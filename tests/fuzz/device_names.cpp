// What other programs call a device. The input is the lengths of vendor and product, the two, and page 83h.
#include <algorithm>
#include <set>
#include <string>
#include <vector>

#include "tests/fuzz/input.hpp"
#include "view/identity/names.hpp"

namespace {

// A name of a file in one folder, of a line.
void checkLink(const std::string& link) {
    const auto isOdd = [](char c) { return (c >= 0 && c <= ' ') || c == '/' || c == 0x7F; };
    require(std::none_of(link.begin(), link.end(), isOdd), "a link that is no file's name");
    require(link.starts_with("scsi-") || link.starts_with("ata-") || link.starts_with("wwn-0x"),
            "a link of no kind");
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8* data, std::size_t size) {
    Input input(data, size);
    const std::size_t vendorLength = input.byte() % 9U;
    const std::size_t productLength = input.byte() % 17U;
    const std::string_view vendor = input.take(vendorLength);
    const std::string_view product = input.take(productLength);
    const std::string_view page = input.rest();
    const view::Names names = view::namesOf(std::vector<uint8>(page.begin(), page.end()), vendor, product);
    for (const std::string* name : {&names.multipath, &names.kernel, &names.scsiId, &names.sg3Rules}) {
        require(name->find('\0') == std::string::npos, "a name with a NUL");
        require(name->size() <= 4 * 255 + 4 || name == &names.sg3Rules, "a name longer than its designator");
    }
    require(names.multipath.size() < 128, "a map's name that is too long");
    std::for_each(names.links.begin(), names.links.end(), checkLink);
    require(std::set<std::string>(names.links.begin(), names.links.end()).size() == names.links.size(),
            "a link twice");
    if (page.size() < 2 || static_cast<uint8>(page[1]) != 0x83) {
        require(names == view::Names(), "names by an answer that is no page 83h");
    }
    return 0;
}
