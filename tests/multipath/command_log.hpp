// The lines of a command, and what it leaves in the log.
#pragma once

#include <string>
#include <vector>

#include "multipath/powerpath.hpp"

inline std::vector<std::string> texts(const ZebSensorLinuxPowerPathHandler::LineList::List& lines) {
    std::vector<std::string> result;
    for (const ZebString& line : lines) {
        result.emplace_back(line.c_str());
    }
    return result;
}

// What a command leaves in the log that prints these lines, few enough for one read, `sum` being the lines
// that the list then holds.
inline std::string commandLog(const std::vector<std::string>& lines, std::size_t sum) {
    std::string log = "Entered Function sExecuteCommand Line #\nCalling popen\n";
    if (!lines.empty()) {
        std::string output;
        std::string cut;
        for (const std::string& line : lines) {
            output += line + "\n";
            cut += "Line: " + line;
        }
        log += "Buffer got = " + output + "\nEntered Function sBreakOutput Line #\n" + cut +
               "End of popened Buffer\nLeft Function sBreakOutput Line #\n";
    }
    return log + "Fread returned ERROR\nNumber of lines in output: " + std::to_string(sum) +
           "\nLeft Function sExecuteCommand Line #\n";
}
