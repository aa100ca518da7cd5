#include "view/kernel/multipathd.hpp"

#include <stdexcept>
#include <string>

#include <nlohmann/json.hpp>

namespace view {

namespace {

using Json = nlohmann::json;

[[noreturn]] void refuse(const std::string& reason) {
    throw std::runtime_error(reason + "; it takes what \"multipathd show maps json\" prints");
}

// A member of an object. Throws for what is no object, or has no such member of that type.
const Json& member(const Json& object, const char* name, Json::value_t type) {
    const auto found = object.is_object() ? object.find(name) : object.end();
    if (found == object.end() || found->type() != type) {
        refuse(std::string("is JSON, but not multipathd's list of maps: there is no \"") + name + "\"");
    }
    return *found;
}

std::string text(const Json& object, const char* name) {
    return member(object, name, Json::value_t::string).get<std::string>();
}

const Json& list(const Json& object, const char* name) {
    return member(object, name, Json::value_t::array);
}

ListedMap mapOf(const Json& json) {
    ListedMap map{text(json, "name"), text(json, "uuid"), {}};
    if (!json.contains("path_groups")) { // a map without paths has none
        return map;
    }
    for (const Json& group : list(json, "path_groups")) {
        for (const Json& path : list(group, "paths")) {
            map.paths.push_back(
                {text(path, "dev"), text(path, "dm_st"), text(path, "dev_st"), text(path, "chk_st")});
        }
    }
    return map;
}

} // namespace

std::vector<ListedMap> readMaps(std::string_view json) {
    const Json document = Json::parse(json.begin(), json.end(), nullptr, false);
    if (document.is_discarded()) {
        refuse("is no JSON");
    }
    std::vector<ListedMap> maps;
    for (const Json& map : list(document, "maps")) {
        maps.push_back(mapOf(map));
    }
    return maps;
}

} // namespace view
