#pragma once

#include "view/model.hpp"

#include <nlohmann/json.hpp>

namespace view {

// The whole model as a JSON document of kind "report"; morvane-log.schema.json describes it.
nlohmann::ordered_json toJson(const Model& model);

} // namespace view
