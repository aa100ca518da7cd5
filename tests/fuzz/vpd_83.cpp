// The Device Identification page (83h) and the walk over its designators. The input is the page; the header
// command gets its start.
#include "scsi/inquiry.hpp"
#include "tests/fuzz/fake_handler.hpp"

extern "C" int LLVMFuzzerTestOneInput(const uint8* data, std::size_t size) {
    Input input(data, size);
    const std::string_view page = input.rest();
    // The log's dump of a page that announces 64 KiB costs as much as a thousand short pages.
    if (page.size() >= 4 && page.size() < std::size_t{16} * static_cast<uint8>(page[2])) {
        return 0;
    }
    runInput({}, [&] {
        ZebScsiInquiry inquiry;
        ZebScsiInquiry::Response response;
        inquiry.getDeviceIdentificationVpd(0, fakeHandler(page), 1000, response);
        uint32 offset = 0;
        for (;;) { // to the exception behind the last designator
            const uint32 before = offset;
            uint32 type = 0;
            uint32 association = 0;
            ZebString text("");
            inquiry.getDiPageIdentifierAscii(response, offset, type, association, text);
            require(offset >= before + 4, "a walk that does not move on");
            require(offset <= response->length(), "a walk beyond the page");
            require(text.size() <= 510, "a designator longer than its bytes");
        }
    });
    return 0;
}
