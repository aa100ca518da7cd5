#include "main/fc_tree.hpp"

#include <algorithm>
#include <string>

#include <gtest/gtest.h>

#include "fc/tree_build.hpp"
#include "foundation/exceptions.hpp"
#include "tests/support/fake_hba.hpp"
#include "tests/support/fake_identity.hpp"
#include "tests/support/log_capture.hpp"
#include "tests/support/refusing_log.hpp"
#include "tests/support/thrown.hpp"

namespace {

const std::string kBanner = "Entered Function BuildFcTree Line #\n"
                            "\n================================================\n"
                            "============== FC DEVICE DETAILS ==============="
                            "\n================================================\n"
                            "Entered Function sFirstBuildAndOutput Line #\n";
const std::string kLeft = "Left Function BuildFcTree Line #\n";

class FcTree : public testing::Test {
protected:
    void TearDown() override {
        const LogCapture log;
        cleanUpFcTree();
    }

    bool called(const std::string& call) const {
        return std::find(mHba.calls.begin(), mHba.calls.end(), call) != mHba.calls.end();
    }

    FakeHba mHba;
    FakeIdentity mIdentity;
};

TEST_F(FcTree, BuildsAndCleansUpUnderItsBanner) {
    mHba.adapter("alpha", 7, {0x71}).mappings = {{HBA_STATUS_OK, 0, {}}};
    const LogCapture log;
    BuildFcTree();
    const std::string text = log.text();
    EXPECT_EQ(text.substr(0, kBanner.size()), kBanner);
    const std::string end = "Going to free library\n"
                            "Entered Function HA_FreeHbaapi Line #\n"
                            "Going to free the HBAAPI library\n"
                            "Freed HBAAPI library\n"
                            "Left Function HA_FreeHbaapi Line #\n" +
                            kLeft;
    EXPECT_TRUE(text.ends_with(end)) << text;
    EXPECT_TRUE(called("HBA_CloseAdapter 7"));
    EXPECT_TRUE(called("HBA_FreeLibrary"));
}

TEST_F(FcTree, LetsAHaltOutWithoutExitTraceAndCleanUp) {
    const LogCapture log;
    EXPECT_EQ(messageOf<THaltEx>(BuildFcTree), "There are no adapters on the system\n");
    EXPECT_TRUE(log.text().ends_with("The system does not have any adapters\n"
                                     "Left Function sBuildAndOutput Line #\n"))
        << log.text();
    EXPECT_FALSE(called("HBA_FreeLibrary"));
}

TEST_F(FcTree, EndsAtAnHbaapiFailureWithItsLine) {
    mHba.loadStatus = HBA_STATUS_ERROR;
    const LogCapture log;
    BuildFcTree();
    EXPECT_EQ(log.text(), kBanner +
                              "Entered Function HA_LoadHbaapi Line #\n"
                              "Going to open HBAAPI library\n"
                              "Failed to load HBAAPI library : HBA_STATUS_ERROR\n"
                              "Left Function HA_LoadHbaapi Line #\n"
                              "Caught an Hbaapi Exception in testing 'BuildFcTree\n'" +
                              kLeft);
    EXPECT_FALSE(called("HBA_FreeLibrary"));
}

TEST_F(FcTree, EndsAtAnyOtherFailureOfItsOwnWithItsText) {
    mHba.adapter("100%", 7, {0x71});
    const LogCapture log;
    BuildFcTree();
    EXPECT_TRUE(log.text().ends_with("Going to open Adapter #0 - '100%'\n"
                                     "Caught Exception (String Write failed\n) in testing 'BuildFcTree\n'" +
                                     kLeft))
        << log.text();
    EXPECT_FALSE(called("HBA_FreeLibrary"));
}

TEST_F(FcTree, LetsALogThatIsFullOut) {
    const RefusingLog log;
    EXPECT_EQ(messageOf<WriteFailedEx>(BuildFcTree), "File write failed\n");
}

} // namespace
