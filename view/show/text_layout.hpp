#pragma once

#include <ostream>
#include <string>
#include <string_view>
#include <vector>

namespace view {

// How a text report stands out; empty strings where there is no colour.
struct Style {
    std::string_view heading;
    std::string_view problem;
    std::string_view good;
    std::string_view faint;
    std::string_view end;

    // The style for a terminal that shows colours, or for none.
    static Style of(bool colour);
};

// Lines of cells, each column as wide as its widest cell, within reason. Cells are shown as they are: escape
// them first.
class Columns {
public:
    void add(std::vector<std::string> cells);

    // Writes the lines, each behind `indent` and without blanks at its end.
    void write(std::ostream& output, std::string_view indent) const;

private:
    std::vector<std::vector<std::string>> mLines;
};

// Writes a heading line with a blank line before it.
void writeHeading(std::ostream& output, const Style& style, std::string_view heading);

} // namespace view
