#include "view/read/inquiry_section.hpp"

#include <algorithm>
#include <array>
#include <cerrno>
#include <system_error>
#include <utility>

#include "view/read/fields.hpp"

namespace view {

namespace {

// At most three texts tell why an identification failed: of page 0x83, of the standard data, of a stale
// entry. Bytes that only look like a log may hold any number of them, and every device would repeat them all.
constexpr std::size_t kMaximumCauses = 4;

constexpr std::string_view kTimedOut = "time-out"; // said by the causes themselves

// What a text says of the identification, with nothing more in it.
struct Failure {
    Text text;
    std::string_view words;
};

constexpr auto kFailures = std::to_array<Failure>({
    {Text::PageMalformed, "page 0x83 is malformed"},
    {Text::PageStatus, "reading page 0x83 ended with a SCSI error"},
    {Text::PageIoctl, "reading page 0x83 failed in the kernel"},
    {Text::PageTimeOut, "reading page 0x83 timed out"},
    {Text::StandardTimeOut, "the standard INQUIRY timed out"},
    {Text::StandardUnsupported, "the device refused the standard INQUIRY"},
    {Text::StandardIoctl, "the standard INQUIRY failed in the kernel"},
    {Text::StandardStatus, "the standard INQUIRY ended with a SCSI error"},
    {Text::StandardMalformed, "its standard INQUIRY data are malformed"},
    {Text::StandardUnparsable, "its standard INQUIRY data could not be read"},
    {Text::StandardExpired, "its entry in the file system is stale"},
});

// The name SAM gives a SCSI status code.
std::string scsiStatusName(unsigned code) {
    switch (code) {
    case 0x08:
        return "BUSY";
    case 0x18:
        return "RESERVATION CONFLICT";
    case 0x28:
        return "TASK SET FULL";
    case 0x30:
        return "ACA ACTIVE";
    case 0x40:
        return "TASK ABORTED";
    default:
        return std::to_string(code);
    }
}

std::string errorName(int number) {
    return "errno " + std::to_string(number) + ", " + std::system_category().message(number);
}

// Whether the device of an SG_IO that failed with this errno has the call at all.
bool speaksScsi(int error) {
    return error != ENOTTY && error != EINVAL && error != ENOSYS && error != EOPNOTSUPP;
}

} // namespace

void InquirySection::take(const TextMatch& match) {
    switch (match.text) {
    case Text::InquiryOpenFailed:
        mDevice = text(match.fields[0]);
        fail("the device node could not be opened: " + text(match.fields[1]));
        break;
    case Text::InquiryTypeFailed:
        if (mAnswers.detail.empty()) {
            mAnswers.detail = withoutLineEnd(match.fields[0]);
        }
        fail(mAnswers.detail == kTimedOut ? "the first INQUIRY timed out" : "the first INQUIRY failed");
        break;
    case Text::InquiryPage:
        mAnswers.pageAsked = true;
        break;
    case Text::Designator:
        mAnswers.lineEnds = mAnswers.lineEnds || match.fields[2].find('\n') != std::string_view::npos;
        break;
    case Text::FoundNaa: // chosen whatever it is
        mAnswers.found.insert(IdentifierKind::Naa);
        break;
    case Text::FoundT10:
        find(IdentifierKind::T10, match.fields[0]);
        break;
    case Text::FoundEui64:
        find(IdentifierKind::Eui64, match.fields[0]);
        break;
    case Text::FoundMd5:
        find(IdentifierKind::Md5, match.fields[0]);
        break;
    case Text::FoundScsiName:
        find(IdentifierKind::ScsiName, match.fields[0]);
        break;
    case Text::ChosenId: // the enumerators stand in the order of preference
        mAnswers.chosen = mAnswers.found.empty() ? IdentifierKind::Unknown : *mAnswers.found.begin();
        break;
    case Text::StandardInquiryId:
        mAnswers.chosen = IdentifierKind::StandardInquiry;
        break;
    case Text::PageUnsupported:
        fail("the device has no page 0x83", false);
        break;
    default:
        takeFailure(match);
        break;
    }
}

void InquirySection::takeDump(const TextMatch& match) {
    Dumping& dumping = mAnswers.dumping;
    std::vector<std::uint8_t>& page = mAnswers.page83;
    switch (match.text) {
    case Text::PageDump:
        page.clear();
        dumping = Dumping::PageNext;
        break;
    case Text::Dump:
        dumping = dumping == Dumping::PageNext ? Dumping::Page : Dumping::Other;
        if (dumping == Dumping::Page) {
            mAnswers.page83Length = toNumber<std::size_t>(match.fields[0]);
        }
        break;
    case Text::DumpByte: // what is out of its turn is none of the page's bytes
        if (dumping == Dumping::Page && page.size() < mAnswers.page83Length &&
            toNumber<std::size_t>(match.fields[0]) == page.size()) {
            page.push_back(static_cast<std::uint8_t>(hexToNumber(match.fields[1])));
        }
        break;
    default:
        break;
    }
}

Page83 InquirySection::takePage83() {
    std::vector<std::uint8_t> page = std::exchange(mAnswers.page83, {});
    page.shrink_to_fit();
    return page.empty() ? nullptr : std::make_shared<const std::vector<std::uint8_t>>(std::move(page));
}

void InquirySection::takeFailure(const TextMatch& match) {
    const auto* const failure = std::find_if(kFailures.begin(), kFailures.end(),
                                             [&](const Failure& known) { return known.text == match.text; });
    if (failure != kFailures.end()) {
        fail(failure->words);
    } else {
        takeScsi(match);
    }
}

void InquirySection::takeScsi(const TextMatch& match) {
    std::string& detail = mAnswers.detail;
    switch (match.text) {
    case Text::ScsiStatus:
        detail = "SCSI status " + scsiStatusName(toNumber<unsigned>(match.fields[1]));
        break;
    case Text::ScsiSense:
        detail = "CHECK CONDITION";
        break;
    case Text::ScsiTransport:
        detail = "the transport failed";
        mAnswers.lost = true;
        break;
    case Text::ScsiTimeOut:
        detail = kTimedOut;
        mAnswers.lost = true;
        break;
    case Text::ScsiIoctl:
        detail = errorName(toNumber<int>(match.fields[0]));
        mAnswers.lost = mAnswers.lost || speaksScsi(toNumber<int>(match.fields[0]));
        break;
    case Text::ScsiInvalidOpcode:
        detail = "ILLEGAL REQUEST, invalid opcode";
        break;
    case Text::ScsiIllegalRequest:
        detail = "ILLEGAL REQUEST";
        break;
    default:
        break;
    }
}

// Notes a designator of one kind; a later one takes the place of the one before, and an empty one is never
// chosen.
void InquirySection::find(IdentifierKind kind, std::string_view designator) {
    if (designator.empty()) {
        mAnswers.found.erase(kind);
    } else {
        mAnswers.found.insert(kind);
    }
}

void InquirySection::sayLineEnds(const std::string& device) {
    if (mAnswers.lineEnds) {
        mDraft.problem(Severity::Problem, ProblemKind::ForeignText, device,
                       "a designator of its page 0x83 holds a line end; what follows it in the log may look "
                       "like Morvane's own lines, but is the device's and not taken for them");
        mAnswers.lineEnds = false;
    }
}

// Notes a cause in the words given, with what the SCSI layer said of the command.
void InquirySection::fail(std::string_view words, bool isFailure) {
    std::string cause(words);
    if (!mAnswers.detail.empty() && mAnswers.detail != kTimedOut) {
        cause += " (" + mAnswers.detail + ")";
    }
    mAnswers.detail.clear();
    if (mAnswers.causes.size() < kMaximumCauses) {
        mAnswers.causes.push_back(std::move(cause));
    }
    mAnswers.failed = mAnswers.failed || isFailure;
}

std::string InquirySection::cause(std::string_view device) const {
    if (hasCause()) {
        return join(mAnswers.causes, "; ");
    }
    if (device.find("/sg") != std::string_view::npos) {
        return "an sg node; only disk nodes are read";
    }
    if (isOfWrongType()) {
        return "its device type is neither disk nor storage array controller";
    }
    return text(kNoCause);
}

} // namespace view
