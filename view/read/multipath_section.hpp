#pragma once

#include "view/read/draft.hpp"
#include "view/read/text_matcher.hpp"

namespace view {

// Reads the multipath section: whether PowerPath runs, and its table.
class MultipathSection {
public:
    explicit MultipathSection(Draft& draft) : mDraft(draft) {}

    // Takes a text of Section::Multipath.
    void take(const TextMatch& match);

private:
    Draft& mDraft;
    bool mCheckingDaemon = false; // the next count of lines is that of its processes
};

} // namespace view
