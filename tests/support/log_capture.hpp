// What the code under test writes to the log.
#pragma once

#include <cstdio>
#include <cstdlib>
#include <string>

#include "foundation/log.hpp"

// The text with '#' for the line number of every trace line, for those of the numbers that are the source's
// own and change with it.
inline std::string withoutLineNumbers(std::string text) {
    const std::string function = " Function ";
    const std::string line = " Line ";
    for (auto at = text.find(function); at != std::string::npos; at = text.find(function, at + 1)) {
        const auto number = text.find(line, at);
        if (number == std::string::npos || number > text.find('\n', at)) {
            continue;
        }
        const auto digits = number + line.size();
        const auto end = text.find_first_not_of("0123456789", digits);
        text.replace(digits, (end == std::string::npos ? text.size() : end) - digits, "#");
    }
    return text;
}

// Stands in for the log while it lives.
class LogCapture {
public:
    LogCapture() : mPrevious(gLogStream), mStream(open_memstream(&mText, &mSize)) {
        passLog(); // what belongs to the stream before this one
        gLogStream = mStream;
    }
    LogCapture(const LogCapture&) = delete;
    LogCapture& operator=(const LogCapture&) = delete;
    ~LogCapture() {
        passLog();
        gLogStream = mPrevious;
        static_cast<void>(std::fclose(mStream));
        std::free(mText);
    }

    // Everything written so far, byte by byte.
    std::string exactText() const {
        flushLog();
        return {mText, mSize};
    }

    // The same with '#' for the numbers of the trace lines.
    std::string text() const { return withoutLineNumbers(exactText()); }

private:
    std::FILE* mPrevious;
    char* mText = nullptr;
    std::size_t mSize = 0;
    std::FILE* mStream;
};
