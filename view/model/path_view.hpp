#pragma once

#include <string>

#include "view/model/model.hpp"

namespace view {

// What every kind of path has in common, as text.
struct PathView {
    Tree tree = Tree::Fc;
    std::string device;
    std::string initiator; // port WWN, or address; empty for a direct disk and a LUN the tree does not list
    std::string target;    // port WWN, or IQN and address; empty likewise
    std::string lun;       // number; empty likewise
};

// The path that a sighting of `model` stands for.
PathView describe(const Model& model, const Sighting& sighting);

} // namespace view
