// An I/O handler that answers every command with the same bytes.
#pragma once

#include <string_view>

#include "foundation/counted_pointer.hpp"
#include "scsi/io_handler.hpp"
#include "tests/fuzz/harness.hpp"

class FakeHandler : public ZebScsiIoHandler {
public:
    // `answer` must outlive the handler.
    explicit FakeHandler(std::string_view answer) : mAnswer(answer) {}

    void open(const ZebString& /*path*/, int32& fdOut) override { fdOut = 0; }
    void close(int32 /*fd*/) override {}
    void doScsiIo(int32 /*fd*/, uint32 /*timeout_ms*/,
                  const ZebCountedPointer<ZebScsiIoContext>& context) override {
        ZebCountedPointer<ZebScsiIoContext> lContext(context);
        ZebCountedPointer<IoObject> lIoObject(lContext->ioObject());
        respond(lIoObject->header, mAnswer);
        lIoObject->ioctlState = kIoctlSucceeded;
    }

private:
    std::string_view mAnswer;
};

inline ZebCountedPointer<ZebScsiIoHandler> fakeHandler(std::string_view answer) {
    ZebCountedPointer<ZebScsiIoHandler> handler;
    handler.create(new FakeHandler(answer), ZebPST_Individual, ZebPAT_New);
    return handler;
}
