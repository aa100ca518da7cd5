#include "foundation/buffer.hpp"

#include <sys/mman.h>
#include <sys/resource.h>

#include <cstddef>
#include <cstring>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "foundation/exceptions.hpp"
#include "tests/support/fatal.hpp"
#include "tests/support/log_capture.hpp"
#include "tests/support/refusing_log.hpp"
#include "tests/support/thrown.hpp"

#ifdef __SANITIZE_ADDRESS__
// Lets malloc refuse what the sanitizer would otherwise end the program for.
extern "C" const char* __asan_default_options(); // NOLINT(bugprone-reserved-identifier): the sanitizer's name
extern "C" const char* __asan_default_options() {
    return "allocator_may_return_null=1:max_allocation_size_mb=2048";
}
#endif

namespace {

#ifdef __SANITIZE_ADDRESS__
// The one above: its shadow memory needs more than any other would leave.
struct MemoryLimit {
    static bool holds() { return true; }
};
#else
// Leaves the program 1 GiB of memory while it lives.
struct MemoryLimit {
    MemoryLimit() {
        getrlimit(RLIMIT_AS, &previous);
        const rlimit limit = {1U << 30, previous.rlim_max};
        setrlimit(RLIMIT_AS, &limit);
    }
    MemoryLimit(const MemoryLimit&) = delete;
    MemoryLimit& operator=(const MemoryLimit&) = delete;
    ~MemoryLimit() { setrlimit(RLIMIT_AS, &previous); }

    // Whether more is really refused: a processor's emulator may take no notice of the limit.
    static bool holds() {
        constexpr std::size_t kMore = 2U << 30;
        void* const memory =
            mmap(nullptr, kMore, PROT_NONE, MAP_PRIVATE | MAP_ANONYMOUS | MAP_NORESERVE, -1, 0);
        if (memory == MAP_FAILED) {
            return true;
        }
        munmap(memory, kMore);
        return false;
    }

    rlimit previous{};
};
#endif

const std::string kConstruction = "Entered Function ZebBuffer Line #\nLeft Function ZebBuffer Line #\n";
const std::string kFreeing = "Entered Function ~ZebBuffer Line #\n"
                             "Entered Function _destroy Line #\n"
                             "Freeing persistent allocated buffer\n"
                             "Left Function _destroy Line #\n"
                             "Left Function ~ZebBuffer Line #\n";
const std::string kNotFreeing = "Entered Function ~ZebBuffer Line #\n"
                                "Entered Function _destroy Line #\n"
                                "Not freeing non-persistent buffer, nullifying pointer\n"
                                "Left Function _destroy Line #\n"
                                "Left Function ~ZebBuffer Line #\n";

std::string entered(const std::string& name) {
    return "Entered Function " + name + " Line #\n";
}

std::string traced(const std::string& name) {
    return entered(name) + "Left Function " + name + " Line #\n";
}

std::string failed(const std::string& condition) {
    return "Assertion [ " + condition + " ] failed\n";
}

// The whole block of an owning buffer.
std::vector<uint8> block(const ZebBuffer& buffer, uint32 size) {
    const uint8* const first = buffer;
    return {first, first + size};
}

// A buffer whose own lines stay out of the log: what remains is what the test does to it.
template <typename Made>
class Quiet {
public:
    template <typename... Arguments>
    explicit Quiet(Arguments... arguments)
        : mBuffer([&] {
              const LogCapture log;
              return new Made(arguments...);
          }()) {}
    Quiet(const Quiet&) = delete;
    Quiet& operator=(const Quiet&) = delete;
    ~Quiet() {
        const LogCapture log;
        delete mBuffer;
    }
    Made& operator*() { return *mBuffer; }
    Made* operator->() { return mBuffer; }

private:
    Made* mBuffer;
};

using Owning = Quiet<ZebBuffer>;
using Wrapping = Quiet<ZebLocalBuffer>;

const uint8 kData[] = {1, 2, 3, 4};

TEST(Buffer, HasTheUseLengthAsItsSizeWhenGivenNoMaximum) {
    Owning buffer(10U, 0U);
    EXPECT_EQ(buffer->length(), 10U);
    EXPECT_EQ(block(*buffer, 10), std::vector<uint8>(10, 0));
    buffer->setLength(10);
    EXPECT_FATAL(buffer->setLength(11), entered("setLength") + failed("acLength <= this->mMaxLength"));
}

TEST(Buffer, HasTheMaximumAsItsSize) {
    Owning buffer(0U, 16U);
    EXPECT_EQ(buffer->length(), 0U);
    EXPECT_EQ(block(*buffer, 16), std::vector<uint8>(16, 0));
}

TEST(Buffer, MayBeInUseWhole) {
    Owning buffer(16U, 16U);
    EXPECT_EQ(buffer->length(), 16U);
}

TEST(Buffer, IsFatalToMakeOfNothing) {
    EXPECT_FATAL(ZebBuffer(0U, 0U), entered("ZebBuffer") + failed("lMallocLength != 0"));
}

TEST(Buffer, IsFatalToMakeWithMoreInUseThanItsMaximum) {
    EXPECT_FATAL(ZebBuffer(20, 10),
                 entered("ZebBuffer") + failed("(acMaxLength == 0 || acUseLength <= acMaxLength)"));
}

TEST(Buffer, ThrowsNoMemoryExWithoutAnExitLine) {
    [[maybe_unused]] const MemoryLimit limit;
    if (!MemoryLimit::holds()) {
        GTEST_SKIP() << "the memory of a program cannot be limited here";
    }
    const LogCapture log;
    EXPECT_EQ(messageOf<NoMemoryEx>([] { const ZebBuffer buffer(0U, 0xffffffff); }), "No Memory\n");
    EXPECT_EQ(log.text(), entered("ZebBuffer"));
}

TEST(Buffer, TracesItsConstructionAndItsEnd) {
    const LogCapture log;
    { const ZebBuffer buffer(1, 0); }
    EXPECT_EQ(log.text(), kConstruction + kFreeing);
}

TEST(Buffer, LeavesWrappedMemoryUntouchedAtItsEnd) {
    const LogCapture log;
    const uint8 data[] = {1, 2, 3};
    { const ZebLocalBuffer buffer(data, 3); }
    EXPECT_EQ(log.text(), kConstruction + kNotFreeing);
    EXPECT_EQ(std::vector<uint8>(data, data + 3), (std::vector<uint8>{1, 2, 3}));
}

TEST(Buffer, WrapsThroughItsOwnConstructorToo) {
    const LogCapture log;
    { const ZebBuffer buffer(kData, 4); }
    EXPECT_EQ(log.text(), kConstruction + kNotFreeing);
}

TEST(Buffer, ReadsTheWrappedMemoryItself) {
    uint8 data[] = {1, 2, 3};
    Wrapping buffer(data, 3U);
    data[1] = 9;
    EXPECT_EQ(buffer->length(), 3U);
    EXPECT_EQ(buffer->byte(1), 9);
    const ZebBuffer& constant = *buffer;
    EXPECT_EQ(static_cast<const uint8*>(constant), data);
}

TEST(Buffer, MayWrapNothing) {
    const uint8* const none = nullptr;
    Wrapping buffer(none, 0U);
    EXPECT_EQ(buffer->length(), 0U);
    const ZebBuffer& constant = *buffer;
    EXPECT_FATAL(static_cast<void>(static_cast<const uint8*>(constant)),
                 entered("operator const uint8*") + failed("this->mcpPointer != __null"));
}

TEST(Buffer, IsFatalToReadWhenItWrapsANullPointer) {
    const uint8* const none = nullptr;
    Wrapping buffer(none, 1U);
    EXPECT_FATAL(buffer->byte(0), entered("byte") + failed("this->mcpPointer != __null"));
}

TEST(Buffer, IsDestroyedThroughItsBase) {
    const LogCapture log;
    const ZebQueueable* const queueable = new ZebBuffer(1, 0);
    delete queueable;
    EXPECT_EQ(log.text(), kConstruction + kFreeing);
}

TEST(Buffer, IsEmptyOnceItsMemoryIsGivenBack) {
    Owning buffer(4U, 8U);
    {
        const LogCapture log;
        buffer->_destroy();
        EXPECT_EQ(log.text(), entered("_destroy") + "Freeing persistent allocated buffer\n" +
                                  "Left Function _destroy Line #\n");
    }
    EXPECT_EQ(buffer->length(), 0U);
    const ZebBuffer& constant = *buffer;
    EXPECT_FATAL(buffer->byte(0), entered("byte") + failed("acOffset < this->mUseLength"));
    EXPECT_FATAL(static_cast<void>(static_cast<const uint8*>(constant)),
                 entered("operator const uint8*") + failed("this->mcpPointer != __null"));
    EXPECT_FATAL(static_cast<void>(static_cast<uint8*>(*buffer)),
                 entered("operator uint8*") + failed("ZebBP_NonPersistent == this->mPersistence"));
    EXPECT_FATAL(buffer->setLength(0),
                 entered("setLength") + failed("ZebBP_NonPersistent == this->mPersistence"));
    EXPECT_FATAL(buffer->erase(), entered("erase") + failed("ZebBP_NonPersistent == this->mPersistence"));
    EXPECT_FATAL(buffer->copy(kData, 1),
                 entered("copy") + failed("acLength != 0 && acLength <= this->mUseLength"));
    EXPECT_FATAL(buffer->append(kData, 1),
                 entered("append") +
                     failed("acLength != 0 && (acLength + this->mUseLength) < this->mMaxLength"));
}

TEST(Buffer, HasNothingLeftToFreeASecondTime) {
    Owning buffer(4U, 0U);
    const LogCapture log;
    buffer->_destroy();
    buffer->_destroy();
    EXPECT_EQ(log.text(), entered("_destroy") + "Freeing persistent allocated buffer\n" +
                              "Left Function _destroy Line #\n" + entered("_destroy") +
                              "Not freeing non-persistent buffer, nullifying pointer\n" +
                              "Left Function _destroy Line #\n");
}

TEST(Buffer, GivesTheBytesInUse) {
    Owning buffer(4U, 8U);
    buffer->copy(kData, 4);
    EXPECT_EQ(buffer->byte(0), 1);
    EXPECT_EQ(buffer->byte(3), 4);
}

TEST(Buffer, IsFatalToReadBehindTheBytesInUse) {
    Owning buffer(4U, 8U);
    EXPECT_FATAL(buffer->byte(4), entered("byte") + failed("acOffset < this->mUseLength"));
    Wrapping wrapping(kData, 4U);
    EXPECT_FATAL(wrapping->byte(4), entered("byte") + failed("acOffset < this->mUseLength"));
}

TEST(Buffer, IsFatalToWriteToWhenItWraps) {
    Wrapping buffer(kData, 4U);
    const std::string condition = failed("ZebBP_NonPersistent == this->mPersistence");
    EXPECT_FATAL(static_cast<void>(static_cast<uint8*>(*buffer)), entered("operator uint8*") + condition);
    EXPECT_FATAL(buffer->setLength(1), entered("setLength") + condition);
    EXPECT_FATAL(buffer->setLength(5), entered("setLength") + condition);
    EXPECT_FATAL(buffer->erase(), entered("erase") + condition);
    EXPECT_FATAL(buffer->copy(kData, 4), entered("copy") + failed("__null != this->mpPointer"));
}

TEST(Buffer, HasNoRoomToAppendToWhenItWraps) {
    Wrapping buffer(kData, 4U);
    EXPECT_FATAL(buffer->append(kData, 1),
                 entered("append") +
                     failed("acLength != 0 && (acLength + this->mUseLength) < this->mMaxLength"));
}

TEST(Buffer, GivesItsBlockToWriteTo) {
    Owning buffer(2U, 0U);
    static_cast<uint8*>(*buffer)[1] = 7;
    EXPECT_EQ(buffer->byte(1), 7);
}

TEST(Buffer, HasOnlyZerosInUseAfterItsLengthIsSet) {
    Owning buffer(8U, 16U);
    static_cast<void>(std::memset(static_cast<uint8*>(*buffer), 0xff, 16));
    buffer->setLength(4);
    EXPECT_EQ(buffer->length(), 4U);
    EXPECT_EQ(block(*buffer, 16), std::vector<uint8>(16, 0));
}

TEST(Buffer, KeepsItsLengthWhenErased) {
    Owning buffer(8U, 16U);
    static_cast<void>(std::memset(static_cast<uint8*>(*buffer), 0xff, 16));
    buffer->erase();
    EXPECT_EQ(buffer->length(), 8U);
    EXPECT_EQ(block(*buffer, 16), std::vector<uint8>(16, 0));
}

TEST(Buffer, CopiesToItsStartAndKeepsItsLength) {
    Owning buffer(4U, 8U);
    buffer->copy(kData, 4);
    const uint8 other[] = {9, 8};
    buffer->copy(other, 2);
    EXPECT_EQ(buffer->length(), 4U);
    EXPECT_EQ(block(*buffer, 8), (std::vector<uint8>{9, 8, 3, 4, 0, 0, 0, 0}));
}

TEST(Buffer, IsFatalToCopyNothingOrMoreThanIsInUse) {
    Owning buffer(3U, 8U);
    const std::string lines = entered("copy") + failed("acLength != 0 && acLength <= this->mUseLength");
    EXPECT_FATAL(buffer->copy(kData, 0), lines);
    EXPECT_FATAL(buffer->copy(kData, 4), lines);
}

TEST(Buffer, AppendsBehindTheBytesInUse) {
    Owning buffer(2U, 8U);
    buffer->append(kData, 4);
    buffer->append(kData, 1);
    EXPECT_EQ(buffer->length(), 7U);
    EXPECT_EQ(block(*buffer, 8), (std::vector<uint8>{0, 0, 1, 2, 3, 4, 1, 0}));
}

TEST(Buffer, IsNeverFullAfterAnAppend) {
    const std::vector<uint8> data(16, 0x55);
    const std::string lines =
        entered("append") + failed("acLength != 0 && (acLength + this->mUseLength) < this->mMaxLength");
    Owning buffer(0U, 16U);
    EXPECT_FATAL(buffer->append(data.data(), 16), lines);
    buffer->append(data.data(), 15);
    EXPECT_EQ(buffer->length(), 15U);
    EXPECT_FATAL(buffer->append(data.data(), 1), lines);
}

TEST(Buffer, IsFatalToAppendNothing) {
    Owning buffer(0U, 16U);
    EXPECT_FATAL(buffer->append(kData, 0),
                 entered("append") +
                     failed("acLength != 0 && (acLength + this->mUseLength) < this->mMaxLength"));
}

TEST(Buffer, IsFatalToAppendALengthWhoseSumWraps) {
    Owning buffer(4U, 16U);
    EXPECT_FATAL(buffer->append(kData, 0xffffffff),
                 entered("append") +
                     failed("acLength != 0 && (acLength + this->mUseLength) < this->mMaxLength"));
}

TEST(Buffer, TracesEveryOperationButItsLength) {
    Owning owning(2U, 8U);
    const ZebBuffer& constant = *owning;
    char text[200] = "";
    const LogCapture log;
    owning->length();
    owning->byte(0);
    static_cast<void>(static_cast<const uint8*>(constant));
    static_cast<void>(static_cast<uint8*>(*owning));
    owning->copy(kData, 2);
    owning->append(kData, 2);
    owning->erase();
    owning->setLength(2);
    owning->writeAscii(text);
    EXPECT_EQ(log.text(), entered("byte") + entered("operator const uint8*") + traced("operator uint8*") +
                              traced("copy") + traced("append") + traced("erase") + traced("setLength") +
                              traced("writeAscii"));
}

TEST(BufferDump, ShowsSixteenBytesALine) {
    Owning buffer(17U, 0U);
    for (uint8 i = 0; i < 17; ++i) {
        static_cast<uint8*>(*buffer)[i] = i;
    }
    char text[200] = "";
    buffer->writeAscii(text);
    EXPECT_STREQ(text, "       0: 00 01 02 03 04 05 06 07 08 09 0A 0B 0C 0D 0E 0F  ................\n"
                       "      16: 10  .\n");
    EXPECT_EQ(std::strchr(text, '\n') - text + 1, 76);
}

TEST(BufferDump, ShowsPrintableBytesAsTextAndOthersAsADot) {
    const uint8 data[] = {'A', 'b', ' ', '~', 0x7F, 0x1F, 0x80, 0xFF, '%'};
    Wrapping buffer(data, 9U);
    char text[200] = "";
    buffer->writeAscii(text);
    EXPECT_STREQ(text, "       0: 41 62 20 7E 7F 1F 80 FF 25  Ab ~....%\n");
}

TEST(BufferDump, IsAppendedToTheTextThatIsThere) {
    Wrapping buffer(kData, 4U);
    char text[200] = "Data:\n";
    buffer->writeAscii(text);
    EXPECT_STREQ(text, "Data:\n       0: 01 02 03 04  ....\n");
}

TEST(BufferDump, ShowsOneLineForSixteenBytesAndNoneForNone) {
    Owning buffer(16U, 0U);
    char text[200] = "";
    buffer->writeAscii(text);
    EXPECT_STREQ(text, "       0: 00 00 00 00 00 00 00 00 00 00 00 00 00 00 00 00  ................\n");
    buffer->setLength(0);
    char none[] = "";
    buffer->writeAscii(none);
    EXPECT_STREQ(none, "");
}

TEST(BufferDump, ShowsTheBytesInUseOnly) {
    Owning buffer(2U, 8U);
    char text[200] = "";
    buffer->writeAscii(text);
    EXPECT_STREQ(text, "       0: 00 00  ..\n");
}

TEST(BufferDump, AsksTheVirtualLength) {
    struct Shorter : ZebBuffer {
        using ZebBuffer::ZebBuffer;
        uint32 length() const override { return 1; }
    };
    Quiet<Shorter> buffer(kData, 4U);
    char text[200] = "";
    buffer->writeAscii(text);
    EXPECT_STREQ(text, "       0: 01  .\n");
}

TEST(BufferDump, RightAlignsAnOffsetInEightColumns) {
    const std::size_t row = 76;
    Owning buffer(1000U * 16 + 1, 0U);
    std::vector<char> text(1001 * row + 1, '\0');
    buffer->writeAscii(text.data());
    const std::string dump = text.data();
    EXPECT_EQ(dump.substr(1000 * row), "   16000: 00  .\n");
}

TEST(BufferOnARefusingLog, IsNotMade) {
    const RefusingLog log;
    EXPECT_EQ(messageOf<WriteFailedEx>([] { const ZebBuffer buffer(1, 0); }), "File write failed\n");
    EXPECT_EQ(messageOf<WriteFailedEx>([] { const ZebLocalBuffer buffer(kData, 4); }), "File write failed\n");
}

TEST(BufferOnARefusingLog, FreesItsBlockWhenTheExitLineOfItsConstructionIsRefused) {
    const RefusingLog log(1);
    EXPECT_EQ(messageOf<WriteFailedEx>([] { const ZebBuffer buffer(1, 0); }), "File write failed\n");
    EXPECT_EQ(log.refusals(), 1);
}

TEST(BufferOnARefusingLog, EndsWithoutItsLinesAndFreesItsBlock) {
    const RefusingLog log(2); // the construction's lines
    { const ZebBuffer buffer(1, 0); }
    EXPECT_EQ(log.refusals(), 1); // it is offered no line behind the first that it refuses
}

TEST(BufferOnARefusingLog, ThrowsFromEveryTracedOperation) {
    Owning buffer(2U, 8U);
    const ZebBuffer& constant = *buffer;
    char text[200] = "";
    const RefusingLog log;
    const std::string message = "File write failed\n";
    EXPECT_EQ(messageOf<WriteFailedEx>([&] { buffer->byte(0); }), message);
    EXPECT_EQ(messageOf<WriteFailedEx>([&] { static_cast<void>(static_cast<const uint8*>(constant)); }),
              message);
    EXPECT_EQ(messageOf<WriteFailedEx>([&] { static_cast<void>(static_cast<uint8*>(*buffer)); }), message);
    EXPECT_EQ(messageOf<WriteFailedEx>([&] { buffer->copy(kData, 1); }), message);
    EXPECT_EQ(messageOf<WriteFailedEx>([&] { buffer->append(kData, 1); }), message);
    EXPECT_EQ(messageOf<WriteFailedEx>([&] { buffer->erase(); }), message);
    EXPECT_EQ(messageOf<WriteFailedEx>([&] { buffer->setLength(1); }), message);
    EXPECT_EQ(messageOf<WriteFailedEx>([&] { buffer->writeAscii(text); }), message);
}

} // namespace
