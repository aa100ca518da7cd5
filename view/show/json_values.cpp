#include "view/show/json_values.hpp"

#include "view/show/escape.hpp"

namespace view {

nlohmann::ordered_json textOrNull(const std::string& text) {
    return text.empty() ? nlohmann::ordered_json() : nlohmann::ordered_json(printable(text));
}

nlohmann::ordered_json texts(const std::vector<std::string>& list) {
    nlohmann::ordered_json json = nlohmann::ordered_json::array();
    for (const std::string& text : list) {
        json.push_back(printable(text));
    }
    return json;
}

} // namespace view
