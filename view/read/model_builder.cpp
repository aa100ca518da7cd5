#include "view/read/model_builder.hpp"

#include <string>
#include <string_view>
#include <utility>

#include "view/read/fields.hpp"

namespace view {

namespace {

// Whether a part of the program writes in the section of a tree. In a log whose beginning is missing the
// section is not known before the first banner.
bool writesIn(Section part, Tree tree) {
    if (tree == Tree::Run) {
        return true;
    }
    switch (part) {
    case Section::Multipath:
        return tree == Tree::Multipath;
    case Section::Fc:
        return tree == Tree::Fc;
    case Section::Iscsi:
        return tree == Tree::Iscsi;
    case Section::Direct:
        return tree == Tree::Direct;
    case Section::Logical:
        return tree == Tree::Logical;
    case Section::Inquiry:
        return tree == Tree::Fc || tree == Tree::Iscsi || tree == Tree::Direct;
    default:
        return true;
    }
}

} // namespace

void ModelBuilder::take(const TextMatch& match, std::uint64_t line) {
    mRun->draft.line = line;
    if (match.section == Section::Any) {
        mRun->inquiry.takeDump(match);
        return;
    }
    if (match.text == Text::RunStart) {
        beginRun();
        return;
    }
    mTextsBeforeRun += mRuns == 0 ? 1 : 0;
    if (match.text == Text::TraceEntry) {
        const std::string_view function = match.fields[0];
        if (function == "HA_GetScsiUniqueLunId" || function == "HA_PrintVendorProductId") {
            mRun->inquiry.begin();
        }
        return;
    }
    if (match.text == Text::TraceExit) {
        return;
    }
    if (mRun->ended) {
        ++mLeftoverTexts;
        return;
    }
    if (!writesIn(match.section, mRun->draft.tree)) {
        misplace();
        return;
    }
    switch (match.section) {
    case Section::Multipath:
        mRun->multipath.take(match);
        break;
    case Section::Fc:
        mRun->fc.take(match);
        break;
    case Section::Iscsi:
        mRun->iscsi.take(match);
        break;
    case Section::Direct:
    case Section::Logical:
        mRun->devices.take(match);
        break;
    case Section::Inquiry:
        takeInquiry(match);
        break;
    default:
        takeFrame(match);
        break;
    }
}

Model ModelBuilder::finish(LogFacts facts) {
    Draft& draft = mRun->draft;
    if (!mRun->ended) {
        mRun->fc.close();
        if (!mRun->asserted) {
            const std::string where = draft.tree == Tree::Run
                                          ? "before its first section"
                                          : "in the " + std::string(section(draft.tree)) + " section";
            draft.problem(
                Severity::Problem, ProblemKind::LogCut, "log",
                "it ends " + where +
                    ", without the closing banner: the run is still going on or was ended, or the file "
                    "was cut off");
        }
    }
    if (mRuns == 0) {
        draft.model.problems.push_back(
            {Severity::Problem, ProblemKind::LogCut, Tree::Run, "log",
             "its beginning is missing: the report holds only what stands behind it", 1});
    }
    if (!facts.damage.empty()) {
        draft.model.problems.insert( // the first: what was unpacked last may be damaged, too
            draft.model.problems.begin(), {Severity::Problem, ProblemKind::LogCut, Tree::Run, "log",
                                           "the compressed file is cut off or damaged (" + facts.damage +
                                               "): the report holds what could be unpacked",
                                           draft.line});
    }
    if (mRun->misplacedTexts > 0) {
        draft.model.problems.push_back(
            {Severity::Problem, ProblemKind::ForeignText, Tree::Run, "log",
             "lines that look like Morvane's own stand where it does not write them (" +
                 std::to_string(mRun->misplacedTexts) +
                 " in all): they are not taken; a device, a library or a command may have written them",
             mRun->firstMisplaced});
    }
    facts.runs = mRuns;
    facts.beginsInside = mRuns == 0;
    facts.complete = mRun->ended && facts.damage.empty();
    facts.leftoverTexts = mLeftoverTexts;
    draft.model.log = std::move(facts);
    return std::move(draft.model);
}

// Forgets the run before; what stands before the first run is left over from an older one.
void ModelBuilder::beginRun() {
    const std::uint64_t line = mRun->draft.line;
    mLeftoverTexts += std::exchange(mTextsBeforeRun, 0);
    ++mRuns;
    mRun.emplace();
    mRun->draft.line = line;
    mRun->draft.tree = Tree::Multipath;
}

// Notes a text that is not taken because of its place.
void ModelBuilder::misplace() {
    if (mRun->misplacedTexts++ == 0) {
        mRun->firstMisplaced = mRun->draft.line;
    }
}

void ModelBuilder::takeFrame(const TextMatch& match) {
    switch (match.text) {
    case Text::FcBanner:
        enterTree(Tree::Fc);
        break;
    case Text::IscsiBanner:
        enterTree(Tree::Iscsi);
        break;
    case Text::DasBanner:
        enterTree(Tree::Direct);
        break;
    case Text::LogicalBanner:
        enterTree(Tree::Logical);
        break;
    case Text::RunEnd:
        leaveTree();
        mRun->ended = true;
        break;
    case Text::AssertionFailed:
        mRun->asserted = true;
        mRun->draft.problem(Severity::Problem, ProblemKind::AssertionFailed, "run",
                            "the program found something that must not be and ended itself: " +
                                text(match.fields[0]));
        break;
    default:
        takeTreeEnd(match);
        break;
    }
}

void ModelBuilder::takeInquiry(const TextMatch& match) {
    if (match.text != Text::DeviceRegistered) {
        mRun->inquiry.take(match);
        return;
    }
    mRun->inquiry.setDevice(match.fields[1]);
    if (match.fields[2] == "1") {
        mRun->fc.claim();
    } else if (match.fields[2] == "4") {
        mRun->iscsi.claim();
    }
}

// Takes the text with which an exception ended a tree.
void ModelBuilder::takeTreeEnd(const TextMatch& match) {
    const std::string_view name = match.fields[0];
    const std::string cause = withoutLineEnd(match.fields[1]);
    if (name == "FC" && cause == "There are no adapters on the system") {
        mRun->draft.model.fc.state = TreeState::Built;
        mRun->draft.problem(Severity::Note, ProblemKind::NoAdapters, "FC",
                            "the HBA library lists no Fibre Channel adapter");
        return;
    }
    if (name == "FC") {
        mRun->fc.close();
    }
    mRun->draft.endTree(name == "FC"      ? Tree::Fc
                        : name == "ISCSI" ? Tree::Iscsi
                        : name == "DAS"   ? Tree::Direct
                                          : Tree::Logical,
                        cause);
}

void ModelBuilder::enterTree(Tree tree) {
    if (tree <= mRun->draft.tree) { // each has its turn once
        misplace();
        return;
    }
    leaveTree();
    mRun->draft.tree = tree;
    mRun->draft.stateOf(tree) = TreeState::Begun;
}

void ModelBuilder::leaveTree() {
    Draft& draft = mRun->draft;
    if (draft.tree == Tree::Fc) {
        mRun->fc.close();
    }
    if (draft.tree == Tree::Iscsi) {
        mRun->iscsi.leave();
    }
    if (draft.tree >= Tree::Fc && draft.stateOf(draft.tree) == TreeState::Begun) {
        draft.stateOf(draft.tree) = TreeState::Built;
    }
}

} // namespace view
