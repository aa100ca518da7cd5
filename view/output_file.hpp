#pragma once

#include <functional>
#include <ostream>
#include <string>
#include <vector>

namespace view {

// Writes a file whole or not at all: beside its place, and then renamed into it. "-" is standard output; a
// place that is no file (a pipe, a terminal) is written to as it is. Throws Trouble when the file is one of
// `inputs` or holds a log of Morvane's, which a page must not replace, when it is a link of a user other than
// the caller or root, or when it cannot be written; what stood there then still does.
void writeOutput(const std::string& path, const std::vector<std::string>& inputs,
                 const std::function<void(std::ostream&)>& write);

} // namespace view
