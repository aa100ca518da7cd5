#include "main/shared/reconfirm_das.hpp"

#include <string>

#include <gtest/gtest.h>

#include "tests/support/host_files.hpp"
#include "tests/support/log_capture.hpp"

namespace {

const std::string kEntered = "Entered Function reconfirmDAS Line #\n";
const std::string kLeft = "Left Function reconfirmDAS Line #\n";

class ReconfirmDas : public testing::Test {
protected:
    // The log of a question that is answered so.
    static std::string answered(uint32 answer) {
        const LogCapture log;
        EXPECT_EQ(reconfirmDAS("/dev/sdb"), answer);
        return log.text();
    }

    // The lines of a directory's entries, in the order in which it is read, up to the first that begins with
    // "fc_transport".
    std::string entryLines() const {
        std::string lines;
        for (const std::string& name : mFiles.entries("/sy")) {
            lines += "Entry name " + name + "\n";
            if (name.rfind("fc_transport", 0) == 0) {
                break;
            }
        }
        return lines;
    }

    HostFiles mFiles;
};

TEST_F(ReconfirmDas, ConfirmsADiskOnASystemWithoutALinkNamedSy) {
    EXPECT_EQ(answered(1), kEntered);
}

TEST_F(ReconfirmDas, DoesNotLookAtTheDisksOwnEntry) {
    mFiles.link("/sys/block/sdb/device", "../../fc_transport");
    EXPECT_EQ(answered(1), kEntered);
}

TEST_F(ReconfirmDas, ConfirmsADiskWhenSyIsNoLink) {
    mFiles.directory("/sy");
    EXPECT_EQ(answered(1), kEntered);
}

TEST_F(ReconfirmDas, ConfirmsADiskWhenTheFirstThreeBytesOfTheLinkHaveNoSlash) {
    mFiles.link("/sy", "abc/fc_transport");
    EXPECT_EQ(answered(1), kEntered);
}

TEST_F(ReconfirmDas, SaysWhenTheDirectoryCannotBeOpened) {
    mFiles.link("/sy", "a/b"); // dangling
    EXPECT_EQ(answered(1), kEntered + "Failed to open path '/sy'");
}

TEST_F(ReconfirmDas, ListsTheEntriesAndConfirmsADiskWithoutFcTransport) {
    mFiles.directory("/d/fc_remote_ports");
    mFiles.file("/d/block", "");
    mFiles.link("/sy", "./d");
    EXPECT_EQ(answered(1), kEntered + entryLines() + kLeft);
    EXPECT_NE(entryLines().find("Entry name ..\n"), std::string::npos);
}

TEST_F(ReconfirmDas, RejectsADiskWithAnFcTransport) {
    mFiles.directory("/d/fc_transport:1");
    mFiles.link("/sy", "./d");
    EXPECT_EQ(answered(0), kEntered + entryLines());
    EXPECT_NE(entryLines().find("Entry name fc_transport:1\n"), std::string::npos);
}

} // namespace
