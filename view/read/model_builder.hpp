#pragma once

#include <cstdint>
#include <optional>

#include "view/model/model.hpp"
#include "view/read/device_section.hpp"
#include "view/read/draft.hpp"
#include "view/read/fc_section.hpp"
#include "view/read/inquiry_section.hpp"
#include "view/read/iscsi_section.hpp"
#include "view/read/multipath_section.hpp"
#include "view/read/text_matcher.hpp"

namespace view {

// One run of the program: its model, and a reader of each section.
struct Run {
    Draft draft;
    InquirySection inquiry{draft};
    MultipathSection multipath{draft};
    FcSection fc{draft, inquiry};
    IscsiSection iscsi{draft, inquiry};
    DeviceSection devices{draft, inquiry};
    std::uint64_t misplacedTexts = 0; // that their part does not write in the section they stand in
    std::uint64_t firstMisplaced = 0; // the line of the first
    bool ended = false;
    bool asserted = false;
};

// Turns the texts of a log, in their order, into the model of the last run that begins in it. Report lines
// give the paths and devices; the progress texts between them give the causes of what is missing.
class ModelBuilder {
public:
    ModelBuilder() { mRun.emplace(); }

    // Takes one text, found in line `line` (from 1) of the log.
    void take(const TextMatch& match, std::uint64_t line);

    // Ends the log: closes what is open and returns the model, its log facts filled with `facts` (name,
    // counts) and with what the builder knows itself. The builder is used up.
    Model finish(LogFacts facts);

private:
    void beginRun();
    void misplace();
    void takeFrame(const TextMatch& match);
    void takeInquiry(const TextMatch& match);
    void takeTreeEnd(const TextMatch& match);
    void enterTree(Tree tree);
    void leaveTree();

    std::optional<Run> mRun; // always there; what stands before the first beginning is a run, too
    unsigned mRuns = 0;      // that began
    std::uint64_t mTextsBeforeRun = 0;
    std::uint64_t mLeftoverTexts = 0;
};

} // namespace view
