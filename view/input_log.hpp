#pragma once

#include <cstdint>
#include <optional>
#include <string>

#include "view/model/model.hpp"

namespace view {

// What the log at `path` says; "-" is standard input. Throws Trouble for a file that cannot be read, is empty
// or is no log of Morvane's; input that shows no sign of one is given up early, so input without an end ends
// as well.
Model openLog(const std::string& path);

// When the file at `path` was last written, in seconds since the epoch; nothing for standard input.
std::optional<std::int64_t> timeWritten(const std::string& path);

// Whether the file at `path` begins as a log of Morvane's does. False for one that cannot be read.
bool isLog(const std::string& path);

} // namespace view
