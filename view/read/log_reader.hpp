#pragma once

#include <cstddef>
#include <cstdint>
#include <istream>
#include <string>
#include <string_view>

#include "view/model/model.hpp"
#include "view/read/foreign_texts.hpp"
#include "view/read/model_builder.hpp"
#include "view/read/text_matcher.hpp"

namespace view {

// Reads a log as a stream: cuts it into lines, the lines into texts, and hands those to the model builder.
// Holds a line at a time, not the log.
class LogReader {
public:
    explicit LogReader(std::string name);

    // Takes the next bytes of the log.
    void feed(std::string_view bytes);

    // Whether what was fed so far cannot be the beginning of a log: it is long, and (nearly) nothing of it is
    // known.
    [[nodiscard]] bool isHopeless() const;

    // Ends the log and returns what it says; `damage`: why it ends before its end, where it does. The reader
    // is used up.
    Model finish(std::string damage = {});

private:
    void takeLine(std::string_view line);
    std::size_t takeTexts(std::string_view bytes, bool mayWait);
    void takeKnown(const TextMatch& match, std::string_view bytes);
    void takeUnknown(std::string_view bytes);
    void takeLineEnd();

    ModelBuilder mBuilder;
    ForeignTexts mForeign;
    LogFacts mFacts;
    std::string mPartialLine; // the beginning of a line whose end has not come yet
    std::string mHeld;        // lines whose first text may go on in the next one
    std::uint64_t mLine = 1;  // number of the line that is being cut into texts
    bool mIsInLine = false;   // behind the first byte of that line
    bool mInOpenText = false; // behind foreign text that runs up to the next trace line
    bool mInForeign = false;  // the lines held end inside a foreign text
};

// Thrown for input that is none of Morvane's logs.
struct NotALog {};

// Reads a whole stream, packed or not. Throws NotALog as soon as it is hopeless, so that input without an end
// has one; UnpacksTooFar.
Model readLog(std::istream& input, const std::string& name);

} // namespace view
