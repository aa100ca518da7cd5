#pragma once

#include <nlohmann/json.hpp>

#include "view/model/diff.hpp"
#include "view/model/model.hpp"
#include "view/model/san.hpp"
#include "view/model/verify.hpp"

namespace view {

// The documents that morvane-log.schema.json describes.

// The whole model as a document of kind "report".
nlohmann::ordered_json toJson(const Model& model);

// A document of kind "diff".
nlohmann::ordered_json toJson(const Difference& difference);

// A document of kind "san", without the reports themselves.
nlohmann::ordered_json toJson(const San& san);

// The document that morvane-verify.schema.json describes.
nlohmann::ordered_json toJson(const Verification& verification);

} // namespace view
