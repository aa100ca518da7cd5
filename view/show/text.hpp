#pragma once

#include <ostream>
#include <string_view>

#include "view/model/check.hpp"
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

// Writes what plugins write for programs that watch services: a line of the status, the reasons and, where
// losses can be judged, performance data; below it, as long output, what differs and what to know of the
// logs.
void writeText(std::ostream& output, const Check& check);

// Writes the line of a check that came to nothing. `reason` is fit to be shown.
void writeUnknown(std::ostream& output, std::string_view reason);

// Writes the hosts, then the identifiers that are not unique, then the LUNs by who sees them.
void writeText(std::ostream& output, const San& san, const Style& style);

// Writes the findings, the most dangerous first, then what was compared.
void writeText(std::ostream& output, const Verification& verification, const Style& style);

} // namespace view
