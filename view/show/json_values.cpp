#include "view/show/json_values.hpp"

#include <algorithm>

#include "view/show/escape.hpp"

namespace view {

nlohmann::ordered_json textOrNull(const std::string& text) {
    return text.empty() ? nlohmann::ordered_json() : nlohmann::ordered_json(printable(text));
}

nlohmann::ordered_json nameOrNull(const std::string& name) {
    const auto stays = [](char c) { return c == '\\' || (c >= 0 && c < ' '); };
    std::string shown;
    for (auto at = name.begin(); at != name.end();) {
        if (stays(*at)) {
            shown.push_back(*at++);
        } else {
            const auto end = std::find_if(at, name.end(), stays);
            shown.append(printable({at, end}));
            at = end;
        }
    }
    return shown.empty() ? nlohmann::ordered_json() : nlohmann::ordered_json(shown);
}

nlohmann::ordered_json texts(const std::vector<std::string>& list) {
    nlohmann::ordered_json json = nlohmann::ordered_json::array();
    for (const std::string& text : list) {
        json.push_back(printable(text));
    }
    return json;
}

} // namespace view
