// A log, read by morvane-view and shown in every way it has. The input is two bytes for the sizes of the
// chunks that the log comes in, which take turns (0: all there is), and then the log.
#include <algorithm>
#include <array>
#include <set>
#include <sstream>
#include <string>
#include <vector>

#include "tests/fuzz/input.hpp"
#include "view/model/check.hpp"
#include "view/model/diff.hpp"
#include "view/model/san.hpp"
#include "view/read/log_reader.hpp"
#include "view/show/escape.hpp"
#include "view/show/html_page.hpp"
#include "view/show/json.hpp"
#include "view/show/prometheus.hpp"
#include "view/show/text.hpp"

namespace {

using view::Model;

Model readWhole(std::string_view log) {
    view::LogReader reader("log");
    reader.feed(log);
    return reader.finish();
}

Model readChunks(std::string_view log, const std::array<std::size_t, 2>& sizes) {
    view::LogReader reader("log");
    for (std::size_t chunk = 0; !log.empty(); ++chunk) {
        const std::size_t wanted = sizes.at(chunk % sizes.size());
        const std::string_view bytes = log.substr(0, wanted != 0 ? wanted : log.size());
        reader.feed(bytes);
        log.remove_prefix(bytes.size());
    }
    return reader.finish();
}

// Every byte and every line of the log is accounted for.
void checkFacts(const view::LogFacts& facts, std::string_view log) {
    require(facts.bytes == log.size(), "bytes lost or made up");
    require(facts.knownBytes + facts.unknownBytes == log.size(), "bytes neither known nor unknown");
    require((facts.unknownPieces == 0) == (facts.unknownBytes == 0), "unknown pieces without bytes");
    const auto lineEnds = static_cast<std::uint64_t>(std::count(log.begin(), log.end(), '\n'));
    require(facts.cutInLine == (!log.empty() && log.back() != '\n'), "a last line with a wrong end");
    require(facts.lines == lineEnds + (facts.cutInLine ? 1 : 0), "lines lost or made up");
}

// Writes something as text, all of which must be fit to be shown: as a line, it is its own printable form but
// for the backslashes, which the escapes of what comes from the log have.
template <typename Shown>
void checkText(const Shown& shown) {
    std::ostringstream output;
    view::writeText(output, shown, view::Style::of(false));
    std::string text = output.str();
    text.erase(std::remove(text.begin(), text.end(), '\n'), text.end());
    const auto isControl = [](char c) { return static_cast<unsigned char>(c) < 0x20 || c == 0x7f; };
    require(std::none_of(text.begin(), text.end(), isControl), "a control character in the text");
    const auto backslashes = static_cast<std::size_t>(std::count(text.begin(), text.end(), '\\'));
    require(view::printable(text).size() == text.size() + backslashes, "text that is not fit to be shown");
}

// Writes a page, whose document must not bring any markup into it.
void checkPage(const nlohmann::ordered_json& document) {
    const auto markup = [](const nlohmann::ordered_json& shown) {
        std::ostringstream output;
        view::writePage(output, shown);
        const std::string page = output.str();
        return std::count(page.begin(), page.end(), '<');
    };
    static const auto kTemplateMarkup = markup({});
    require(markup(document) == kTemplateMarkup, "markup from the log");
}

void checkDifference(const Model& before, const Model& after) {
    const view::Difference difference = view::compare(before, after);
    checkText(difference);
    static_cast<void>(view::toJson(difference).dump()); // which throws for what is not UTF-8
}

// What programs that watch services read: the sign that begins performance data stands in the first line
// alone, and there once, where the losses could be judged.
void checkCheck(const Model& baseline, const Model& log) {
    const view::Check check = view::check(baseline, log, {});
    std::ostringstream output;
    view::writeText(output, check);
    const std::string text = output.str();
    const std::size_t bar = text.find('|');
    require((bar == std::string::npos) == check.doubt.has_value(), "performance data of what is not known");
    require(bar == std::string::npos || (bar < text.find('\n') && bar == text.rfind('|')),
            "a bar of the log's");
}

// Metrics, of which a file with one series twice is refused as a whole.
void checkMetrics(const Model& report) {
    std::ostringstream output;
    view::writePrometheus(output, report, 0);
    std::istringstream lines(output.str());
    std::set<std::string> series;
    for (std::string line; std::getline(lines, line);) {
        require(view::printable(line).size() ==
                    line.size() + static_cast<std::size_t>(std::count(line.begin(), line.end(), '\\')),
                "a metric that is no line of UTF-8");
        require(line.front() == '#' || series.insert(line.substr(0, line.rfind(' '))).second,
                "a series twice");
    }
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8* data, std::size_t size) {
    Input input(data, size);
    const std::array<std::size_t, 2> sizes = {input.byte(), input.byte()};
    const std::string_view log = input.rest();
    const std::string_view half = log.substr(0, log.size() / 2);

    view::LogReader whole("log");
    whole.feed(log);
    if (whole.isHopeless()) {
        return 0; // refused as a stream
    }
    const std::vector<Model> reports = {readWhole(log), readWhole(half), readWhole(log.substr(half.size()))};
    const Model& report = reports.front();
    checkFacts(report.log, log);
    checkText(report);
    const nlohmann::ordered_json document = view::toJson(report);
    require(document.dump() == view::toJson(readChunks(log, sizes)).dump(), "chunks that change the report");
    checkPage(document);

    require(view::compare(report, report).isEmpty(), "a log that differs from itself");
    checkDifference(reports[1], reports[2]);
    checkDifference(reports[2], reports[1]);
    require(view::check(report, report, {}).lostPaths == 0, "a loss without a difference");
    checkCheck(report, report);
    checkCheck(report, reports[1]);
    checkMetrics(report);

    const view::San san = view::join(reports);
    checkText(san);
    static_cast<void>(view::toJson(san).dump());
    return 0;
}
