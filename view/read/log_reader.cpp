#include "view/read/log_reader.hpp"

#include <algorithm>
#include <array>
#include <utility>
#include <vector>

#include "view/model/luns.hpp"
#include "view/read/log_bytes.hpp"

namespace view {

namespace {

// A text is followed over at most this many lines and bytes before its first line counts as unknown.
constexpr std::ptrdiff_t kMaximumHeldLines = 32;
constexpr std::size_t kMaximumHeldBytes = 16UL * 1024;

// A line is the table of PowerPath's devices at its longest; of a longer one the rest is taken as a line
// anew.
constexpr std::size_t kMaximumLine = 16UL * 1024 * 1024;

constexpr std::size_t kMaximumSamples = 5;
constexpr std::size_t kSampleLength = 120;

constexpr std::array<std::string_view, 2> kTraceBeginnings = {"Entered Function ", "Left Function "};

bool isTrace(std::string_view line) {
    return std::any_of(kTraceBeginnings.begin(), kTraceBeginnings.end(),
                       [line](std::string_view beginning) { return line.starts_with(beginning); });
}

// Whether open-ended foreign text stops before a line: Morvane goes on with its trace, and a further run in
// the same file with its first banner.
bool endsOpenText(std::string_view line) {
    return isTrace(line) || line == "\t\tCheck for Multipath software";
}

// Where, behind its first byte, the last trace line on `line` may begin; the end of `line` if nowhere. A
// trace line goes on to the end of its line, so no other one matters.
std::size_t findTrace(std::string_view line) {
    std::size_t last = 0;
    for (const std::string_view beginning : kTraceBeginnings) {
        const std::size_t found = line.rfind(beginning);
        last = std::max(last, found == std::string_view::npos ? 0 : found);
    }
    return last == 0 ? line.size() : last;
}

std::ptrdiff_t lineEndsIn(std::string_view bytes) {
    return std::count(bytes.begin(), bytes.end(), '\n');
}

// Whether a text that begins `bytes` may still go on behind them.
bool mayGoOn(std::string_view bytes) {
    return bytes.size() <= kMaximumHeldBytes && lineEndsIn(bytes) < kMaximumHeldLines;
}

// The one of all readers: it is the same for each of many logs.
const TextMatcher& matcher() {
    static const TextMatcher kMatcher(knownTexts());
    return kMatcher;
}

} // namespace

LogReader::LogReader(std::string name) {
    mFacts.name = std::move(name);
}

void LogReader::feed(std::string_view bytes) {
    mFacts.bytes += bytes.size();
    while (!bytes.empty()) {
        const std::string_view front = bytes.substr(0, kMaximumLine - mPartialLine.size());
        const std::size_t end = front.find('\n');
        const std::string_view part = front.substr(0, end == std::string_view::npos ? end : end + 1);
        bytes.remove_prefix(part.size());
        if (end == std::string_view::npos && mPartialLine.size() + part.size() < kMaximumLine) {
            mPartialLine += part;
        } else if (mPartialLine.empty()) {
            takeLine(part);
        } else {
            mPartialLine += part;
            takeLine(std::exchange(mPartialLine, {}));
        }
    }
}

bool LogReader::isHopeless() const {
    constexpr std::uint64_t kMostBeforeAKnownText = 1U << 20U;
    constexpr std::uint64_t kMostForeign = 1U << 26U; // more than any hole that a damaged log was seen with
    const std::uint64_t foreign = mFacts.bytes - mFacts.knownBytes;
    return mFacts.knownTexts == 0 ? foreign > kMostBeforeAKnownText
                                  : foreign > kMostForeign + 16 * mFacts.knownBytes;
}

Model LogReader::finish(std::string damage) {
    if (!mPartialLine.empty()) {
        takeLine(std::exchange(mPartialLine, {}));
    }
    mForeign = {}; // nothing of them is to come
    takeTexts(mHeld, false);
    mFacts.cutInLine = mIsInLine;
    mFacts.damage = std::move(damage);
    mFacts.lines = mLine - (mIsInLine ? 0 : 1);
    Model model = mBuilder.finish(std::move(mFacts));
    groupLuns(model);
    return model;
}

// Takes a line with its line end, or holds it.
void LogReader::takeLine(std::string_view line) {
    if (isTrace(line) && !mInForeign) { // the rest of a held text never comes
        mHeld.erase(0, takeTexts(mHeld, false));
    }
    if (mHeld.empty()) {
        mHeld = line.substr(takeTexts(line, true));
    } else {
        mHeld += line;
        mHeld.erase(0, takeTexts(mHeld, true));
    }
}

// Cuts `bytes`, which end with a line, into texts and hands them on. Stops before a text that ends inside a
// foreign one and, with `mayWait`, before a text that may go on behind the bytes. Returns the number of bytes
// taken.
std::size_t LogReader::takeTexts(std::string_view bytes, bool mayWait) {
    mInForeign = false;
    std::size_t at = 0;
    while (at < bytes.size()) {
        std::size_t lineEnd = std::min(bytes.find('\n', at), bytes.size());
        mInOpenText = mInOpenText && !endsOpenText(bytes.substr(at, lineEnd - at));
        if (mInOpenText) {
            mFacts.knownBytes += lineEnd - at;
            mIsInLine = mIsInLine || at < lineEnd;
            at = lineEnd;
        }
        while (at < lineEnd) {
            const std::string_view rest = bytes.substr(at);
            TextMatch match;
            MatchResult result = matcher().match(rest, lineEnd - at, mForeign, match);
            if (result == MatchResult::Unending) {
                if (mayWait && mayGoOn(rest)) {
                    return at;
                }
                result = matcher().match(rest, rest.size(), mForeign, match);
            }
            if (result == MatchResult::Cut) {
                mInForeign = true;
                return at;
            }
            if (result == MatchResult::Found) {
                takeKnown(match, rest.substr(0, match.length));
                at += match.length;
                if (at > lineEnd) {
                    lineEnd = std::min(bytes.find('\n', at), bytes.size());
                }
            } else {
                const std::string_view line = bytes.substr(at, lineEnd - at);
                const std::string_view unknown = line.substr(0, findTrace(line));
                takeUnknown(unknown);
                at += unknown.size();
            }
        }
        if (at < bytes.size()) {
            takeLineEnd();
            ++at;
        }
    }
    return at;
}

void LogReader::takeKnown(const TextMatch& match, std::string_view bytes) {
    ++mFacts.knownTexts;
    mFacts.gluedTexts += mIsInLine ? 1 : 0;
    mFacts.knownBytes += bytes.size();
    mInOpenText = match.text == Text::OpenEnded;
    mForeign.take(match);
    mBuilder.take(match, mLine);
    mLine += static_cast<std::uint64_t>(lineEndsIn(bytes));
    mIsInLine = true;
}

void LogReader::takeUnknown(std::string_view bytes) {
    mIsInLine = true;
    mFacts.unknownBytes += bytes.size();
    ++mFacts.unknownPieces;
    if (mFacts.unknownSamples.size() < kMaximumSamples) {
        mFacts.unknownSamples.push_back({mLine, std::string(bytes.substr(0, kSampleLength))});
    }
}

void LogReader::takeLineEnd() {
    ++mFacts.knownBytes;
    ++mLine;
    mIsInLine = false;
}

Model readLog(std::istream& input, const std::string& name) {
    LogReader reader(name);
    LogBytes bytes(input);
    for (std::string_view part = bytes.next(); !part.empty(); part = bytes.next()) {
        reader.feed(part);
        if (reader.isHopeless()) {
            throw NotALog();
        }
    }
    return reader.finish(bytes.damage());
}

} // namespace view
