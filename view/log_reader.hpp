#pragma once

#include "view/model.hpp"
#include "view/model_builder.hpp"
#include "view/text_matcher.hpp"

#include <cstdint>
#include <deque>
#include <istream>
#include <string>
#include <string_view>

namespace view {

// Reads a log as a stream: cuts it into lines, the lines into texts, and hands those to the model builder.
// Holds a line at a time, not the log.
class LogReader {
public:
    explicit LogReader(std::string name);

    // Takes the next bytes of the log.
    void feed(std::string_view bytes);

    // Ends the log and returns what it says. The reader is used up.
    Model finish();

private:
    enum class Outcome : unsigned char { Taken, NeedsMore };

    void takeLine(std::string_view line);
    void drain(bool atEnd);
    Outcome takeTexts(std::string_view bytes, bool mayWait);
    void takeUnknown(std::string_view bytes);

    TextMatcher matcher_;
    ModelBuilder builder_;
    LogFacts facts_;
    std::string partialLine_;      // the beginning of a line whose end has not come yet
    std::deque<std::string> held_; // lines whose first may go on in the next
    std::uint64_t lineNumber_ = 0; // of the line being cut into texts
    bool inOpenText_ = false;      // behind foreign text that may run over several lines
};

// Reads a whole stream.
Model readLog(std::istream& input, const std::string& name);

} // namespace view
