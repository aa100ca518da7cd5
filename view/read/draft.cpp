#include "view/read/draft.hpp"

#include <utility>

namespace view {

TreeState& Draft::stateOf(Tree which) {
    switch (which) {
    case Tree::Fc:
        return model.fc.state;
    case Tree::Iscsi:
        return model.iscsi.state;
    case Tree::Direct:
        return model.direct.state;
    default:
        return model.logical.state;
    }
}

void Draft::problem(Severity severity, ProblemKind kind, std::string subject, std::string cause) {
    model.problems.push_back({severity, kind, tree, std::move(subject), std::move(cause), line});
}

void Draft::endTree(Tree which, const std::string& cause) {
    stateOf(which) = TreeState::Ended;
    tree = which;
    problem(Severity::Problem, ProblemKind::TreeEnded, std::string(section(which)),
            "the tree was ended early: " + cause);
}

} // namespace view
