// A portable build's way to the HBA API library: a program that loads it, run with other files in its place.
#include <fstream>
#include <string>

#include <gtest/gtest.h>

#include "tests/support/process.hpp"

namespace {

const std::string kNotLoaded = "load 1\n";

const std::string kEveryCall = "load 0\n"
                               "adapters 2\n"
                               "name 4: adapter 1\n"
                               "open 9\n"
                               "attributes 8: 10 ports\n"
                               "port 6: 905\n"
                               "mapping 7: 10 entries\n"
                               "closed 9\n"
                               "free 10\n";

class HbaLibrary : public testing::Test {
protected:
    // What the program does with these bytes as the library; env takes `option` besides.
    test::ProcessResult runWith(const std::string& bytes, const std::string& option = "--default-signal") {
        std::ofstream(mScratch.path() / "libHBAAPI.so.2", std::ios::binary) << bytes;
        // A sanitizer is not to report the signal that a damaged file raises.
        return test::runProcess({"/usr/bin/env", option, "LD_LIBRARY_PATH=" + mScratch.path().string(),
                                 "ASAN_OPTIONS=handle_sigbus=0:handle_segv=0:detect_leaks=0", PROBE_PROGRAM},
                                mScratch.path());
    }

    test::TemporaryDirectory mScratch;
};

TEST_F(HbaLibrary, GetsEveryCall) {
    const test::ProcessResult result = runWith(test::contentOf(WHOLE_LIBRARY));
    EXPECT_EQ(result.output, kEveryCall);
    EXPECT_EQ(result.error, "");
    EXPECT_EQ(result.status, 0);
}

TEST_F(HbaLibrary, IsNotLoadedWhenItLacksAFunction) {
    const test::ProcessResult result = runWith(test::contentOf(LACKING_LIBRARY));
    EXPECT_EQ(result.output, kNotLoaded);
    EXPECT_EQ(result.error, "morvane: no Fibre Channel report: " + mScratch.path().string() +
                                "/libHBAAPI.so.2: undefined symbol: HBA_GetFcpTargetMapping\n");
    EXPECT_EQ(result.status, 0);
}

TEST_F(HbaLibrary, IsNotLoadedWhenAFunctionOfItLeadsNowhere) {
    const test::ProcessResult result = runWith(test::contentOf(NOWHERE_LIBRARY));
    EXPECT_EQ(result.output, kNotLoaded);
    EXPECT_EQ(result.error, "morvane: no Fibre Channel report: libHBAAPI.so.2 lacks a function\n");
    EXPECT_EQ(result.status, 0);
}

TEST_F(HbaLibrary, IsLoadedWhereTheEndsOfChildrenAreIgnored) {
    const test::ProcessResult result = runWith(test::contentOf(WHOLE_LIBRARY), "--ignore-signal=CHLD");
    EXPECT_EQ(result.output, kEveryCall);
    EXPECT_EQ(result.error, "");
}

TEST_F(HbaLibrary, IsNotLoadedWhenItIsEmpty) {
    const test::ProcessResult result = runWith("");
    EXPECT_EQ(result.output, kNotLoaded);
    EXPECT_EQ(result.error, "morvane: no Fibre Channel report: " + mScratch.path().string() +
                                "/libHBAAPI.so.2: file too short\n");
    EXPECT_EQ(result.status, 0);
}

TEST_F(HbaLibrary, IsNotLoadedWhenItIsNoLibrary) {
    const test::ProcessResult result = runWith(std::string(4096, 'x'));
    EXPECT_EQ(result.output, kNotLoaded);
    EXPECT_EQ(result.error, "morvane: no Fibre Channel report: " + mScratch.path().string() +
                                "/libHBAAPI.so.2: invalid ELF header\n");
    EXPECT_EQ(result.status, 0);
}

// Wherever a file ends, the program goes on: with the library, if what is missing is of no use, or with one
// line that says what is wrong.
TEST_F(HbaLibrary, IsLoadedWholeOrNotAtAllWhereverItIsCutOff) {
    const std::string whole = test::contentOf(WHOLE_LIBRARY);
    const std::string damaged = "morvane: no Fibre Channel report: libHBAAPI.so.2 is damaged: Bus error\n";
    std::size_t timesDamaged = 0;
    const std::size_t step = whole.size() / 100;
    for (std::size_t size = 0; size < whole.size(); size += step) {
        const test::ProcessResult result = runWith(whole.substr(0, size));
        EXPECT_EQ(result.status, 0) << "of " << size << " bytes";
        if (result.error.empty()) {
            EXPECT_EQ(result.output, kEveryCall) << "of " << size << " bytes";
        } else {
            EXPECT_EQ(result.output, kNotLoaded) << "of " << size << " bytes";
            EXPECT_EQ(result.error.find('\n'), result.error.size() - 1) << result.error;
        }
        if (result.error == damaged) {
            ++timesDamaged;
        }
    }
    EXPECT_GT(timesDamaged, 0);
}

} // namespace
