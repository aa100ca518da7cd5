#include "tests/hosts/log_comparison.hpp"

#include <algorithm>
#include <cctype>
#include <string_view>
#include <vector>

namespace test {
namespace {

std::vector<std::string_view> linesOf(std::string_view text) {
    std::vector<std::string_view> lines;
    while (!text.empty()) {
        const std::size_t end = text.find('\n');
        lines.push_back(text.substr(0, end));
        text.remove_prefix(end == std::string_view::npos ? text.size() : end + 1);
    }
    return lines;
}

bool isAddressCharacter(char c) {
    return std::isxdigit(static_cast<unsigned char>(c)) != 0 || c == 'x';
}

bool isNumberCharacter(char c) {
    return std::isdigit(static_cast<unsigned char>(c)) != 0 || c == '.' || c == '-';
}

// Replaces what stands between `before` and `after` in the line, if that is there and not empty and all of it
// is of the given characters. Texts may share a line, since some have no line end, so any place in it will
// do.
void replaceBetween(std::string& line, std::string_view before, std::string_view after, bool (*isOfIt)(char),
                    std::string_view replacement) {
    for (std::size_t start = line.find(before); start != std::string::npos;
         start = line.find(before, start + 1)) {
        const std::size_t from = start + before.size();
        std::size_t to = from;
        while (to < line.size() && isOfIt(line[to])) {
            ++to;
        }
        if (to > from && std::string_view(line).substr(to, after.size()) == after) {
            line.replace(from, to - from, replacement);
        }
    }
}

// "Time values: " is followed by four numbers, which are one replacement.
bool isNumberListCharacter(char c) {
    return isNumberCharacter(c) || c == ',' || c == ' ';
}

// Replaces the number behind " Line " of each trace text in the line.
void replaceTraceLine(std::string& line, std::string_view verb, bool keepsScsiExit) {
    const std::string start = std::string(verb) + " Function ";
    for (std::size_t at = line.find(start); at != std::string::npos; at = line.find(start, at + 1)) {
        const std::size_t name = at + start.size();
        const std::size_t word = line.find(" Line ", name);
        if (word == std::string::npos) {
            return;
        }
        if (keepsScsiExit && line.compare(name, word - name, "doScsiIo") == 0) {
            continue;
        }
        const std::size_t from = word + std::string_view(" Line ").size();
        std::size_t to = from;
        while (to < line.size() && std::isdigit(static_cast<unsigned char>(line[to])) != 0) {
            ++to;
        }
        if (to > from) {
            line.replace(from, to - from, "#");
        }
    }
}

std::string normalisedLine(std::string_view original) {
    std::string line(original);
    replaceBetween(line, "Vpd Page: ", "", isAddressCharacter, "<address>");
    replaceBetween(line, "InqBuffer ", " Vendor ", isAddressCharacter, "<address>");
    replaceBetween(line, "Storing Target Mappings ", "", isAddressCharacter, "<address>");
    replaceBetween(line, "Deleting 0x", "", isAddressCharacter, "<address>");
    replaceBetween(line, "Time taken to load HBAAPI: ", " milliseconds", isNumberCharacter, "<time>");
    replaceBetween(line, "Time taken to build tree: ", " milliseconds", isNumberCharacter, "<time>");
    replaceBetween(line, "Time values: ", "", isNumberListCharacter, "<times>");
    replaceTraceLine(line, "Entered", false);
    replaceTraceLine(line, "Left", true);
    return line;
}

// The line as it can be read on a terminal.
std::string visible(std::string_view line) {
    std::string result;
    for (const char c : line) {
        const auto byte = static_cast<unsigned char>(c);
        if (std::isprint(byte) != 0) {
            result += c;
            continue;
        }
        constexpr std::string_view kDigits = "0123456789abcdef";
        result += "\\x";
        result += kDigits[byte >> 4U];
        result += kDigits[byte & 0xfU];
    }
    return result;
}

std::string excerpt(const std::vector<std::string_view>& lines, std::size_t place) {
    constexpr std::size_t kContext = 6;
    std::string text;
    const std::size_t end = std::min(lines.size(), place + kContext);
    for (std::size_t i = place < kContext ? 0 : place - kContext; i < end; ++i) {
        text += (i == place ? "  > " : "    ") + visible(lines[i]) + "\n";
    }
    return lines.size() <= place ? text + "  > (end)\n" : text;
}

} // namespace

std::string normalised(const std::string& log) {
    std::string result;
    for (const std::string_view line : linesOf(log)) {
        result += normalisedLine(line) + "\n";
    }
    if (!log.empty() && log.back() != '\n') {
        result.pop_back();
    }
    return result;
}

std::string firstDifference(const std::string& expected, const std::string& actual) {
    if (expected == actual) {
        return "";
    }
    const auto expectedLines = linesOf(expected);
    const auto actualLines = linesOf(actual);
    std::size_t place = 0;
    while (place < expectedLines.size() && place < actualLines.size() &&
           expectedLines[place] == actualLines[place]) {
        ++place;
    }
    return "first difference in line " + std::to_string(place + 1) + "\nexpected:\n" +
           excerpt(expectedLines, place) + "actual:\n" + excerpt(actualLines, place);
}

} // namespace test
