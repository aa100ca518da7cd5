#pragma once

#include <ostream>
#include <string>
#include <string_view>
#include <vector>

#include "view/model/model.hpp"

namespace view {

struct PathRow; // a path, and what a column may want to know around it

// A column of the table of paths.
struct PathColumn {
    enum class Kind : unsigned char { Text, Name, Number };

    std::string_view name;
    std::string_view description;
    Kind kind; // Name: what another program made of a device's bytes; its JSON is what that program says
    std::string (*value)(const PathRow& row); // as bytes, not fit to be shown; empty when the row has none
};

// All columns, in the order in which they are documented.
const std::vector<PathColumn>& pathColumns();

// A condition that a row must meet to be shown.
struct PathFilter {
    const PathColumn* column = nullptr;
    std::string pattern;    // a glob, for the whole value as it is shown
    bool isMatching = true; // whether rows that match are shown, or those that do not
};

// What of the table is shown.
struct PathQuery {
    std::vector<const PathColumn*> columns;
    std::vector<PathFilter> filters; // all of which a row must meet
    bool hasHeader = true;
};

// Write the paths of a report, one a row, in the order of the trees; the FC tree repeats an adapter's LUNs
// below each of its ports. As a table with "-" for what a row has not; as CSV (RFC 4180), where that is
// empty; as JSON, an object a line, where it is null and there is no header.
void writePathTable(std::ostream& output, const Model& model, const PathQuery& query);
void writePathCsv(std::ostream& output, const Model& model, const PathQuery& query);
void writePathJsonLines(std::ostream& output, const Model& model, const PathQuery& query);

} // namespace view
