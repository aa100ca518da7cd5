#include "view/log_reader.hpp"

#include "view/luns.hpp"

#include <algorithm>
#include <array>
#include <cstring>
#include <utility>
#include <vector>

namespace view {

namespace {

// A text is followed over at most this many lines and bytes before its first line counts as unknown.
constexpr std::size_t maximumHeldLines = 32;
constexpr std::size_t maximumHeldBytes = 64UL * 1024;

// A line is the table of PowerPath's devices at its longest; of a longer one the rest is taken as a line
// anew.
constexpr std::size_t maximumLine = 16UL * 1024 * 1024;

constexpr std::size_t maximumSamples = 5;
constexpr std::size_t sampleLength = 120;

constexpr std::array<std::string_view, 2> traceBeginnings = {"Entered Function ", "Left Function "};

// The next place after the first byte where a trace line may begin.
std::size_t findTrace(std::string_view bytes) {
    std::size_t first = std::string_view::npos;
    for (const std::string_view beginning : traceBeginnings) {
        first = std::min(first, bytes.find(beginning, 1));
    }
    return first;
}

bool isTrace(std::string_view line) {
    return std::any_of(traceBeginnings.begin(), traceBeginnings.end(),
                       [line](std::string_view beginning) { return line.starts_with(beginning); });
}

} // namespace

LogReader::LogReader(std::string name) : matcher_(knownTexts()) {
    facts_.name = std::move(name);
}

void LogReader::feed(std::string_view bytes) {
    facts_.bytes += bytes.size();
    while (!bytes.empty()) {
        const std::size_t end = bytes.find('\n');
        if (end == std::string_view::npos) {
            partialLine_ += bytes;
            if (partialLine_.size() >= maximumLine) {
                takeLine(std::exchange(partialLine_, {}));
            }
            return;
        }
        if (partialLine_.empty()) {
            takeLine(bytes.substr(0, end));
        } else {
            partialLine_ += bytes.substr(0, end);
            takeLine(std::exchange(partialLine_, {}));
        }
        bytes.remove_prefix(end + 1);
    }
}

Model LogReader::finish() {
    if (!partialLine_.empty()) {
        facts_.cutInLine = true;
        takeLine(std::exchange(partialLine_, {}));
    }
    drain(true);
    Model model = builder_.finish(std::move(facts_));
    groupLuns(model);
    return model;
}

void LogReader::takeLine(std::string_view line) {
    ++facts_.lines;
    if (held_.empty()) {
        lineNumber_ = facts_.lines;
        if (takeTexts(line, true) == Outcome::Taken) {
            return;
        }
    }
    held_.emplace_back(line);
    drain(false);
}

// Takes the held lines: the first alone, or with as many of the next as its text runs over.
void LogReader::drain(bool atEnd) {
    while (!held_.empty()) {
        lineNumber_ = facts_.lines - held_.size() + 1;
        std::string joined = held_.front();
        std::size_t used = 1;
        bool mayWait = true;
        while (takeTexts(joined, mayWait) == Outcome::NeedsMore) {
            const bool isOver = used == maximumHeldLines || joined.size() > maximumHeldBytes;
            const bool isLast = used == held_.size();
            if (isLast && !isOver && !atEnd) {
                return;
            }
            if (isLast || isOver || isTrace(held_[used])) { // the rest of the text never comes
                joined = held_.front();
                used = 1;
                mayWait = false;
                continue;
            }
            joined += '\n';
            joined += held_[used];
            ++used;
        }
        held_.erase(held_.begin(), held_.begin() + static_cast<std::ptrdiff_t>(used));
    }
}

// Cuts a line into its texts and hands them on. With `mayWait`, hands on nothing and returns NeedsMore when
// the last text of the line may go on in the next one.
LogReader::Outcome LogReader::takeTexts(std::string_view bytes, bool mayWait) {
    struct Piece {
        bool isKnown = false;
        TextMatch match;
        std::string_view unknown;
    };
    const bool isOneLine = bytes.find('\n') == std::string_view::npos;
    // Almost every line is one text; only a line of several needs the list.
    std::vector<Piece> pieces;
    std::string_view rest = bytes;
    while (!rest.empty()) {
        Piece piece;
        const MatchResult result = matcher_.match(rest, piece.match);
        if (result == MatchResult::Found && piece.match.length > 0) {
            if (piece.match.length == rest.size() && pieces.empty()) {
                ++facts_.knownTexts;
                inOpenText_ = piece.match.text == Text::OpenEnded;
                builder_.take(piece.match, lineNumber_);
                return Outcome::Taken;
            }
            piece.isKnown = true;
            rest.remove_prefix(piece.match.length);
        } else {
            if (mayWait && result == MatchResult::Unending && !(inOpenText_ && pieces.empty())) {
                return Outcome::NeedsMore;
            }
            std::size_t end = findTrace(rest);
            if (!isOneLine) {
                end = std::min(end, rest.find('\n'));
            }
            piece.unknown = rest.substr(0, end);
            rest.remove_prefix(piece.unknown.size());
            if (rest.starts_with('\n')) {
                rest.remove_prefix(1);
            }
        }
        pieces.push_back(piece);
    }
    bool isFirst = true;
    for (const Piece& piece : pieces) {
        if (piece.isKnown) {
            ++facts_.knownTexts;
            facts_.gluedTexts += isFirst ? 0U : 1U;
            inOpenText_ = piece.match.text == Text::OpenEnded;
            builder_.take(piece.match, lineNumber_);
        } else {
            takeUnknown(piece.unknown);
        }
        isFirst = false;
    }
    return Outcome::Taken;
}

void LogReader::takeUnknown(std::string_view bytes) {
    if (inOpenText_ || bytes.empty()) {
        return;
    }
    ++facts_.unknownPieces;
    if (facts_.unknownSamples.size() < maximumSamples) {
        facts_.unknownSamples.push_back({lineNumber_, std::string(bytes.substr(0, sampleLength))});
    }
}

Model readLog(std::istream& input, const std::string& name) {
    LogReader reader(name);
    std::vector<char> buffer(256UL * 1024);
    while (input) {
        input.read(buffer.data(), static_cast<std::streamsize>(buffer.size()));
        reader.feed({buffer.data(), static_cast<std::size_t>(input.gcount())});
    }
    return reader.finish();
}

} // namespace view
