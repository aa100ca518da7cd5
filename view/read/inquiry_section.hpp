#pragma once

#include <cstddef>
#include <cstdint>
#include <set>
#include <string>
#include <string_view>
#include <vector>

#include "view/model/model.hpp"
#include "view/read/draft.hpp"
#include "view/read/text_matcher.hpp"

namespace view {

// Reads what the log says of the device that is being identified: which SCSI commands failed and why, where
// the identifier came from.
class InquirySection {
public:
    explicit InquirySection(Draft& draft) : mDraft(draft) {}

    // Takes a text of Section::Inquiry.
    void take(const TextMatch& match);

    // Takes a text that no section has to itself: of a dump of page 83h it keeps the bytes.
    void takeDump(const TextMatch& match);

    // Forgets everything but the device: the next identification begins.
    void begin() { mAnswers = {}; }

    // Says that the designators of a device hold line ends, if they do. For where the log names a device only
    // behind its identification.
    void sayLineEnds(const std::string& device);

    // Names the device that is being identified; empty when the log does not tell.
    void setDevice(std::string_view device) { mDevice = device; }
    [[nodiscard]] const std::string& device() const { return mDevice; }

    // Where the identifier came from.
    [[nodiscard]] IdentifierKind chosen() const { return mAnswers.chosen; }

    // The answer to page 83h, as far as it has been dumped. The next one is null until there is another dump.
    [[nodiscard]] Page83 takePage83();

    // Whether the log has a cause of its own for a failed identification.
    [[nodiscard]] bool hasCause() const { return !mAnswers.causes.empty(); }

    // Whether something failed, and not just a page is missing that not every device has.
    [[nodiscard]] bool hasFailed() const { return mAnswers.failed; }

    // Whether a command did not come through to the device: a time-out, a transport or the kernel failed. A
    // device that does not speak SCSI is none of these.
    [[nodiscard]] bool isLost() const { return mAnswers.lost; }

    // Whether the device was turned away by its type: without a word, and before page 0x83 was asked for.
    [[nodiscard]] bool isOfWrongType() const { return !hasCause() && !mAnswers.pageAsked; }

    // Why `device` could not be identified. Some refusals leave no text of their own; they are told by what
    // is missing.
    [[nodiscard]] std::string cause(std::string_view device) const;

private:
    enum class Dumping : unsigned char { Other, PageNext, Page };

    struct Answers {
        std::vector<std::string> causes;
        std::string detail; // of the command under way: why it failed
        bool pageAsked = false;
        bool failed = false;
        bool lost = false;
        bool lineEnds = false; // in a designator
        std::set<IdentifierKind> found;
        IdentifierKind chosen = IdentifierKind::Unknown;
        std::vector<std::uint8_t> page83;
        std::size_t page83Length = 0; // as its dump announces it
        Dumping dumping = Dumping::Other;
    };

    void find(IdentifierKind kind, std::string_view designator);
    void takeFailure(const TextMatch& match);
    void takeScsi(const TextMatch& match);
    void fail(std::string_view words, bool isFailure = true);

    Draft& mDraft;
    std::string mDevice;
    Answers mAnswers;
};

} // namespace view
