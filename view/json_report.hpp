#pragma once

#include <nlohmann/json.hpp>

#include "view/model.hpp"

namespace view {

// The whole model as a JSON document of kind "report"; morvane-log.schema.json describes it.
nlohmann::ordered_json toJson(const Model& model);

} // namespace view
