#pragma once

#include <nlohmann/json.hpp>

#include "view/model/diff.hpp"
#include "view/model/model.hpp"
#include "view/model/san.hpp"

namespace view {

// The documents that morvane-log.schema.json describes.

// The whole model as a document of kind "report".
nlohmann::ordered_json toJson(const Model& model);

// A document of kind "diff".
nlohmann::ordered_json toJson(const Difference& difference);

// A document of kind "san", without the reports themselves.
nlohmann::ordered_json toJson(const San& san);

} // namespace view
