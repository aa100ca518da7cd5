// Logs in the tests' own words, and what morvane-view makes of them.
#pragma once

#include <string>
#include <string_view>

#include "view/read/log_reader.hpp"
#include "view/show/json.hpp"

// The text with which a run begins and the rules that begin and end a section, as the log has them.
inline const std::string kRule = "================================================\n";
inline const std::string kRunStart = "\t\tCheck for Multipath software\n";
inline const std::string kFcBanner = "============== FC DEVICE DETAILS ===============\n";
inline const std::string kIscsiBanner = "============= ISCSI DEVICE DETAILS =============\n";
inline const std::string kDasBanner = "============== DAS DEVICE DETAILS ==============\n";
inline const std::string kRunEnd = "\t\t\t   END \n";

// A direct disk's report line, by which a test sees that a text was read.
inline std::string diskLine(const std::string& device, const std::string& identifier) {
    return "--------> Device Name: |" + device + "| LunId: |" + identifier + "|\n";
}

// Reads a log that comes in chunks of `chunk` bytes; 0 stands for one piece.
inline view::Model modelOf(std::string_view log, std::size_t chunk = 0) {
    view::LogReader reader("log");
    while (!log.empty()) {
        const std::string_view bytes = log.substr(0, chunk == 0 ? log.size() : chunk);
        reader.feed(bytes);
        log.remove_prefix(bytes.size());
    }
    return reader.finish();
}

// A section of a model's JSON document as text, without the blanks and line ends between its parts.
inline std::string sectionOf(const view::Model& model, const char* section) {
    return view::toJson(model)[section].dump();
}
