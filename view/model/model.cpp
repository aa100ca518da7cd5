#include "view/model/model.hpp"

#include <algorithm>
#include <array>

namespace view {

std::string_view section(Tree tree) {
    static constexpr std::array<std::string_view, 6> kNames = {"run",   "multipath", "FC",
                                                               "ISCSI", "DAS",       "LOGICAL"};
    return kNames.at(static_cast<std::size_t>(tree));
}

std::size_t problemCount(const Model& model) {
    return static_cast<std::size_t>(
        std::count_if(model.problems.begin(), model.problems.end(),
                      [](const Problem& problem) { return problem.severity == Severity::Problem; }));
}

} // namespace view
