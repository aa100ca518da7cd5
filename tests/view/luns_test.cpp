#include "view/model/luns.hpp"

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "tests/view/reading.hpp"

namespace {

using view::Model;

std::string adapterLines(const std::string& number) {
    return "|_ Adapter wwnn 20:0" + number + "\n|  |_ Initiator wwpn 10:0" + number + "\n";
}

// An FC path's report lines.
std::string pathLines(const std::string& targetPort, const std::string& device, const std::string& identifier,
                      const std::string& lun) {
    return "|  |  |_ Target wwnn 50:00 wwpn " + targetPort + " bus 0 target# 0\n|  |  |  |_ lun name " +
           device + " luid " + identifier + " oslun " + lun + " fcid 1 fcplun 0" + lun + "\n";
}

std::string iscsiLines(const std::string& device, const std::string& identifier,
                       const std::string& lun = "0") {
    return "|_ Initiator IQN  iqn.i\n|  |_ Target IQN iqn.t\n         10.0.0.1 <---> 10.0.0.2\n|  |  |  |_ "
           "Device_Name: " +
           device + " sScsiOSLun: " + lun + " LunId: " + identifier + "\n\n";
}

// Each LUN in a line: identifier, devices, number of sightings.
std::vector<std::string> lunsOf(const Model& model) {
    std::vector<std::string> luns;
    for (const view::Lun& lun : model.luns) {
        std::string words = lun.identifier.text + ":";
        for (const std::string& device : lun.devices) {
            words += " " + device;
        }
        luns.push_back(words + ", seen " + std::to_string(lun.sightings.size()));
    }
    return luns;
}

// Why identifiers are not unique, in the order of the LUNs; empty for one that is.
std::vector<std::string> reasonsOf(const Model& model) {
    std::vector<std::string> reasons;
    for (const view::Lun& lun : model.luns) {
        reasons.push_back(lun.notUnique);
    }
    return reasons;
}

using Lines = std::vector<std::string>;

TEST(Luns, GroupPathsOfOneIdentifierWhateverTheTree) {
    const Model model =
        modelOf(kFcBanner + adapterLines("1") + pathLines("52:01", "/dev/sda", "6", "0") +
                pathLines("52:02", "/dev/sdb", "7", "1") + pathLines("52:02", "/dev/sdc", "6", "0") +
                kIscsiBanner + iscsiLines("/dev/sdd", "7") + kDasBanner + diskLine("/dev/sde", "6"));
    EXPECT_EQ(lunsOf(model),
              (Lines{"6: /dev/sda /dev/sdc /dev/sde, seen 3", "7: /dev/sdb /dev/sdd, seen 2"}));
    EXPECT_EQ(reasonsOf(model), (Lines{"", ""}));
}

TEST(Luns, CountADeviceOnceThatIsListedBelowTwoPorts) {
    const std::string path = pathLines("52:01", "/dev/sda", "6", "0");
    const Model model = modelOf(kFcBanner + adapterLines("1") + path + "|  |_ Initiator wwpn 10:02\n" + path);
    EXPECT_EQ(lunsOf(model), (Lines{"6: /dev/sda, seen 2"}));
}

TEST(Luns, HoldWhatTheTreeLeavesOut) {
    const Model model =
        modelOf(kFcBanner + "Going to open Adapter #0 - 'a'\nAdded to DevMap 1 --> /dev/sda --> 1\n"
                            "UniqueLunid = 6 size = 1\nGoing to open Adapter #1 - 'b'\n");
    EXPECT_EQ(lunsOf(model), (Lines{"6: /dev/sda, seen 1"}));
    ASSERT_EQ(model.luns.size(), 1);
    EXPECT_EQ(model.luns[0].sightings[0].place, view::Sighting::Place::Unlisted);
}

TEST(Luns, LeaveOutWhatHasNoIdentifier) {
    const Model model = modelOf(kIscsiBanner + iscsiLines("/dev/sda", ":-( SCSI_Inquiry_Failed") +
                                kDasBanner + diskLine("/dev/sdb", "host::/dev/sdb"));
    EXPECT_EQ(lunsOf(model), Lines());
}

TEST(Luns, AreNotUniqueWithAnIdentifierThatTellsNothing) {
    const Model model = modelOf(kRunStart + kDasBanner + diskLine("/dev/sda", "") +
                                diskLine("/dev/sdb", "00 0") + diskLine("/dev/sdc", "01") + kRunEnd);
    EXPECT_EQ(
        reasonsOf(model),
        (Lines{"an empty identifier is none",
               "blanks or zeros are no identifier; a device that refuses page 0x83 is given them", ""}));
    EXPECT_EQ(
        sectionOf(model, "problems"),
        R"([{"severity":"problem","kind":"identifier-not-unique","tree":"run","subject":"",)"
        R"("cause":"not unique, 1 device carries it: an empty identifier is none","line":null},)"
        R"({"severity":"problem","kind":"identifier-not-unique","tree":"run","subject":"00 0",)"
        R"("cause":"not unique, 1 device carries it: blanks or zeros are no identifier; a device that refuses )"
        R"(page 0x83 is given them","line":null}])");
}

TEST(Luns, AreNotUniqueWithAnIdentifierAtSeveralNumbersOfOneTarget) {
    const std::string numbers = "several LUN numbers of one target carry it";
    EXPECT_EQ(reasonsOf(modelOf(kFcBanner + adapterLines("1") + pathLines("52:01", "/dev/sda", "6", "0") +
                                pathLines("52:01", "/dev/sdb", "6", "1"))),
              Lines{numbers});
    EXPECT_EQ(reasonsOf(modelOf(kIscsiBanner + iscsiLines("/dev/sda", "6", "0") +
                                iscsiLines("/dev/sdb", "6", "1"))),
              Lines{numbers});
}

TEST(Luns, AreUniqueWithOneNumberAtEachTarget) {
    const Model model = modelOf(kFcBanner + adapterLines("1") + pathLines("52:01", "/dev/sda", "6", "0") +
                                pathLines("52:02", "/dev/sdb", "6", "1"));
    EXPECT_EQ(reasonsOf(model), Lines{""});
}

// A page 83h with one NAA designator that ends in `last`.
view::Page83 pageOf(std::uint8_t last) {
    return std::make_shared<const std::vector<std::uint8_t>>(
        std::vector<std::uint8_t>{0, 0x83, 0, 12, 1, 3, 0, 8, 0x50, 0, 0xc5, 0, 0, 0, 0, last});
}

TEST(Luns, AreAProblemWhereOtherProgramsNameTheirPathsDifferently) {
    Model model;
    const view::Identifier identifier = {"6", view::IdentifierKind::Naa};
    model.direct.devices = {{"/dev/sda", identifier, pageOf(1)},
                            {"/dev/sdb", identifier, pageOf(1)},
                            {"/dev/sdc", identifier, pageOf(2)},
                            {"/dev/sdd", identifier, pageOf(3)}};
    view::groupLuns(model);
    EXPECT_EQ(
        sectionOf(model, "problems"),
        R"([{"severity":"problem","kind":"names-differ","tree":"run","subject":"6",)"
        R"("cause":"/dev/sdc answers with other designators than /dev/sda: to multipath, the kernel or )"
        R"(udev they are two LUNs","line":null}])");
}

TEST(Luns, AreNoProblemWhereTheirPathsAnswerAlikeOrNotAtAll) {
    Model model;
    const view::Identifier identifier = {"6", view::IdentifierKind::Naa};
    model.direct.devices = {{"/dev/sda", identifier, nullptr},
                            {"/dev/sdb", identifier, pageOf(1)},
                            {"/dev/sdc", identifier, pageOf(1)}};
    view::groupLuns(model);
    EXPECT_EQ(sectionOf(model, "problems"), "[]");
}

TEST(Luns, PutProblemsBeforeNotes) {
    const Model model =
        modelOf(kRunStart + kDasBanner + "|ram0| is of no interest to us. Ignoring\n" +
                diskLine("/dev/sda", "0") + "|ram1| is of no interest to us. Ignoring\n" + kRunEnd);
    std::vector<std::string> subjects;
    for (const view::Problem& problem : model.problems) {
        subjects.push_back(problem.subject);
    }
    EXPECT_EQ(subjects, (Lines{"0", "/sys/block/ram0", "/sys/block/ram1"}));
}

} // namespace
