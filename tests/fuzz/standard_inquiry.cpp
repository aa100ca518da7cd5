// Standard INQUIRY data: the device type and every text field. The input is what the device sends.
#include "scsi/inquiry.hpp"
#include "tests/fuzz/fake_handler.hpp"

extern "C" int LLVMFuzzerTestOneInput(const uint8* data, std::size_t size) {
    Input input(data, size);
    const std::string_view answer = input.rest();
    runInput({}, [&] {
        ZebScsiInquiry inquiry;
        ZebScsiInquiry::Response response;
        inquiry.doStandardInquiry(0, fakeHandler(answer), 1000, response);
        for (uint32 field = VendorId; field <= UndocumentedId + 1; ++field) {
            ZebString text("");
            runInput({}, [&] { inquiry.getInquiryFieldAscii(response, field, text); });
            require(text.size() <= (field == UndocumentedId ? 255 - 31 : 16),
                    "a field longer than its bytes");
        }
        inquiry.isDeviceTypeSupported(0, fakeHandler(answer), 1000, response);
    });
    return 0;
}
