#include "view/read/multipath_section.hpp"

#include "view/read/fields.hpp"

namespace view {

void MultipathSection::take(const TextMatch& match) {
    Multipath& multipath = mDraft.model.multipath;
    switch (match.text) {
    case Text::PowerPathCheck:
        mCheckingDaemon = true;
        break;
    case Text::PowerPathLineCount:
        if (mCheckingDaemon && match.fields[0] == "1") {
            mDraft.problem(Severity::Note, ProblemKind::PowerPathUncertain, "PowerPath",
                           "one emcpd process was found; PowerPath counts as running from two on");
        }
        mCheckingDaemon = false;
        break;
    case Text::PowerPathNotRunning:
        multipath.state = PowerPathState::NotRunning;
        break;
    case Text::PowerPathTable:
        multipath.state = PowerPathState::Running;
        break;
    default: // an entry of the table
        multipath.devices.push_back({text(match.fields[0]), text(match.fields[1])});
        break;
    }
}

} // namespace view
