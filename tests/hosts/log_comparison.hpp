// Makes logs of different runs comparable, and says where two texts differ.
#pragma once

#include <string>

namespace test {

// The log without what may differ from run to run and from one word size to the other: addresses, times and,
// but for doScsiIo's exits, whose numbers are part of the log's format, the line numbers of the trace.
std::string normalised(const std::string& log);

// "" when both are equal; else the first differing line of each with the lines around it.
std::string firstDifference(const std::string& expected, const std::string& actual);

} // namespace test
