#include "fc/identity/unique_lun_id.hpp"

#include <cerrno>

#include <gtest/gtest.h>

#include "foundation/exceptions.hpp"
#include "main/shared/run_state.hpp"
#include "scsi/scsi_exceptions.hpp"
#include "tests/fc/identity/unique_lun_id_log.hpp"
#include "tests/support/thrown.hpp"

namespace {

const char* const kDevice = "/dev/sdb";
constexpr uint32 kFc = 1;
constexpr uint32 kDirectAttached = 2;
constexpr uint32 kIscsi = 4;
const uint32 kAllFlags[] = {kFc, kDirectAttached, kIscsi};
const uint32 kFlagsWithFallback[] = {kFc, kIscsi};

// What an old array puts behind the header of page 83h.
const Bytes kRawIdentifier = {0x60, 0x06, 0x04, 0x80, 0x00, 0x01, 0x87, 0x90,
                              0x00, 0x31, 0x53, 0x30, 0x31, 0x30, 0x38, 0x0F};
const std::string kRawIdentifierText = "6006048000018790003153303130380F";
const std::string kZeroIdentifier(32, '0');

Bytes standard(const std::string& vendor) {
    return standardData(0, vendor, "DISK", "1.0", bytesOf("not asked for"));
}

Bytes disk() {
    return standard("ACME");
}

Bytes naaPage() {
    return vpdPage(0x83, designator(kBinaryCodeSet, 0, 3, {0x50, 0x01}));
}

class UniqueLunId : public testing::Test {
protected:
    void SetUp() override { gDirectAttachedFlag = false; }
    void TearDown() override { gDirectAttachedFlag = false; }

    // Asks a device that answers so; returns the identifier.
    std::string ask(const std::deque<SgAnswer>& answers, uint32 requestFlag, const char* device = kDevice) {
        mKernel.answers = answers;
        ZebString identifier("");
        {
            const LogCapture log;
            HA_GetScsiUniqueLunId(device, identifier, requestFlag);
            mLog = withoutAddresses(log.text());
        }
        expectNothingOpen();
        return identifier.c_str();
    }

    // The same for a call that throws; returns the exception's text.
    template <typename Exception>
    std::string refusal(const std::deque<SgAnswer>& answers, uint32 requestFlag,
                        const char* device = kDevice) {
        mKernel.answers = answers;
        ZebString identifier("as before");
        const LogCapture log;
        std::string message =
            messageOf<Exception>([&] { HA_GetScsiUniqueLunId(device, identifier, requestFlag); });
        mLog = withoutAddresses(log.text());
        EXPECT_STREQ(identifier.c_str(), "as before");
        return message;
    }

    // Logs vendor and product of a device that answers so.
    void print(const std::deque<SgAnswer>& answers, const char* device = kDevice) {
        mKernel.answers = answers;
        const LogCapture log;
        HA_PrintVendorProductId(device);
        mLog = log.text();
    }

    template <typename Exception>
    std::string printRefusal(const std::deque<SgAnswer>& answers, const char* device = kDevice) {
        mKernel.answers = answers;
        const LogCapture log;
        std::string message = messageOf<Exception>([&] { HA_PrintVendorProductId(device); });
        mLog = log.text();
        return message;
    }

    void expectNothingOpen() const {
        EXPECT_TRUE(mKernel.openDescriptors.empty());
        EXPECT_EQ(mKernel.closes, static_cast<int>(mKernel.opens.size()));
    }

    FakeKernel mKernel;
    std::string mLog;
};

// A standard inquiry that fails with what `failure` says, which holds no response.
std::string stdInquiryInVain(const std::string& failure) {
    return entered("doStandardInquiry") + madeContext() + "lcAllocLength = 36\n" +
           createdCdb(inquiryCdb(0, 0, 36)) + failure + freedContext() + freedBuffer();
}

std::string processedInVain(const std::string& lines) {
    return traced("doScsiIo") + traced("processResponse", traced("getScsiStatus") + lines);
}

const char* const kCouldNotFind = "Could not find UniqueLunId from VPD Page 83, for device /dev/sdb\n";
const char* const kCaughtEnd =
    " : Adding host name as LUN ID if the device is DAS and rejecting otherwise...\n";

// Ways for a command to fail before any response is handed out.
struct Failure {
    SgAnswer answer;
    std::string log;  // from doScsiIo on
    std::string text; // of the exception
};

Failure timedOut() {
    return {late(10001), traced("doScsiIo") + "Timeout\n", "Timeout\n"};
}

Failure refused() {
    return {pageRefused(), traced("doScsiIo") + "Illegal request in CDB\n", "Illegal request in CDB\n"};
}

Failure ioctlFailed() {
    return {refusedByDriver(ENOTTY), traced("doScsiIo") + "ioctl failed, error code = 25\n\n",
            "ioctl failed, error code = 25\n"};
}

Failure deviceBusy() {
    return {statusOnly(0x08), processedInVain("GotStatus:Category=2; Code=8;\n"), "Scsi Inquiry failed\n"};
}

// Paths.

TEST_F(UniqueLunId, OfAGenericNodeIsRefusedBeforeAnyIo) {
    for (const char* device : {"/dev/sg0", "/dev/sga", "/a/sgx/sdb"}) {
        EXPECT_EQ(refusal<NotSupportedEx>({}, kFc, device), "The /sg? device is not supported");
        EXPECT_EQ(mLog, traced("HA_GetScsiUniqueLunId"));
        EXPECT_EQ(printRefusal<NotSupportedEx>({}, device), "The /sg? device is not supported");
        EXPECT_EQ(mLog, traced("HA_PrintVendorProductId"));
    }
    EXPECT_TRUE(mKernel.opens.empty());
}

TEST_F(UniqueLunId, OpensTheNameUpToItsFirstSemicolon) {
    EXPECT_EQ(ask({good(disk()), good(naaPage()), good(naaPage())}, kFc, "/dev/sdb;/dev/sg1;x"), "5001");
    ASSERT_EQ(mKernel.opens.size(), 1U);
    EXPECT_EQ(mKernel.opens[0].path, "/dev/sdb");
    print({good(disk())}, "/dev/sdc;;");
    EXPECT_EQ(mKernel.opens[1].path, "/dev/sdc");
}

TEST_F(UniqueLunId, ThatIsNotFoundIsReportedWithTheWholeName) {
    ask({good(disk()), pageRefused()}, kDirectAttached, "/dev/sdb;/dev/sg1");
    EXPECT_NE(mLog.find("Could not find UniqueLunId from VPD Page 83, for device /dev/sdb;/dev/sg1\n"),
              std::string::npos);
}

TEST_F(UniqueLunId, OfANodeThatCannotBeOpenedIsNotFound) {
    mKernel.openError = ENOENT;
    EXPECT_EQ(refusal<NotFoundEx>({}, kFc, "/dev/sdz;x"), "Cannot open device for Scsi Inquiry\n");
    EXPECT_EQ(mLog,
              traced("HA_GetScsiUniqueLunId",
                     entered("open") + "Cannot do Scsi Inquiry on /dev/sdz - No such file or directory\n"));
    EXPECT_EQ(mKernel.closes, 0);
}

// The device type.

TEST_F(UniqueLunId, OfAnotherDeviceTypeIsRefusedForEveryTree) {
    const Bytes cdRom = standardData(5, "HL-DT-ST", "DVDRAM", "1.0", bytesOf("X"));
    for (const uint32 flag : kAllFlags) {
        SCOPED_TRACE(flag);
        EXPECT_EQ(refusal<NotSupportedEx>({good(cdRom)}, flag), "Device type not supported");
        EXPECT_EQ(mLog, traced("HA_GetScsiUniqueLunId", traced("open") + askedForType() + traced("close")) +
                            freedBuffer());
        expectNothingOpen();
    }
    EXPECT_FALSE(gDirectAttachedFlag);
}

TEST_F(UniqueLunId, OfAnotherDeviceTypeThatCannotBeClosedIsRefusedTheSame) {
    mKernel.closeError = EIO;
    EXPECT_EQ(refusal<NotSupportedEx>({good(standardData(5, "A", "B", "C", {}))}, kFc),
              "Device type not supported");
    EXPECT_EQ(mLog,
              traced("HA_GetScsiUniqueLunId", traced("open") + askedForType() + entered("close") +
                                                  "Failed to close device handle opened for scsi inquiry") +
                  freedBuffer());
    EXPECT_EQ(mKernel.closes, 1);
}

TEST_F(UniqueLunId, OfADeviceThatCannotBeAskedIsRefusedUnlessDirectAttached) {
    for (const Failure& failure : {timedOut(), refused(), ioctlFailed(), deviceBusy()}) {
        SCOPED_TRACE(failure.text);
        const std::string asked = traced("open") + entered("isDeviceTypeSupported") +
                                  stdInquiryInVain(failure.log) + "Caught exception -> " + failure.text +
                                  kCaughtEnd;
        for (const uint32 flag : kFlagsWithFallback) {
            EXPECT_EQ(refusal<NotSupportedEx>({failure.answer}, flag), "Device type not supported");
            EXPECT_EQ(mLog, traced("HA_GetScsiUniqueLunId", asked + traced("close")));
            expectNothingOpen();
        }
        EXPECT_EQ(ask({failure.answer, good(naaPage()), good(naaPage())}, kDirectAttached), "5001");
        EXPECT_EQ(mLog, entered("HA_GetScsiUniqueLunId") + asked + "Get LunID\n" + readPage(naaPage()) +
                            walkedTo(4, designator(kBinaryCodeSet, 0, 3, {0x50, 0x01}), "5001") +
                            "Found NaaId: 5001 \nOld Unique LunId = 5001, New Unique LunId = 5001\n" +
                            gotIdentifier() + freedBuffer());
        EXPECT_FALSE(gDirectAttachedFlag);
    }
}

TEST_F(UniqueLunId, OfAMalformedStandardInquiryIsRefusedUnlessDirectAttached) {
    const Bytes shortData = {0, 0, 6, 2, 30};
    EXPECT_EQ(refusal<NotSupportedEx>({good(shortData)}, kFc), "Device type not supported");
    EXPECT_EQ(mLog, traced("HA_GetScsiUniqueLunId",
                           traced("open") + entered("isDeviceTypeSupported") + didStandardInquiry() +
                               traced("validateResponse", tookReadPointer() +
                                                              "Standard Inquiry Response is malformed"
                                                              "Expected Response length >= 31 bytes"
                                                              "Actual Response length = 30 bytes") +
                               "Caught exception -> Input does not represent std inquiry response" +
                               kCaughtEnd + traced("close")) +
                        freedBuffer());
    EXPECT_EQ(ask({good(shortData), good(naaPage()), good(naaPage())}, kDirectAttached), "5001");
}

TEST_F(UniqueLunId, OfADirectAttachedDeviceThatAnswersNothingIsEmpty) {
    EXPECT_EQ(ask({refusedByDriver(ENOTTY), refusedByDriver(ENOTTY)}, kDirectAttached), "");
    EXPECT_TRUE(gDirectAttachedFlag);
    EXPECT_EQ(mLog, entered("HA_GetScsiUniqueLunId") + traced("open") + entered("isDeviceTypeSupported") +
                        stdInquiryInVain(ioctlFailed().log) +
                        "Caught exception -> ioctl failed, error code = 25\n" + kCaughtEnd + "Get LunID\n" +
                        readPageInVain(ioctlFailed().log) + "SCSI Ioctl Failure for VPD 0x83 Page\n" +
                        kCouldNotFind + gotIdentifier());
}

// The commands.

TEST_F(UniqueLunId, GivesEveryCommandTenSeconds) {
    ask({good(disk()), good(vpdPage(0x83, kRawIdentifier)), good(vpdPage(0x83, kRawIdentifier)),
         good(disk())},
        kFc);
    std::vector<Bytes> cdbs;
    for (const SgCommand& command : mKernel.commands) {
        EXPECT_EQ(command.timeout, 10000U);
        EXPECT_EQ(command.transferLength, 256U);
        EXPECT_EQ(command.fd, FakeKernel::kFirstFd);
        cdbs.push_back(command.cdb);
    }
    EXPECT_EQ(cdbs, (std::vector<Bytes>{{0x12, 0, 0, 0, 36, 0},
                                        {0x12, 1, 0x83, 0, 4, 0},
                                        {0x12, 1, 0x83, 0, 20, 0},
                                        {0x12, 0, 0, 0, 36, 0}}));
}

// Designators.

std::deque<SgAnswer> diskWith(const Bytes& page) {
    return {good(disk()), good(page), good(page)};
}

const Bytes kT10 = designator(kAsciiCodeSet, 0, 1, bytesOf("T10 X  "));
const Bytes kEui64 = designator(kBinaryCodeSet, 0, 2, {0x00, 0x01});
const Bytes kNaa = designator(kBinaryCodeSet, 0, 3, {0x60, 0x0A});
const Bytes kMd5 = designator(kBinaryCodeSet, 0, 7, {0xFF});
const Bytes kScsiName = designator(kUtf8CodeSet, 0, 8, bytesOf("eui.1"));

TEST_F(UniqueLunId, IsTheNaaDesignatorAndNothingBehindItIsRead) {
    const Bytes page = vpdPage(0x83, joined({kT10, kNaa, kEui64}));
    EXPECT_EQ(ask(diskWith(page), kFc), "600A");
    EXPECT_EQ(mLog, entered("HA_GetScsiUniqueLunId") + openedDisk() + readPage(page) +
                        walkedTo(4, kT10, "T10 X  ") + "Found T10 Id: T10 X \n" + walkedTo(15, kNaa, "600A") +
                        "Found NaaId: 600A \n" + "Old Unique LunId = T10 X, New Unique LunId = 600A\n" +
                        gotIdentifier() + freedBuffer() + freedBuffer());
}

TEST_F(UniqueLunId, IsEui64BeforeScsiName) {
    EXPECT_EQ(ask(diskWith(vpdPage(0x83, joined({kEui64, kScsiName}))), kFc), "0001");
    EXPECT_EQ(ask(diskWith(vpdPage(0x83, joined({kScsiName, kEui64}))), kFc), "0001");
}

TEST_F(UniqueLunId, IsScsiNameBeforeMd5) {
    EXPECT_EQ(ask(diskWith(vpdPage(0x83, joined({kMd5, kScsiName}))), kFc), "eui.1");
    EXPECT_EQ(ask(diskWith(vpdPage(0x83, joined({kScsiName, kMd5}))), kFc), "eui.1");
}

TEST_F(UniqueLunId, LeavesOutDesignatorsOfPortAndTargetEvenNaa) {
    for (const uint8 association : Bytes{1, 2, 3}) {
        const Bytes naa = designator(kBinaryCodeSet, association, 3, {0x50, 0x01});
        EXPECT_EQ(ask(diskWith(vpdPage(0x83, joined({naa, kMd5}))), kFc), "FF");
        EXPECT_EQ(mLog.find("NaaId"), std::string::npos);
    }
}

TEST_F(UniqueLunId, NotesOtherTypesBelow10WithoutALineEnd) {
    for (const uint8 type : Bytes{0, 4, 5, 6, 9}) {
        SCOPED_TRACE(static_cast<int>(type));
        const Bytes other = designator(kBinaryCodeSet, 0, type, {0x00, 0x01});
        const Bytes page = vpdPage(0x83, joined({other, kMd5}));
        EXPECT_EQ(ask(diskWith(page), kFc), "FF");
        EXPECT_EQ(mLog, entered("HA_GetScsiUniqueLunId") + openedDisk() + readPage(page) +
                            walkedTo(4, other, "0001") + "Default ID recieved" + walkedTo(10, kMd5, "FF") +
                            "Found MD5ID: FF \n" + walkedToEnd() +
                            "Old Unique LunId = FF, New Unique LunId = FF\n" + gotIdentifier() +
                            freedBuffer() + freedBuffer());
    }
}

TEST_F(UniqueLunId, PassesOverReservedTypesWithoutALine) {
    for (uint8 type = 10; type <= 15; ++type) {
        SCOPED_TRACE(static_cast<int>(type));
        const Bytes reserved = designator(kBinaryCodeSet, 0, type, {0x00, 0x01});
        const Bytes page = vpdPage(0x83, joined({reserved, kMd5}));
        EXPECT_EQ(ask(diskWith(page), kFc), "FF");
        EXPECT_EQ(mLog, entered("HA_GetScsiUniqueLunId") + openedDisk() + readPage(page) +
                            walkedTo(4, reserved, "0001") + walkedTo(10, kMd5, "FF") + "Found MD5ID: FF \n" +
                            walkedToEnd() + "Old Unique LunId = FF, New Unique LunId = FF\n" +
                            gotIdentifier() + freedBuffer() + freedBuffer());
    }
}

TEST_F(UniqueLunId, PassesOverAnUndefinedCodeSet) {
    const Bytes odd = designator(0, 0, 3, {0x50, 0x01});
    const Bytes page = vpdPage(0x83, joined({odd, kNaa}));
    EXPECT_EQ(ask(diskWith(page), kFc), "600A");
    EXPECT_EQ(mLog,
              entered("HA_GetScsiUniqueLunId") + openedDisk() + readPage(page) +
                  traced("getDiPageIdentifierAscii",
                         tookReadPointer() + "Going to Extract Data from Descriptor @ 4\n" + dumped(odd) +
                             "Identifier format is undefined.\n"
                             "ID Type: 0ffffffff; Association type: 0ffffffff; Identifier: ''\n") +
                  walkedTo(10, kNaa, "600A") + "Found NaaId: 600A \n" +
                  "Old Unique LunId = 600A, New Unique LunId = 600A\n" + gotIdentifier() + freedBuffer() +
                  freedBuffer());
}

TEST_F(UniqueLunId, TakesTheLastDesignatorOfAKindAndRemembersTheFirst) {
    const Bytes first = designator(kAsciiCodeSet, 0, 1, bytesOf("FIRST"));
    const Bytes last = designator(kAsciiCodeSet, 0, 1, bytesOf("LAST"));
    EXPECT_EQ(ask(diskWith(vpdPage(0x83, joined({first, last}))), kFc), "LAST");
    EXPECT_NE(mLog.find("Old Unique LunId = FIRST, New Unique LunId = LAST\n"), std::string::npos);
}

TEST_F(UniqueLunId, ABlankDesignatorOverwritesAnEarlierOneOfItsKind) {
    const Bytes blank = designator(kAsciiCodeSet, 0, 1, bytesOf("    "));
    EXPECT_EQ(ask(diskWith(vpdPage(0x83, joined({kT10, blank, kMd5}))), kFc), "FF");
    EXPECT_NE(mLog.find("Found T10 Id:  \n"), std::string::npos);
    EXPECT_NE(mLog.find("Old Unique LunId = T10 X, New Unique LunId = FF\n"), std::string::npos);
    EXPECT_EQ(ask(diskWith(vpdPage(0x83, joined({kT10, blank}))), kFc), ""); // found, though nothing is left
    EXPECT_NE(mLog.find("Old Unique LunId = T10 X, New Unique LunId = \n"), std::string::npos);
}

TEST_F(UniqueLunId, OfBlankDesignatorsOnlyIsNotFound) {
    const Bytes blank = designator(kAsciiCodeSet, 0, 1, bytesOf("    "));
    std::deque<SgAnswer> answers = diskWith(vpdPage(0x83, blank));
    answers.push_back(good(disk()));
    EXPECT_EQ(ask(answers, kFc), "ACME:DISK:1.0:");
}

TEST_F(UniqueLunId, OfAnEmptyNaaDesignatorIsEmpty) {
    EXPECT_EQ(ask(diskWith(vpdPage(0x83, designator(kBinaryCodeSet, 0, 3, {}))), kFc), "");
    EXPECT_NE(mLog.find("Found NaaId:  \nOld Unique LunId = , New Unique LunId = \n"), std::string::npos);
    EXPECT_FALSE(gDirectAttachedFlag);
}

TEST_F(UniqueLunId, KeepsWhatItFoundBeforeTheMalformedPart) {
    const Bytes cut = {1, 3, 0, 200};
    const Bytes page = vpdPage(0x83, joined({kEui64, cut}));
    EXPECT_EQ(ask(diskWith(page), kFc), "0001");
    EXPECT_EQ(mLog, entered("HA_GetScsiUniqueLunId") + openedDisk() + readPage(page) +
                        walkedTo(4, kEui64, "0001") + "Found Eui64Id: 0001 \n" + walkedMalformed() +
                        "Old Unique LunId = 0001, New Unique LunId = 0001\n" + gotIdentifier() +
                        freedBuffer() + freedBuffer());
}

TEST_F(UniqueLunId, OfALongDesignatorIsWhole) {
    std::string expected;
    for (int i = 0; i < 200; ++i) {
        expected += "C5";
    }
    EXPECT_EQ(ask(diskWith(vpdPage(0x83, designator(kBinaryCodeSet, 0, 3, Bytes(200, 0xC5)))), kFc),
              expected);
}

// What goes wrong with the page.

struct PageFailure {
    std::deque<SgAnswer> answers; // of the page's commands
    std::string log;
    bool isScsiFailure;
    bool isShared; // a response was handed out
};

std::vector<PageFailure> pageFailures() {
    const Bytes port = designator(kBinaryCodeSet, 1, 3, {0x50, 0x01});
    const Bytes portPage = vpdPage(0x83, port);
    const Bytes rawPage = vpdPage(0x83, kRawIdentifier);
    return {
        {{good(portPage), good(portPage)},
         readPage(portPage) + walkedTo(4, port, "5001") + walkedToEnd(),
         false,
         true},
        {{good(rawPage), good(rawPage)}, readPage(rawPage) + walkedMalformed(), false, true},
        {{deviceBusy().answer},
         readPageInVain(deviceBusy().log) + "SCSI Error for VPD 0x83 Inquiry\n",
         true,
         false},
        {{ioctlFailed().answer},
         readPageInVain(ioctlFailed().log) + "SCSI Ioctl Failure for VPD 0x83 Page\n",
         true,
         false},
        {{refused().answer}, readPageInVain(refused().log) + "VPD Page 0x83 not supported\n", false, false},
        {{timedOut().answer},
         readPageInVain(timedOut().log) + "Time-out in Reading VPD 0x83 Page\n",
         true,
         false},
    };
}

std::deque<SgAnswer> diskThen(const PageFailure& failure) {
    std::deque<SgAnswer> answers = failure.answers;
    answers.push_front(good(disk()));
    return answers;
}

std::string freedResponses(const PageFailure& failure) {
    return freedBuffer() + (failure.isShared ? freedBuffer() : "");
}

TEST_F(UniqueLunId, OfAnyPageFailureIsEmptyForADirectAttachedDevice) {
    for (const PageFailure& failure : pageFailures()) {
        SCOPED_TRACE(failure.log);
        gDirectAttachedFlag = false;
        EXPECT_EQ(ask(diskThen(failure), kDirectAttached), "");
        EXPECT_TRUE(gDirectAttachedFlag);
        EXPECT_EQ(mLog, entered("HA_GetScsiUniqueLunId") + openedDisk() + failure.log + kCouldNotFind +
                            gotIdentifier() + freedResponses(failure));
    }
}

TEST_F(UniqueLunId, OfAPageThatCouldNotBeReadIsNotFound) {
    for (const PageFailure& failure : pageFailures()) {
        if (!failure.isScsiFailure) {
            continue;
        }
        SCOPED_TRACE(failure.log);
        for (const uint32 flag : kFlagsWithFallback) {
            EXPECT_EQ(refusal<NotFoundEx>(diskThen(failure), flag), "Can't get ULID using SCSI\n");
            EXPECT_EQ(mLog, entered("HA_GetScsiUniqueLunId") + openedDisk() + failure.log + kCouldNotFind +
                                traced("close") + "Can't get ULID using Scsi\n" +
                                left("HA_GetScsiUniqueLunId") + freedResponses(failure));
            expectNothingOpen();
            EXPECT_FALSE(gDirectAttachedFlag);
        }
    }
}

TEST_F(UniqueLunId, OfAPageWithoutIdentifierIsMadeOfStandardData) {
    for (const PageFailure& failure : pageFailures()) {
        if (failure.isScsiFailure) {
            continue;
        }
        SCOPED_TRACE(failure.log);
        std::deque<SgAnswer> answers = diskThen(failure);
        answers.push_back(good(disk()));
        for (const uint32 flag : kFlagsWithFallback) {
            EXPECT_EQ(ask(answers, flag), "ACME:DISK:1.0:");
            EXPECT_EQ(mLog, entered("HA_GetScsiUniqueLunId") + openedDisk() + failure.log + kCouldNotFind +
                                didStandardInquiry(freedBuffer()) + gotField(0) +
                                "InqBuffer # Vendor ACME \n" + gotField(1) + gotField(2) + gotField(3) +
                                "UniqueLunId from Standard Inquiry = ACME:DISK:1.0:\n" + traced("close") +
                                left("HA_GetScsiUniqueLunId") + freedResponses(failure));
            EXPECT_FALSE(gDirectAttachedFlag);
        }
    }
}

TEST_F(UniqueLunId, OfAPageThatTimesOutIsNotFoundOrEmpty) {
    EXPECT_EQ(refusal<NotFoundEx>({good(disk()), hostFailure(3)}, kFc), "Can't get ULID using SCSI\n");
    EXPECT_FALSE(gDirectAttachedFlag);
    EXPECT_EQ(ask({good(disk()), hostFailure(3)}, kDirectAttached), "");
    EXPECT_TRUE(gDirectAttachedFlag);
}

TEST_F(UniqueLunId, OfAnEmptyPageIsMadeOfStandardData) {
    // An empty page is one that the device does not support.
    EXPECT_EQ(ask({good(disk()), good(vpdPage(0x83, {})), good(disk())}, kFc), "ACME:DISK:1.0:");
    EXPECT_NE(mLog.find("Identification descriptor list not returned\n"), std::string::npos);
    EXPECT_NE(mLog.find("VPD Page 0x83 not supported\n"), std::string::npos);
}

// Standard data instead of the page.

TEST_F(UniqueLunId, OfStandardDataTrimsEveryField) {
    // Of 36 bytes asked for, those behind them come only from a device that does not count.
    SgAnswer answer = good(standardData(0, "IBM", "", "2.1", bytesOf("S 1   ")));
    answer.overruns = true;
    EXPECT_EQ(ask({good(disk()), pageRefused(), answer}, kFc), "IBM::2.1:S 1");
}

TEST_F(UniqueLunId, OfAnEmcDeviceThatRefusesThePageIs32Zeros) {
    for (const uint32 flag : kFlagsWithFallback) {
        EXPECT_EQ(ask({good(disk()), pageRefused(), good(standard("EMC"))}, flag), kZeroIdentifier);
        EXPECT_EQ(mLog, entered("HA_GetScsiUniqueLunId") + openedDisk() + readPageInVain(refused().log) +
                            "VPD Page 0x83 not supported\n" + kCouldNotFind +
                            didStandardInquiry(freedBuffer()) + gotField(0) + "InqBuffer # Vendor EMC \n" +
                            "UniqueLunId from Standard Inquiry = 00000000000000000000000000000000\n" +
                            traced("close") + left("HA_GetScsiUniqueLunId") + freedBuffer());
    }
    EXPECT_EQ(ask({good(disk()), pageRefused()}, kDirectAttached), "");
}

TEST_F(UniqueLunId, OfAnOldEmcArrayIsThe16BytesBehindThePageHeader) {
    const Bytes page = vpdPage(0x83, kRawIdentifier);
    for (const uint32 flag : kFlagsWithFallback) {
        EXPECT_EQ(ask({good(disk()), good(page), good(page), good(standard("EMC"))}, flag),
                  kRawIdentifierText);
        EXPECT_EQ(mLog, entered("HA_GetScsiUniqueLunId") + openedDisk() + readPage(page) + walkedMalformed() +
                            kCouldNotFind + didStandardInquiry(freedBuffer()) + gotField(0) +
                            "InqBuffer # Vendor EMC \n" + tookReadPointer() +
                            "UniqueLunId from Standard Inquiry = " + kRawIdentifierText + "\n" +
                            traced("close") + left("HA_GetScsiUniqueLunId") + freedBuffer() + freedBuffer());
    }
}

TEST_F(UniqueLunId, OfAnEmcDeviceWithoutUsableDesignatorIsWhatStandsThere) {
    const Bytes page = vpdPage(0x83, designator(kBinaryCodeSet, 1, 3, {0x50, 0x01}));
    EXPECT_EQ(ask({good(disk()), good(page), good(page), good(standard("EMC"))}, kFc),
              "01130002500100000000000000000000"); // bytes that were not sent are zeros
}

TEST_F(UniqueLunId, OfAnEmcDeviceThatRefusesTheWholePageIs32Zeros) {
    // The header's length bytes go when the second command is made.
    EXPECT_EQ(
        ask({good(disk()), good(vpdPage(0x83, kRawIdentifier)), pageRefused(), good(standard("EMC"))}, kFc),
        kZeroIdentifier);
}

TEST_F(UniqueLunId, OfAnEmcDeviceWithAnEmptyPageIs32Zeros) {
    EXPECT_EQ(ask({good(disk()), good(vpdPage(0x83, {})), good(standard("EMC"))}, kFc), kZeroIdentifier);
}

TEST_F(UniqueLunId, OfAnEmcDeviceWhosePageCouldNotBeReadIsNotFound) {
    EXPECT_EQ(refusal<NotFoundEx>({good(standard("EMC")), statusOnly(0x08)}, kFc),
              "Can't get ULID using SCSI\n");
}

TEST_F(UniqueLunId, TakesOnlyTheWholeVendorForEmc) {
    EXPECT_EQ(ask({good(disk()), pageRefused(), good(standard("EMC2"))}, kFc), "EMC2:DISK:1.0:");
    EXPECT_EQ(ask({good(disk()), pageRefused(), good(standard(" EMC"))}, kFc), " EMC:DISK:1.0:");
}

TEST_F(UniqueLunId, OfANetappDeviceThatRefusesThePageHasExpiredAndStaysOpen) {
    EXPECT_EQ(refusal<ExpiredEx>({good(disk()), pageRefused(), good(standard("NETAPP"))}, kFc),
              "Netapp device has expired\n");
    EXPECT_EQ(mLog, entered("HA_GetScsiUniqueLunId") + openedDisk() + readPageInVain(refused().log) +
                        "VPD Page 0x83 not supported\n" + kCouldNotFind + didStandardInquiry(freedBuffer()) +
                        gotField(0) + "InqBuffer # Vendor NETAPP \n" +
                        "Device entry in file system is stale.. ignoring it\n" +
                        left("HA_GetScsiUniqueLunId") + freedBuffer());
    EXPECT_EQ(mKernel.openDescriptors, std::set<int>{FakeKernel::kFirstFd});
    EXPECT_EQ(mKernel.closes, 0);
}

TEST_F(UniqueLunId, OfANetappDeviceWithAMalformedPageIsMadeOfStandardData) {
    const Bytes page = vpdPage(0x83, kRawIdentifier);
    EXPECT_EQ(ask({good(disk()), good(page), good(page), good(standard("NETAPP"))}, kFc), "NETAPP:DISK:1.0:");
}

TEST_F(UniqueLunId, OfANetappDeviceThatIsDirectAttachedIsEmpty) {
    EXPECT_EQ(ask({good(standard("NETAPP")), pageRefused()}, kDirectAttached), "");
    EXPECT_TRUE(gDirectAttachedFlag);
}

// What goes wrong with the standard inquiry, in either function.

class StdInquiryFailure : public UniqueLunId {
protected:
    // The log of a call that fails at the standard inquiry, whose lines are `inquiry`.
    static std::string identifierInVain(const std::string& inquiry, const std::string& line,
                                        const std::string& freed) {
        return entered("HA_GetScsiUniqueLunId") + openedDisk() + readPageInVain(refused().log) +
               "VPD Page 0x83 not supported\n" + kCouldNotFind + inquiry + line + traced("close") +
               left("HA_GetScsiUniqueLunId") + freed;
    }

    static std::string vendorInVain(const std::string& inquiry, const std::string& line) {
        return traced("HA_PrintVendorProductId", traced("open") + inquiry + line + traced("close"));
    }

    // Both functions must log the line, close the device and throw the inquiry's exception on.
    template <typename Exception>
    void expectFailure(const Failure& failure, const std::string& line) {
        for (const uint32 flag : kFlagsWithFallback) {
            EXPECT_EQ(refusal<Exception>({good(disk()), pageRefused(), failure.answer}, flag), failure.text);
            EXPECT_EQ(mLog, identifierInVain(stdInquiryInVain(failure.log), line, freedBuffer()));
            expectNothingOpen();
        }
        EXPECT_EQ(printRefusal<Exception>({failure.answer}), failure.text);
        EXPECT_EQ(mLog, vendorInVain(stdInquiryInVain(failure.log), line));
        expectNothingOpen();
    }

    // Throws in the command that `others` more go before.
    template <typename Exception>
    void throwAfter(int others) {
        mKernel.beforeCommand = [this, others, sent = 0]() mutable {
            if (sent++ == others) {
                ++mKernel.timesAsked; // the time after a command that is not sent
                throw Exception("odd\n");
            }
        };
    }
};

TEST_F(StdInquiryFailure, TimeOut) {
    expectFailure<TimeOutEx>(timedOut(), "Time-out in Getting Std Inquiry Data\n");
}

TEST_F(StdInquiryFailure, NotSupported) {
    expectFailure<NotSupportedEx>(refused(), "Std Inquiry Data not supported\n");
}

TEST_F(StdInquiryFailure, Ioctl) {
    expectFailure<ScsiIoctlEx>(ioctlFailed(), "SCSI Ioctl Failure for Std Inquiry Data\n");
}

TEST_F(StdInquiryFailure, Status) {
    expectFailure<ScsiStatusEx>(deviceBusy(), "SCSI Error for Std Inquiry Data\n");
}

TEST_F(StdInquiryFailure, MalformedData) {
    const Bytes shortData = {0, 0, 6, 2, 30};
    const std::string field =
        entered("sGetStdInqField") +
        traced("getInquiryFieldAscii", tookReadPointer() + "Peripheral type from standard enquiry = 0\n"
                                                           "Standard Inquiry Response is malformed\n"
                                                           "Expected Response length >= 31 bytes\n"
                                                           "Actual Response length = 30 bytes\n");
    const std::string line = "Unexpected Malformed Std Inquiry Data\n";
    EXPECT_EQ(refusal<InvalidEx>({good(disk()), pageRefused(), good(shortData)}, kFc),
              "Input does not represent std inquiry response\n");
    EXPECT_EQ(mLog, identifierInVain(didStandardInquiry(freedBuffer()) + field, line, freedBuffer()));
    expectNothingOpen();
    EXPECT_EQ(printRefusal<InvalidEx>({good(shortData)}), "Input does not represent std inquiry response\n");
    EXPECT_EQ(mLog, entered("HA_PrintVendorProductId") + traced("open") + didStandardInquiry() + field +
                        line + traced("close") + left("HA_PrintVendorProductId") + freedBuffer());
    expectNothingOpen();
}

TEST_F(StdInquiryFailure, NoUndocumentedId) {
    const Bytes data = standardData(0, "ACME", "DISK", "1.0", {});
    EXPECT_EQ(refusal<InvalidEx>({good(disk()), pageRefused(), good(data)}, kFc),
              "No bytes for undocumented ID\n");
    EXPECT_EQ(mLog, identifierInVain(
                        didStandardInquiry(freedBuffer()) + gotField(0) + "InqBuffer # Vendor ACME \n" +
                            gotField(1) + gotField(2) + entered("sGetStdInqField") +
                            traced("getInquiryFieldAscii",
                                   tookReadPointer() + "Peripheral type from standard enquiry = 0\n"
                                                       "Going to extract Inquiry data for field type: 3\n"
                                                       "No bytes for undocumented ID\n"),
                        "Unexpected Malformed Std Inquiry Data\n", freedBuffer()));
    expectNothingOpen();
}

// No device makes a standard inquiry end so; the kernel's side does it here.
TEST_F(StdInquiryFailure, NothingFound) {
    const std::string inquiry = stdInquiryInVain(entered("doScsiIo"));
    const std::string line = "Problem parsing Std Inquiry Data\n";
    throwAfter<NotFoundEx>(2);
    EXPECT_EQ(refusal<NotFoundEx>({good(disk()), pageRefused()}, kFc), "odd\n");
    EXPECT_EQ(mLog, identifierInVain(inquiry, line, freedBuffer()));
    expectNothingOpen();
    throwAfter<NotFoundEx>(0);
    EXPECT_EQ(printRefusal<NotFoundEx>({}), "odd\n");
    EXPECT_EQ(mLog, vendorInVain(inquiry, line));
    expectNothingOpen();
}

TEST_F(StdInquiryFailure, AnyOtherPassesThroughAndTheDeviceIsClosed) {
    throwAfter<NoMemoryEx>(2);
    EXPECT_EQ(refusal<NoMemoryEx>({good(disk()), pageRefused()}, kFc), "odd\n");
    EXPECT_EQ(mLog, entered("HA_GetScsiUniqueLunId") + openedDisk() + readPageInVain(refused().log) +
                        "VPD Page 0x83 not supported\n" + kCouldNotFind +
                        stdInquiryInVain(entered("doScsiIo")) + freedBuffer() + traced("close"));
    expectNothingOpen();
}

TEST_F(UniqueLunId, AnyOtherFailureOfThePagePassesThroughAndTheDeviceIsClosed) {
    mKernel.beforeCommand = [this, sent = 0]() mutable {
        if (sent++ == 1) {
            ++mKernel.timesAsked;
            throw NoMemoryEx("odd\n");
        }
    };
    EXPECT_EQ(refusal<NoMemoryEx>({good(disk())}, kDirectAttached), "odd\n");
    EXPECT_EQ(mLog, entered("HA_GetScsiUniqueLunId") + openedDisk() + readPageInVain(entered("doScsiIo")) +
                        freedBuffer() + traced("close"));
    expectNothingOpen();
}

TEST_F(StdInquiryFailure, WeighsMoreThanAFailureToClose) {
    mKernel.closeError = EIO;
    EXPECT_EQ(refusal<TimeOutEx>({good(disk()), pageRefused(), late(10001)}, kFc), "Timeout\n");
    EXPECT_EQ(mKernel.closes, 1);
}

TEST_F(UniqueLunId, AFailureToClosePassesThroughWhereNothingElseFailed) {
    mKernel.closeError = EIO;
    const auto askFor = [this](const std::deque<SgAnswer>& answers) {
        mKernel.answers = answers;
        const int before = mKernel.closes;
        uint32 flag = kFc;
        ZebString identifier("");
        const LogCapture log;
        EXPECT_EQ(messageOf<CloseFailedEx>([&] { HA_GetScsiUniqueLunId(kDevice, identifier, flag); }),
                  "Input/output error");
        EXPECT_EQ(mKernel.closes, before + 1);
        return log.text();
    };
    const std::string end = entered("close") + freedBuffer();
    EXPECT_TRUE(askFor({good(disk()), good(naaPage()), good(naaPage())}).ends_with(end + freedBuffer()));
    EXPECT_TRUE(askFor({good(disk()), statusOnly(0x08)}).ends_with(end));
    EXPECT_TRUE(askFor({good(disk()), pageRefused(), good(disk())}).ends_with(end));
}

// Vendor, product and revision.

TEST_F(UniqueLunId, VendorAndProductAreLoggedWithoutTheirBlanks) {
    print({good(standardData(0x0C, "EMC", "SYMMETRIX", "5 1", {}))});
    const auto field = [&](const std::string& number) {
        return traced("sGetStdInqField",
                      traced("getInquiryFieldAscii", tookReadPointer() +
                                                         "Peripheral type from standard enquiry = 12\n"
                                                         "Going to extract Inquiry data for field type: " +
                                                         number + "\n"));
    };
    EXPECT_EQ(mLog, entered("HA_PrintVendorProductId") + traced("open") + didStandardInquiry() + field("0") +
                        field("1") + field("2") + "Vendor EMC ProductId SYMMETRIX ProductRev 5 1\n" +
                        traced("close") + left("HA_PrintVendorProductId") + freedBuffer());
    expectNothingOpen();
}

TEST_F(UniqueLunId, VendorOfAPowerPathNodeOfAnotherSystemIsRefusedBeforeAnyIo) {
    EXPECT_EQ(printRefusal<NotSupportedEx>({}, "/dev/hdiskpower3"),
              "The EMC PowerPath /dev/hdiskpower device is not supported");
    EXPECT_EQ(mLog, traced("HA_PrintVendorProductId"));
    EXPECT_TRUE(mKernel.opens.empty());
    EXPECT_EQ(ask({good(disk()), good(naaPage()), good(naaPage())}, kFc, "/dev/hdiskpower3"), "5001");
}

TEST_F(UniqueLunId, VendorOfANodeThatCannotBeOpenedIsNotFound) {
    mKernel.openError = EACCES;
    EXPECT_EQ(printRefusal<NotFoundEx>({}), "Cannot open device for Scsi Inquiry\n");
    EXPECT_EQ(mLog, traced("HA_PrintVendorProductId",
                           entered("open") + "Cannot do Scsi Inquiry on /dev/sdb - Permission denied\n"));
}

TEST_F(UniqueLunId, VendorOfAnyDeviceTypeIsLogged) {
    print({good(standardData(5, "HL-DT-ST", "DVDRAM", "1.0", {}))});
    EXPECT_NE(mLog.find("Vendor HL-DT-ST ProductId DVDRAM ProductRev 1.0\n"), std::string::npos);
}

// One field.

TEST(StdInqField, HasNoTrailingBlanks) {
    ZebScsiInquiry inquiry;
    ZebString text("");
    std::string heard;
    {
        const LogCapture unheard;
        const ZebScsiInquiry::Response response =
            responseOf(standardData(0, "EMC", "A B", "", bytesOf("Y ")));
        {
            const LogCapture log;
            sGetStdInqField(inquiry, response, VendorId, text);
            heard = log.text();
        }
        EXPECT_STREQ(text.c_str(), "EMC");
        sGetStdInqField(inquiry, response, ProductId, text);
        EXPECT_STREQ(text.c_str(), "A B");
        sGetStdInqField(inquiry, response, ProductRevision, text);
        EXPECT_STREQ(text.c_str(), "");
        sGetStdInqField(inquiry, response, UndocumentedId, text);
        EXPECT_STREQ(text.c_str(), "Y");
    }
    EXPECT_EQ(heard, gotField(0));
}

TEST(StdInqField, LeavesItsFailuresToTheCaller) {
    const LogCapture unheard;
    ZebScsiInquiry inquiry;
    ZebString text("as before");
    const ZebScsiInquiry::Response response = responseOf(disk());
    const LogCapture log;
    EXPECT_EQ(messageOf<NotFoundEx>([&] { sGetStdInqField(inquiry, response, 4, text); }),
              "Field type 4 is not supported\n");
    EXPECT_EQ(log.text(), entered("sGetStdInqField") +
                              traced("getInquiryFieldAscii",
                                     tookReadPointer() + "Peripheral type from standard enquiry = 0\n"
                                                         "Going to extract Inquiry data for field type: 4\n"
                                                         "Field type 4 is not supported\n\n"));
    EXPECT_STREQ(text.c_str(), "as before");
}

} // namespace
