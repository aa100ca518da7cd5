// The Unit Serial Number page (80h). The input is the page; the header command gets its start.
#include "scsi/inquiry.hpp"
#include "tests/fuzz/fake_handler.hpp"

extern "C" int LLVMFuzzerTestOneInput(const uint8* data, std::size_t size) {
    Input input(data, size);
    const std::string_view page = input.rest();
    runInput({}, [&] {
        ZebScsiInquiry inquiry;
        ZebScsiInquiry::Response response;
        inquiry.getUnitSerialNumberVpd(0, fakeHandler(page), 1000, response);
        ZebString serial("");
        inquiry.getUsnPageFieldAscii(response, serial);
        require(serial.size() <= 255, "a serial number longer than its page");
    });
    return 0;
}
