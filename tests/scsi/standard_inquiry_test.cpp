#include <cerrno>

#include <gtest/gtest.h>

#include "foundation/exceptions.hpp"
#include "scsi/io_context_linux.hpp"
#include "scsi/scsi_exceptions.hpp"
#include "tests/support/failing_memory.hpp"
#include "tests/support/inquiry_fixture.hpp"
#include "tests/support/thrown.hpp"

namespace {

class StandardInquiry : public InquiryFixture {
protected:
    void ask() { mInquiry.doStandardInquiry(kFd, mHandler, kTimeOutMs, mResponse); }

    // What the log says from the answer on when the command fails with `text` in processResponse.
    static std::string failedInquiry(const std::string& body) {
        return entered("doStandardInquiry") + madeContext() + "lcAllocLength = 36\n" +
               createdCdb(inquiryCdb(0, 0, 36)) + traced("doScsiIo") + traced("processResponse", body);
    }
};

TEST_F(StandardInquiry, AsksFor36BytesAndHandsOutTheWholeBuffer) {
    const Bytes data = standardData(0, "SEAGATE", "ST3146707FC", "0006", bytesOf("3KS0ABCD"));
    mKernel.answers = {good(data)};
    const LogCapture log;
    ask();
    EXPECT_EQ(log.text(), "Entered Function doStandardInquiry Line #\n" + madeContext() +
                              "lcAllocLength = 36\n" + createdCdb({0x12, 0, 0, 0, 36, 0}) +
                              "Entered Function doScsiIo Line #\n"
                              "Left Function doScsiIo Line #\n"
                              "Entered Function processResponse Line #\n"
                              "Entered Function getScsiStatus Line #\n"
                              "Left Function getScsiStatus Line #\n"
                              "Got a scsi inquiry response\n"
                              "Entered Function getResponseData Line #\n"
                              "Left Function getResponseData Line #\n"
                              "Left Function processResponse Line #\n"
                              "Left Function doStandardInquiry Line #\n" +
                              freedContext());
    EXPECT_EQ(cdbs(), (std::vector<Bytes>{{0x12, 0, 0, 0, 36, 0}}));
    EXPECT_EQ(mKernel.commands[0].transferLength, 256U);
    EXPECT_EQ(mResponse->length(), 256U);
    EXPECT_EQ(mResponse->byte(35), '6');
    EXPECT_EQ(mResponse->byte(36), 0); // not asked for
}

TEST_F(StandardInquiry, NeedsMemoryForItsContext) {
    const LogCapture log;
    const FailingNew failing(0);
    EXPECT_EQ(messageOf<NoMemoryEx>([&] { ask(); }), "No Memory\n");
    EXPECT_EQ(log.text(), entered("doStandardInquiry"));
}

TEST_F(StandardInquiry, AFailureOfTheHandlerPassesThrough) {
    mKernel.answers = {refusedByDriver(ENOTTY)};
    const LogCapture log;
    EXPECT_EQ(messageOf<ScsiIoctlEx>([&] { ask(); }), "ioctl failed, error code = 25\n");
    EXPECT_EQ(log.text(), entered("doStandardInquiry") + madeContext() + "lcAllocLength = 36\n" +
                              createdCdb(inquiryCdb(0, 0, 36)) + traced("doScsiIo") +
                              "ioctl failed, error code = 25\n\n" + freedContext() + freedBuffer());
    EXPECT_FALSE(mResponse != nullptr);
}

TEST_F(StandardInquiry, AStatusWithoutSenseFails) {
    mKernel.answers = {statusOnly(0x18)};
    const LogCapture log;
    EXPECT_EQ(messageOf<ScsiStatusEx>([&] { ask(); }), "Scsi Inquiry failed\n");
    EXPECT_EQ(log.text(), failedInquiry(traced("getScsiStatus") + "GotStatus:Category=2; Code=24;\n") +
                              freedContext() + freedBuffer());
}

TEST_F(StandardInquiry, SenseFailsWithCode99AndNoDumpOfItsBytes) {
    mKernel.answers = {senseAnswer({0x70, 0, 0x06, 0, 0, 0, 0, 10, 0, 0, 0, 0, 0x29, 0, 0, 0, 0, 0})};
    const LogCapture log;
    EXPECT_EQ(messageOf<ScsiStatusEx>([&] { ask(); }), "Scsi Inquiry failed\n");
    EXPECT_EQ(log.text(),
              failedInquiry(traced("getScsiStatus") + traced("getSenseData", traced("ZebBuffer")) +
                            "Category=3; Code=2;\nSense code=99\n") +
                  droppedView() + freedContext() + freedBuffer());
}

TEST_F(StandardInquiry, CheckConditionWithoutTheDriversWordIsFoundHere) {
    SgAnswer answer = pageRefused();
    answer.driverStatus = 0;
    mKernel.answers = {answer};
    const LogCapture log;
    EXPECT_EQ(messageOf<ScsiStatusEx>([&] { ask(); }), "Scsi Inquiry failed\n");
    EXPECT_EQ(log.text(),
              failedInquiry(traced("getScsiStatus") + traced("getSenseData", traced("ZebBuffer")) +
                            "Category=3; Code=2;\nSense code=99\n") +
                  droppedView() + freedContext() + freedBuffer());
}

TEST_F(StandardInquiry, ASenseCodeThatWasNeverSetIs0) {
    SgAnswer answer = statusOnly(0x22);
    answer.sense = {0x70, 0};
    mKernel.answers = {answer};
    const LogCapture log;
    EXPECT_EQ(messageOf<ScsiStatusEx>([&] { ask(); }), "Scsi Inquiry failed\n");
    EXPECT_EQ(log.text(),
              failedInquiry(traced("getScsiStatus") + traced("getSenseData", traced("ZebBuffer")) +
                            "Category=3; Code=34;\nSense code=0\n") +
                  droppedView() + freedContext() + freedBuffer());
}

TEST_F(StandardInquiry, MalformedSenseRunsIntoTheNextLine) {
    SgAnswer answer = statusOnly(0x02);
    answer.sense = Bytes(18, 0);
    mKernel.answers = {answer};
    const LogCapture log;
    EXPECT_EQ(messageOf<ScsiStatusEx>([&] { ask(); }), "Scsi Inquiry failed\n");
    EXPECT_EQ(log.text(),
              failedInquiry(traced("getScsiStatus") + entered("getSenseData") + traced("ZebBuffer") +
                            "sensep NULL or 0 sb_lenCategory=3; Code=2;\nSense code=0\n") +
                  droppedView() + freedContext() + freedBuffer());
}

TEST_F(StandardInquiry, ACommandThatDidNotComeThroughFails) {
    mKernel.answers = {hostFailure(7)};
    const LogCapture log;
    EXPECT_EQ(messageOf<ScsiStatusEx>([&] { ask(); }), "Scsi Inquiry failed\n");
    EXPECT_EQ(log.text(), failedInquiry(traced("getScsiStatus") + "TransportError: Category=4; Code=0;\n") +
                              freedContext() + freedBuffer());
}

// A context that tells a category that none of the others is.
class UnclassifiedContext : public ZebScsiIoContext {
public:
    void addDataInScsiCdb(const ZebCountedPointer<ZebBuffer>& /*cdb*/, uint32 /*allocLength*/) override {}
    void addDataOutScsiCdb(const ZebCountedPointer<ZebBuffer>& /*cdb*/,
                           const ZebCountedPointer<ZebBuffer>& /*data*/) override {}
    void getResponseData(ZebCountedPointer<ZebBuffer>& /*bufferOut*/) override {}
    void getSenseData(uint32& /*codeOut*/, ZebCountedPointer<ZebBuffer>& /*bufferOut*/) override {}
    uint32 getScsiStatus(uint32& statusOut) override {
        statusOut = 8;
        return 5;
    }
};

TEST_F(StandardInquiry, AnUnknownOutcomeFailsWithTextsOfItsOwn) {
    ZebScsiInquiry::Context context;
    context.create(new UnclassifiedContext, ZebPST_Individual, ZebPAT_New);
    const LogCapture log;
    EXPECT_EQ(messageOf<ScsiStatusEx>([&] { mInquiry.processResponse(context, mResponse); }),
              "ScsiInquiry failed");
    EXPECT_EQ(log.text(), traced("processResponse", "OtherError: Category=5; Code=8\n"));
}

TEST_F(StandardInquiry, AnOutcomeCannotBeProcessedBeforeTheCommandWasSent) {
    const LogCapture log;
    ZebScsiInquiry::Context context;
    context.create(new ZebScsiIoContextLinux, ZebPST_Individual, ZebPAT_New);
    EXPECT_EQ(messageOf<NotAllowedEx>([&] { mInquiry.processResponse(context, mResponse); }),
              "IOCTL should be called before processing response\n");
    EXPECT_EQ(log.text(), madeContext() + entered("processResponse") + traced("getScsiStatus"));
}

TEST_F(StandardInquiry, AResponseOfAdditionalLength31IsValid) {
    const ZebScsiInquiry::Response response = responseOf(standardData(0, "A", "B", "C", {}));
    const LogCapture log;
    mInquiry.validateResponse(response);
    EXPECT_EQ(log.text(), traced("validateResponse", tookReadPointer()));
}

TEST_F(StandardInquiry, AShorterResponseIsMalformedWithoutLineEnds) {
    const ZebScsiInquiry::Response response = responseOf({0, 0, 6, 2, 30});
    const LogCapture log;
    EXPECT_EQ(messageOf<InvalidEx>([&] { mInquiry.validateResponse(response); }),
              "Input does not represent std inquiry response");
    EXPECT_EQ(log.text(),
              traced("validateResponse", tookReadPointer() + "Standard Inquiry Response is malformed"
                                                             "Expected Response length >= 31 bytes"
                                                             "Actual Response length = 30 bytes"));
}

TEST_F(StandardInquiry, ABufferWithoutAdditionalLengthIsMalformed) {
    const ZebScsiInquiry::Response response = responseOf({0, 0, 6, 2}, 4);
    const LogCapture log;
    EXPECT_EQ(messageOf<InvalidEx>([&] { mInquiry.validateResponse(response); }),
              "Input does not represent std inquiry response");
    EXPECT_EQ(log.text(),
              traced("validateResponse", tookReadPointer() + "Standard Inquiry Response is malformed"
                                                             "Expected Response length >= 31 bytes"
                                                             "Actual Response length = 0 bytes"));
}

TEST_F(StandardInquiry, OnlyDisksAndArrayControllersAreSupportedWhateverTheQualifier) {
    const LogCapture unheard;
    for (unsigned first = 0; first < 256; ++first) {
        mKernel.answers = {good(standardData(static_cast<uint8>(first), "A", "B", "C", {}))};
        const unsigned type = first % 32;
        EXPECT_EQ(mInquiry.isDeviceTypeSupported(kFd, mHandler, kTimeOutMs, mResponse),
                  type == 0 || type == 12)
            << first;
    }
}

TEST_F(StandardInquiry, AskingForTheTypeLogsTheInquiryAndTheCheck) {
    mKernel.answers = {good(standardData(0, "A", "B", "C", {}))};
    const LogCapture log;
    EXPECT_TRUE(mInquiry.isDeviceTypeSupported(kFd, mHandler, kTimeOutMs, mResponse));
    EXPECT_EQ(log.text(), traced("isDeviceTypeSupported", didStandardInquiry() +
                                                              traced("validateResponse", tookReadPointer()) +
                                                              tookReadPointer()));
}

TEST_F(StandardInquiry, AMalformedAnswerPassesThroughTheTypeQuestion) {
    mKernel.answers = {good({0, 0, 6, 2, 5})};
    const LogCapture log;
    EXPECT_EQ(
        messageOf<InvalidEx>([&] { mInquiry.isDeviceTypeSupported(kFd, mHandler, kTimeOutMs, mResponse); }),
        "Input does not represent std inquiry response");
    EXPECT_EQ(log.text(),
              entered("isDeviceTypeSupported") + didStandardInquiry() +
                  traced("validateResponse", tookReadPointer() + "Standard Inquiry Response is malformed"
                                                                 "Expected Response length >= 31 bytes"
                                                                 "Actual Response length = 5 bytes"));
}

// An inquiry whose standard inquiry is another's.
class OtherInquiry : public ZebScsiInquiry {
public:
    void doStandardInquiry(int32 /*fd*/, const Handler& /*handler*/, uint32 /*timeout_ms*/,
                           Response& responseOut) override {
        responseOut = responseOf(standardData(0x0C, "A", "B", "C", {}));
    }
};

TEST_F(StandardInquiry, TheTypeQuestionUsesTheObjectsOwnInquiry) {
    const LogCapture unheard;
    OtherInquiry inquiry;
    EXPECT_TRUE(inquiry.isDeviceTypeSupported(kFd, mHandler, kTimeOutMs, mResponse));
    EXPECT_TRUE(mKernel.commands.empty());
}

// Fields.

class InquiryField : public InquiryFixture {
protected:
    std::string field(const Bytes& data, uint32 type) {
        const ZebScsiInquiry::Response response = responseOf(data);
        ZebString text("");
        const LogCapture log;
        mInquiry.getInquiryFieldAscii(response, type, text);
        mLog = log.text();
        return text.c_str();
    }

    template <typename Exception>
    std::string refusal(const Bytes& data, uint32 type) {
        const ZebScsiInquiry::Response response = responseOf(data);
        ZebString text("");
        const LogCapture log;
        std::string message =
            messageOf<Exception>([&] { mInquiry.getInquiryFieldAscii(response, type, text); });
        mLog = log.text();
        return message;
    }

    LogCapture mUnheard;
    std::string mLog;
};

TEST_F(InquiryField, KeepsItsTrailingBlanks) {
    const Bytes data = standardData(0, "EMC", "SYMMETRIX", "5671", {});
    EXPECT_EQ(field(data, VendorId), "EMC     ");
    EXPECT_EQ(field(data, ProductId), "SYMMETRIX       ");
    EXPECT_EQ(field(data, ProductRevision), "5671");
}

TEST_F(InquiryField, LogsTypeAndField) {
    field(standardData(0x6C, "EMC", "SYMMETRIX", "5671", {}), ProductId);
    EXPECT_EQ(mLog, traced("getInquiryFieldAscii", tookReadPointer() +
                                                       "Peripheral type from standard enquiry = 12\n"
                                                       "Going to extract Inquiry data for field type: 1\n"));
}

TEST_F(InquiryField, OfAShorterResponseIsRefusedWithLineEnds) {
    EXPECT_EQ(refusal<InvalidEx>({0x05, 0, 6, 2, 30}, VendorId),
              "Input does not represent std inquiry response\n");
    EXPECT_EQ(mLog,
              traced("getInquiryFieldAscii", tookReadPointer() + "Peripheral type from standard enquiry = 5\n"
                                                                 "Standard Inquiry Response is malformed\n"
                                                                 "Expected Response length >= 31 bytes\n"
                                                                 "Actual Response length = 30 bytes\n"));
}

TEST_F(InquiryField, AdditionalLength31HasFixedFieldsAndNoUndocumentedId) {
    const Bytes data = standardData(0, "HP", "HSV200", "6220", {});
    EXPECT_EQ(field(data, VendorId), "HP      ");
    EXPECT_EQ(field(data, ProductId), "HSV200          ");
    EXPECT_EQ(field(data, ProductRevision), "6220");
    EXPECT_EQ(refusal<InvalidEx>(data, UndocumentedId), "No bytes for undocumented ID\n");
    EXPECT_EQ(mLog, traced("getInquiryFieldAscii", tookReadPointer() +
                                                       "Peripheral type from standard enquiry = 0\n"
                                                       "Going to extract Inquiry data for field type: 3\n"
                                                       "No bytes for undocumented ID\n"));
}

TEST_F(InquiryField, UndocumentedIdRunsToTheEndOfTheData) {
    EXPECT_EQ(field(standardData(0, "A", "B", "C", bytesOf("123456789")), UndocumentedId), "123456789");
    EXPECT_EQ(mLog, traced("getInquiryFieldAscii", tookReadPointer() +
                                                       "Peripheral type from standard enquiry = 0\n"
                                                       "Going to extract Inquiry data for field type: 3\n"));
}

TEST_F(InquiryField, UndocumentedIdRunsToTheFirstByteAbove127AndIncludesIt) {
    const auto withByte38 = [](uint8 byte) {
        return standardData(0, "A", "B", "C", joined({bytesOf("12"), {byte}, bytesOf("456789")}));
    };
    EXPECT_EQ(field(withByte38(0x80), UndocumentedId), "12\x80");
    EXPECT_EQ(field(withByte38(0xFF), UndocumentedId), "12\xFF");
    EXPECT_EQ(field(withByte38(0x7F), UndocumentedId), "12\x7F"
                                                       "456789");
    EXPECT_EQ(field(standardData(0, "A", "B", "C", {0x80, 0x81}), UndocumentedId), "\x80");
}

TEST_F(InquiryField, UndocumentedIdBehindTheBufferIsZeros) {
    // Additional length 255 counts bytes 36 to 259; the buffer ends at 255.
    Bytes data = standardData(0, "A", "B", "C", Bytes(220, 'x'));
    data[4] = 255;
    EXPECT_EQ(field(data, UndocumentedId), std::string(220, 'x'));
}

TEST_F(InquiryField, OfAnUnknownTypeIsRefusedWithAnEmptyLine) {
    EXPECT_EQ(refusal<NotFoundEx>(standardData(0, "A", "B", "C", {}), 4), "Field type 4 is not supported\n");
    EXPECT_EQ(mLog, traced("getInquiryFieldAscii", tookReadPointer() +
                                                       "Peripheral type from standard enquiry = 0\n"
                                                       "Going to extract Inquiry data for field type: 4\n"
                                                       "Field type 4 is not supported\n\n"));
    EXPECT_EQ(refusal<NotFoundEx>(standardData(0, "A", "B", "C", {}), 0xFFFFFFFF),
              "Field type 4294967295 is not supported\n");
}

TEST_F(InquiryField, NeedsMemory) {
    const ZebScsiInquiry::Response response = responseOf(standardData(0, "A", "B", "C", bytesOf("12")));
    ZebString text("");
    const FailingCalloc failing;
    for (const uint32 type : {VendorId, ProductId, ProductRevision, UndocumentedId}) {
        EXPECT_EQ(messageOf<NoMemoryEx>([&] { mInquiry.getInquiryFieldAscii(response, type, text); }),
                  "No Memory\n");
    }
}

TEST_F(InquiryField, InBinaryDoesNothing) {
    const LogCapture log;
    mInquiry.getInquiryFieldBinary();
    EXPECT_EQ(log.text(), traced("getInquiryFieldBinary"));
}

} // namespace
