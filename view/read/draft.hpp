#pragma once

#include <cstdint>
#include <string>
#include <string_view>

#include "view/model/model.hpp"

namespace view {

// Said where the log tells that something failed, but not why.
constexpr std::string_view kNoCause = "the log gives no cause";

// The model of a run while it is being built, and the place in the log that has been reached.
struct Draft {
    Model model;
    Tree tree = Tree::Run;  // whose section it is in; Run before the first banner
    std::uint64_t line = 0; // from 1

    // The state of a tree, which is neither Run nor Multipath.
    TreeState& stateOf(Tree which);

    // Adds a problem of the section and the line that have been reached.
    void problem(Severity severity, ProblemKind kind, std::string subject, std::string cause);

    // Notes that an error ended a tree early.
    void endTree(Tree which, const std::string& cause);
};

} // namespace view
