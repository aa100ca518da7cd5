#pragma once

#include <string>
#include <vector>

#include <nlohmann/json.hpp>

namespace view {

// A text from the log as a JSON string, fit to be shown; null for an empty one.
nlohmann::ordered_json textOrNull(const std::string& text);

// A name that other programs use, as they print it; null for an empty one. Where textOrNull escapes, a
// backslash and the controls of ASCII stay as they are: programs compare names.
nlohmann::ordered_json nameOrNull(const std::string& name);

// Texts from the log as a list, each fit to be shown.
nlohmann::ordered_json texts(const std::vector<std::string>& list);

} // namespace view
