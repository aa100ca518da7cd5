#pragma once

#include <cstdint>
#include <optional>
#include <ostream>

#include "view/model/model.hpp"

namespace view {

// Writes what a log says as metrics: in Prometheus' text format, as the textfile collector of node_exporter
// takes it, which is OpenMetrics' too. The host and the time are for those to add who read it. `end` is when
// the log was last written, in seconds since the epoch; nothing where that is not known.
void writePrometheus(std::ostream& output, const Model& model, std::optional<std::int64_t> end);

} // namespace view
