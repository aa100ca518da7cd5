#pragma once

#include <cstddef>
#include <string>
#include <utility>
#include <vector>

#include "view/model/model.hpp"

namespace view {

// A LUN as several hosts see it.
struct SanLun {
    Identifier identifier;
    DeviceFacts facts;
    bool isDirectOnly = true;                               // no host sees it over FC or iSCSI
    std::vector<std::pair<std::size_t, std::size_t>> hosts; // index of the host, number of its paths
    std::vector<std::string> notUnique;                     // reasons; empty when nothing speaks against it
};

// Many hosts' reports as one view. Refers to the models it was made of.
struct San {
    const std::vector<Model>* reports = nullptr;
    std::vector<std::string> hosts; // a name for each report, no two the same
    std::vector<SanLun> luns;       // in the order of their identifiers
};

// Joins the LUNs of the reports, which must outlive the result.
San join(const std::vector<Model>& reports);

} // namespace view
