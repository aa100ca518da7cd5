// Sense data: the I/O handler's look at a command's outcome, then the inquiry's. The input is one answer as
// scripted_device.hpp has it.
#include "scsi/inquiry.hpp"
#include "scsi/io_context_linux.hpp"
#include "scsi/io_handler_linux.hpp"
#include "tests/fuzz/scripted_device.hpp"

extern "C" int LLVMFuzzerTestOneInput(const uint8* data, std::size_t size) {
    Input input(data, size);
    gHost.device = [&](sg_io_hdr& header) { return answerFrom(input, header); };
    runInput({}, [&] {
        ZebScsiIoHandlerLinux handler;
        ZebScsiInquiry inquiry;
        ZebScsiInquiry::Context context;
        context.create(new ZebScsiIoContextLinux, ZebPST_Individual, ZebPAT_New);
        inquiry.createInquiryCDB(context, 0, 0, 36);
        int32 fd = -1;
        handler.open("/dev/sda", fd);
        handler.doScsiIo(fd, 1000, context);
        ZebScsiInquiry::Response response;
        inquiry.processResponse(context, response);
    });
    return 0;
}
