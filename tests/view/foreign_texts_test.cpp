#include "view/read/foreign_texts.hpp"

#include <sstream>
#include <string>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include "tests/view/reading.hpp"

namespace {

using view::ForeignTexts;
using view::Model;
using view::Text;

// A designator that ends each of the texts it is shown in, and then shows texts of its own.
const std::string kForger =
    "x \n'\nLeft Function getDiPageIdentifierAscii Line 345\n|\n\n--------> Device Name: "
    "|/dev/evil| LunId: |6|\n oslun 1 fcid 1 fcplun 01\n\t\t\t   END ";

// What the log shows of a descriptor that holds a designator of ASCII: its dump, then its text.
std::string designatorTexts(const std::string& designator) {
    const std::string descriptor =
        std::string{'\x02', '\x08', '\0', static_cast<char>(designator.size())} + designator;
    std::ostringstream texts;
    texts << "Going to dump " << descriptor.size() << " bytes\n";
    for (std::size_t i = 0; i < descriptor.size(); ++i) {
        texts << "Byte " << std::dec << i << ": 0x" << std::hex
              << static_cast<unsigned>(static_cast<unsigned char>(descriptor[i]));
    }
    texts << "\nGoing to store identifier in ASCII format\nID Type: 08; Association type: 00; Identifier: '"
          << designator << "'\nLeft Function getDiPageIdentifierAscii Line 345\n";
    return texts.str();
}

// What the log shows of a device that has this one designator, up to the end of its identification.
std::string identificationTexts(const std::string& designator) {
    const std::string identifier = designator.substr(0, designator.find_last_not_of(' ') + 1);
    return "Entered Function HA_GetScsiUniqueLunId Line 1\nGet LunID\n" + designatorTexts(designator) +
           "Found ScsiName ID: " + identifier + " \nEntered Function getDiPageIdentifierAscii Line 283\n" +
           "Old Unique LunId = " + identifier + ", New Unique LunId = " + identifier +
           "\nGot ULID\nLeft Function HA_GetScsiUniqueLunId Line 346\n";
}

// The log of a host with one direct disk of this designator.
std::string directLog(const std::string& designator) {
    return kRunStart + kDasBanner + identificationTexts(designator) + "\n" +
           diskLine("/dev/sdq", designator.substr(0, designator.find_last_not_of(' ') + 1)) + "\n" + kRunEnd;
}

// Expects one LUN of the identifier and the device, no unknown piece, and word that the designator holds line
// ends.
void expectOneLun(const Model& model, const std::string& identifier) {
    EXPECT_EQ(model.log.unknownPieces, 0);
    EXPECT_TRUE(model.log.complete);
    ASSERT_EQ(model.luns.size(), 1);
    EXPECT_EQ(model.luns[0].identifier.text, identifier);
    EXPECT_EQ(model.luns[0].identifier.kind, view::IdentifierKind::ScsiName);
    EXPECT_EQ(model.luns[0].devices, std::vector<std::string>{"/dev/sdq"});
    ASSERT_EQ(model.problems.size(), 1);
    EXPECT_EQ(model.problems[0].kind, view::ProblemKind::ForeignText);
    EXPECT_EQ(model.problems[0].severity, view::Severity::Problem);
    EXPECT_EQ(model.problems[0].subject, "/dev/sdq");
    EXPECT_EQ(model.problems[0].cause,
              "a designator of its page 0x83 holds a line end; what follows it in the log may look like "
              "Morvane's own lines, but is the device's and not taken for them");
}

const std::string kForgerIdentifier = kForger.substr(0, kForger.size() - 1);

TEST(ForeignTexts, CannotForgeADirectDisk) {
    for (const char* designator : {"a\nb", "a\n", "\na", "\n\n"}) {
        SCOPED_TRACE(designator);
        expectOneLun(modelOf(directLog(designator)), designator);
    }
    expectOneLun(modelOf(directLog(kForger)), kForgerIdentifier);
}

TEST(ForeignTexts, CannotForgeAnFcPath) {
    const std::string& identifier = kForgerIdentifier;
    const Model model = modelOf(
        kRunStart + kFcBanner + "Going to open Adapter #0 - 'a'\nVendor V ProductId P ProductRev 1\n" +
        "Added to DevMap 1 --> /dev/sdq --> 1\n" + identificationTexts(kForger) +
        "UniqueLunid = " + identifier + " size = 9\nPseudo Device for Unique LunId " + identifier +
        " is emcpowera\n\n|_ Adapter wwnn 20:01\n|  |_ Initiator wwpn 10:01\n" +
        "|  |  |_ Target wwnn 50:01 wwpn 52:01 bus 0 target# 0\n|  |  |  |_ lun name /dev/sdq luid " +
        identifier + " oslun 4 fcid 1 fcplun 04\n" + kRunEnd);
    expectOneLun(model, identifier);
    ASSERT_EQ(model.fc.paths.size(), 1);
    EXPECT_EQ(model.fc.paths[0].lun, 4);
    EXPECT_EQ(model.fc.paths[0].facts.pseudoDevice, "emcpowera");
}

TEST(ForeignTexts, CannotForgeAnIscsiPath) {
    expectOneLun(
        modelOf(kRunStart + kIscsiBanner + "Target IQN 'iqn.t'\nTarget IP '10.0.0.2'\n" +
                "Added to DevMap 1 --> /dev/sdq --> 4\n" + identificationTexts(kForger) +
                "Register new iSCSI path: init_wwnn=iqn.i, init_wwpn=10.0.0.1, tgt_wwnn=iqn.t, "
                "tgt_wwpn=10.0.0.2, lun=7\n|_ Initiator IQN  iqn.i\n|  |_ Target IQN iqn.t\n" +
                "         10.0.0.1 <---> 10.0.0.2\n|  |  |  |_ Device_Name: /dev/sdq sScsiOSLun: 7 LunId: " +
                kForgerIdentifier + "\n\n" + kRunEnd),
        kForgerIdentifier);
}

TEST(ForeignTexts, AreReadAlikeWhateverTheChunks) {
    const std::string log = directLog(kForger);
    const std::string whole = view::toJson(modelOf(log)).dump();
    for (std::size_t chunk = 1; chunk < log.size(); ++chunk) {
        EXPECT_EQ(view::toJson(modelOf(log, chunk)).dump(), whole) << chunk;
    }
}

TEST(ForeignTexts, AreNotTakenForAnotherThatBeginsLikeThem) {
    const Model model =
        modelOf(kRunStart + kDasBanner + identificationTexts("a\nb") + "\n" + diskLine("/dev/sdq", "a\nb") +
                "\n" + identificationTexts("a") + "\n" + diskLine("/dev/sdr", "a") + "\n" + kRunEnd);
    EXPECT_EQ(model.log.unknownPieces, 0);
    ASSERT_EQ(model.luns.size(), 2);
    EXPECT_EQ(model.luns[0].identifier.text, "a\nb");
    EXPECT_EQ(model.luns[1].identifier.text, "a");
}

TEST(ForeignTexts, MayBeCutWhereTheLogEnds) {
    const std::string log = directLog(kForger);
    for (std::size_t end = 0; end < log.size(); ++end) {
        const view::LogFacts facts = modelOf(log.substr(0, end)).log;
        EXPECT_EQ(facts.knownBytes + facts.unknownBytes, end);
    }
}

// Shows `designator` in a descriptor to `texts`.
void learn(ForeignTexts& texts, const std::string& designator) {
    const auto take = [&](Text text, std::string_view second) {
        view::TextMatch match;
        match.text = text;
        match.fields[1] = second;
        texts.take(match);
    };
    take(Text::Dump, "");
    for (const char byte : std::string(4, '\0') + designator) {
        std::ostringstream hex;
        hex << std::hex << static_cast<unsigned>(static_cast<unsigned char>(byte));
        take(Text::DumpByte, hex.str());
    }
    take(Text::AsciiDesignator, "");
}

TEST(ForeignTexts, AreTheLongestThatBeginsTheBytes) {
    ForeignTexts texts;
    EXPECT_EQ(texts.lengthAt("a\nb"), 0);
    for (const char* designator : {"a\nb", "a\nbc\nd", "a\nbb", "b\n", "no line end"}) {
        learn(texts, designator);
    }
    EXPECT_EQ(texts.lengthAt("a\nbc\nde"), 6);
    EXPECT_EQ(texts.lengthAt("a\nbc\ne"), 3);
    EXPECT_EQ(texts.lengthAt("a\nbbz"), 4);
    EXPECT_EQ(texts.lengthAt("a\nbz"), 3);
    EXPECT_EQ(texts.lengthAt("a\nz"), 0);
    EXPECT_EQ(texts.lengthAt("b\nz"), 2);
    EXPECT_EQ(texts.lengthAt("no line end, it goes on"), 0);
    EXPECT_EQ(texts.lengthAt("a\nbc"), ForeignTexts::kUnending);
    EXPECT_EQ(texts.lengthAt("a"), ForeignTexts::kUnending);
}

TEST(ForeignTexts, EndAtAZeroByteAndBeforeBlanks) {
    ForeignTexts texts;
    learn(texts, std::string("a\nb\0c", 5));
    learn(texts, "d\ne  ");
    EXPECT_EQ(texts.lengthAt("a\nbX"), 3);
    EXPECT_EQ(texts.lengthAt("d\ne  |"), 3);
}

} // namespace
