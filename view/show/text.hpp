#pragma once

#include <ostream>

#include "view/model/diff.hpp"
#include "view/model/model.hpp"
#include "view/model/san.hpp"
#include "view/model/verify.hpp"
#include "view/show/text_layout.hpp"

namespace view {

// Writes a report as text for a reader: problems first, then LUNs by identity, then the trees.
void writeText(std::ostream& output, const Model& model, const Style& style);

// Writes what differs, the most dangerous first.
void writeText(std::ostream& output, const Difference& difference, const Style& style);

// Writes the hosts, then the identifiers that are not unique, then the LUNs by who sees them.
void writeText(std::ostream& output, const San& san, const Style& style);

// Writes the findings, the most dangerous first, then what was compared.
void writeText(std::ostream& output, const Verification& verification, const Style& style);

} // namespace view
