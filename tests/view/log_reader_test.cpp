#include "view/read/log_reader.hpp"

#include <algorithm>
#include <sstream>
#include <string>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include "tests/view/reading.hpp"

namespace {

using view::LogFacts;
using view::Model;

// Devices and identifiers of the direct disks, in their order.
using Disks = std::vector<std::pair<std::string, std::string>>;

Disks disksOf(const Model& model) {
    Disks disks;
    for (const view::DirectDevice& disk : model.direct.devices) {
        disks.emplace_back(disk.device, disk.identifier.text);
    }
    return disks;
}

// How a log was cut into texts.
struct Cut {
    std::uint64_t lines = 0;
    std::uint64_t texts = 0;
    std::uint64_t glued = 0;
    std::vector<std::pair<std::uint64_t, std::string>> unknown = {}; // line and bytes

    bool operator==(const Cut&) const = default;
};

std::ostream& operator<<(std::ostream& output, const Cut& cut) {
    output << cut.lines << " lines, " << cut.texts << " texts, " << cut.glued << " glued";
    for (const auto& [line, bytes] : cut.unknown) {
        output << ", line " << line << " unknown: " << bytes;
    }
    return output;
}

// Reads a log and sees to it that the facts agree with each other.
Cut cut(const std::string& log) {
    const LogFacts facts = modelOf(log).log;
    EXPECT_EQ(facts.bytes, log.size());
    EXPECT_EQ(facts.knownBytes + facts.unknownBytes, log.size());
    EXPECT_EQ(facts.unknownPieces, facts.unknownSamples.size());
    Cut seen = {facts.lines, facts.knownTexts, facts.gluedTexts};
    std::uint64_t unknownBytes = 0;
    for (const view::UnknownPiece& piece : facts.unknownSamples) {
        seen.unknown.emplace_back(piece.line, piece.bytes);
        unknownBytes += piece.bytes.size();
    }
    EXPECT_EQ(facts.unknownBytes, unknownBytes);
    return seen;
}

const std::string kTrace = "Entered Function f Line 1\n";

// As many lines as `count` says, none of which is known.
std::string unknownLines(unsigned count) {
    std::string lines;
    for (unsigned i = 1; i <= count; ++i) {
        lines += "unknown " + std::to_string(i) + "\n";
    }
    return lines;
}

TEST(LogReader, ReadsAnEmptyLog) {
    EXPECT_EQ(cut(""), Cut());
    EXPECT_EQ(cut("\n\n"), (Cut{2, 0, 0}));
}

TEST(LogReader, TakesApartTheTextsOfALine) {
    EXPECT_EQ(cut("Line: aLine: bIncomplete line: c\n"), (Cut{1, 3, 2}));
    EXPECT_EQ(cut("Byte 0: 0x12Byte 1: 0x0Byte 2: 0xff\n"), (Cut{1, 3, 2}));
    EXPECT_EQ(cut("|loop0| is of no interest to us. Ignoring|ram0| is of no interest to us. Ignoring"),
              (Cut{1, 2, 1}));
}

TEST(LogReader, TakesTheTraceBehindATextWithoutALineEnd) {
    EXPECT_EQ(cut("Line: aEntered Function operator const uint8* Line 12\n"), (Cut{1, 2, 1}));
    EXPECT_EQ(cut("Default ID recievedLeft Function f Line 3\n"), (Cut{1, 2, 1}));
}

TEST(LogReader, TakesTheLastTraceBehindUnknownBytes) {
    EXPECT_EQ(cut("what is thisEntered Function f Line 3\n"), (Cut{1, 1, 1, {{1, "what is this"}}}));
    EXPECT_EQ(cut("Entered Function f, Left Function g, Entered Function h Line 3\n"), (Cut{1, 1, 0}));
    EXPECT_EQ(cut("x Entered Function f, Left Function g Line 3\n"),
              (Cut{1, 1, 1, {{1, "x Entered Function f, "}}}));
    EXPECT_EQ(cut("x Entered Function f Line\n"),
              (Cut{1, 0, 0, {{1, "x "}, {1, "Entered Function f Line"}}}));
}

TEST(LogReader, FollowsAFieldOverLineEnds) {
    const Model model = modelOf(kDasBanner + diskLine("/dev/sd\na", "\n6\n") + diskLine("/dev/sdb", "7"));
    EXPECT_EQ(disksOf(model), (Disks{{"/dev/sd\na", "\n6\n"}, {"/dev/sdb", "7"}}));
    EXPECT_EQ(cut("Found T10 Id: AC\nME \nGot ULID\n"), (Cut{3, 2, 0}));
}

TEST(LogReader, TakesTheTextsBehindOneThatRanOverALineEnd) {
    EXPECT_EQ(
        cut("Failed to open path '/a\nb'Failed to open path '/c\n'Entered Function f Line 3\nwhat is this\n"),
        (Cut{4, 3, 2, {{4, "what is this"}}}));
}

TEST(LogReader, CountsOnlyTheFirstLineOfATextWithoutItsRestAsUnknown) {
    EXPECT_EQ(cut("Found T10 Id: ACME\nGot ULID\nGet LunID\n"), (Cut{3, 2, 0, {{1, "Found T10 Id: ACME"}}}));
}

TEST(LogReader, ExpectsNoRestBehindATraceLine) {
    EXPECT_EQ(cut("Found T10 Id: ACME\nEntered Function f Line 3\nGot it \n"),
              (Cut{3, 1, 0, {{1, "Found T10 Id: ACME"}, {3, "Got it "}}}));
}

TEST(LogReader, FollowsATextOver32LinesAtMost) {
    const std::string field(31, '\n');
    EXPECT_EQ(cut("Found T10 Id: " + field + " \n"), (Cut{32, 1, 0}));
    EXPECT_EQ(cut("Found T10 Id: \n" + field + " \n"), (Cut{33, 0, 0, {{1, "Found T10 Id: "}, {33, " "}}}));
}

TEST(LogReader, HoldsOnlyTheTextsThatMayGoOn) {
    std::string log = kDasBanner;
    Disks disks;
    for (unsigned i = 0; i < 40; ++i) {
        log += "Found T10 Id: ACME\n" + diskLine("/dev/" + std::to_string(i), "6");
        disks.emplace_back("/dev/" + std::to_string(i), "6");
    }
    const Model model = modelOf(log);
    EXPECT_EQ(disksOf(model), disks);
    EXPECT_EQ(model.log.unknownPieces, 40);
}

TEST(LogReader, TakesEveryLineBehindOpenEndedTextForItsPartUpToATraceLine) {
    EXPECT_EQ(cut("Buffer got = Pseudo name=emcpowera\nLogical device ID=6\nDisk name 'x\n\nGot ULID\n" +
                  kTrace + "Line: y\nwhat is this\n"),
              (Cut{8, 3, 0, {{8, "what is this"}}}));
}

TEST(LogReader, CountsUnknownPiecesAndKeepsTheFirstFive) {
    const LogFacts facts = modelOf(kRunStart + unknownLines(7)).log;
    EXPECT_EQ(facts.unknownPieces, 7);
    EXPECT_EQ(facts.unknownBytes, 7 * std::string("unknown 1").size());
    std::vector<std::pair<std::uint64_t, std::string>> samples;
    for (const view::UnknownPiece& piece : facts.unknownSamples) {
        samples.emplace_back(piece.line, piece.bytes);
    }
    EXPECT_EQ(samples,
              (std::vector<std::pair<std::uint64_t, std::string>>{
                  {2, "unknown 1"}, {3, "unknown 2"}, {4, "unknown 3"}, {5, "unknown 4"}, {6, "unknown 5"}}));
}

TEST(LogReader, KeepsTheFirst120BytesOfAnUnknownPiece) {
    const LogFacts facts = modelOf(std::string(1000, 'x') + "\n").log;
    ASSERT_EQ(facts.unknownSamples.size(), 1);
    EXPECT_EQ(facts.unknownSamples[0].bytes, std::string(120, 'x'));
    EXPECT_EQ(facts.unknownBytes, 1000);
}

TEST(LogReader, ReadsALogThatIsCutInTheMiddleOfALine) {
    const Model model = modelOf(kRunStart + kDasBanner + diskLine("/dev/sda", "6") + "--------> Device Na");
    EXPECT_EQ(disksOf(model), (Disks{{"/dev/sda", "6"}}));
    EXPECT_TRUE(model.log.cutInLine);
    EXPECT_EQ(model.log.lines, 4);
    EXPECT_EQ(model.log.unknownSamples.size(), 1);
    EXPECT_FALSE(modelOf(kRunStart).log.cutInLine);
}

TEST(LogReader, ReportsTheLastOfSeveralRuns) {
    const std::string first = kRunStart + kDasBanner + diskLine("/dev/sda", "6") + kRunEnd;
    const std::string second = kRunStart + kDasBanner + diskLine("/dev/sdb", "7") + kRunEnd;
    const Model model = modelOf(first + second);
    EXPECT_EQ(disksOf(model), (Disks{{"/dev/sdb", "7"}}));
    EXPECT_EQ(model.log.runs, 2U);
    EXPECT_TRUE(model.log.complete);
    EXPECT_EQ(model.log.leftoverTexts, 0);
}

TEST(LogReader, LeavesOutAnOlderRunsTextsBehindTheEnd) {
    const Model model = modelOf(kRunStart + kDasBanner + diskLine("/dev/sda", "6") + kRunEnd + kRule +
                                "Got ULID\n" + diskLine("/dev/sdb", "7") + diskLine("/dev/sdc", "8"));
    EXPECT_EQ(disksOf(model), (Disks{{"/dev/sda", "6"}}));
    EXPECT_TRUE(model.log.complete);
    EXPECT_EQ(model.log.leftoverTexts, 2);
}

TEST(LogReader, LeavesOutTextsBeforeTheFirstRun) {
    const Model model =
        modelOf(diskLine("/dev/sda", "6") + kRunStart + kDasBanner + diskLine("/dev/sdb", "7"));
    EXPECT_EQ(disksOf(model), (Disks{{"/dev/sdb", "7"}}));
    EXPECT_FALSE(model.log.beginsInside);
    EXPECT_EQ(model.log.leftoverTexts, 1);
}

TEST(LogReader, ReadsALogWhoseBeginningIsMissing) {
    const Model model = modelOf(diskLine("/dev/sda", "6") + kRunEnd);
    EXPECT_EQ(disksOf(model), (Disks{{"/dev/sda", "6"}}));
    EXPECT_TRUE(model.log.beginsInside);
    EXPECT_TRUE(model.log.complete);
}

TEST(LogReader, EndsOpenEndedTextWhereTheNextRunBegins) {
    const Model model = modelOf(kRunStart + "Buffer got = x\ny\n" + kRule + kRunStart + kDasBanner +
                                diskLine("/dev/sda", "6") + kRunEnd);
    EXPECT_EQ(disksOf(model), (Disks{{"/dev/sda", "6"}}));
    EXPECT_EQ(model.log.runs, 2U);
}

TEST(LogReader, LeavesPiecesOfVendorAndProductThatHoldLineEndsUnknown) {
    EXPECT_EQ(cut("Vendor AC\nME ProductId DISK\nTimeout\n9 ProductRev 1\n"),
              (Cut{4, 1, 0, {{1, "Vendor AC"}, {2, "ME ProductId DISK"}, {4, "9 ProductRev 1"}}}));
}

TEST(LogReader, SaysTheSameWhateverTheChunks) {
    const std::string log =
        unknownLines(3) + kRunStart + "Line: aLine: bEntered Function f Line 1\nFound T10 Id: A\nB \n" +
        "Buffer got = x\ny\nFound T10 Id: ACME\nGot ULID\n" + kDasBanner + diskLine("/dev/sd\na", "\xff") +
        diskLine("/dev/sdb", "7") + kRunEnd + "--------> Dev";
    const std::string whole = view::toJson(modelOf(log)).dump();
    for (std::size_t chunk = 1; chunk < log.size(); ++chunk) {
        EXPECT_EQ(view::toJson(modelOf(log, chunk)).dump(), whole) << chunk;
    }
}

TEST(LogReader, CutsALineBeyond16MiBAtOnePlaceWhateverTheChunks) {
    constexpr std::size_t kLongest = 16UL * 1024 * 1024;
    std::string log(kLongest, 'x');
    log += diskLine("/dev/sda", "6");
    for (const std::size_t chunk : {std::size_t{0}, kLongest - 1, kLongest, kLongest + 1}) {
        const Model model = modelOf(log, chunk);
        EXPECT_EQ(disksOf(model), (Disks{{"/dev/sda", "6"}})) << chunk;
        EXPECT_EQ(model.log.lines, 1) << chunk;
        EXPECT_EQ(model.log.unknownBytes, kLongest) << chunk;
    }
}

TEST(LogReader, NumbersTheLineWhereATextBegins) {
    const Model model =
        modelOf(kRunStart + kDasBanner +
                "Found T10 Id: A\n\nB \n--------> Device Name: |/dev/s\nr0| is not supported\n" +
                "|ram0| is of no interest to us. Ignoring\n" + kRunEnd);
    std::vector<std::uint64_t> lines;
    for (const view::Problem& problem : model.problems) {
        lines.push_back(problem.line);
    }
    EXPECT_EQ(lines, (std::vector<std::uint64_t>{6, 8}));
}

TEST(LogReader, ReadsAStreamToItsEnd) {
    std::istringstream input(kRunStart + kRunEnd);
    const Model model = view::readLog(input, "a name");
    EXPECT_EQ(model.log.name, "a name");
    EXPECT_EQ(model.log.bytes, input.str().size());
    EXPECT_TRUE(model.log.complete);
}

} // namespace
