// Every simulated host of this folder: what Morvane does there, as a whole. A host is a folder with
//   host.toml         the description (simhost/README.md)
//   expected.log      the whole log, normalised (log_comparison.hpp)
//   expected.record   what was asked of the host: the commands, then the disks
// and, where a run does not end with "Test completed.\n", nothing on standard error and status 0,
//   expected.output, expected.error, expected.status
// With MORVANE_ACCEPT set in the environment the files are written instead of compared; review the
// difference.
#include <algorithm>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <map>
#include <sstream>

#include <gtest/gtest.h>

#include "tests/hosts/log_comparison.hpp"
#include "tests/support/process.hpp"

namespace test {
namespace {

namespace fs = std::filesystem;

using Texts = std::map<std::string, std::string>; // by the name of the file that holds the expected one

const Texts kDefaults = {
    {"expected.output", "Test completed.\n"}, {"expected.error", ""}, {"expected.status", "0\n"}};

const fs::path kHostsFolder = HOSTS_FOLDER;

std::vector<std::string> hostNames() {
    std::vector<std::string> names;
    for (const auto& entry : fs::directory_iterator(kHostsFolder)) {
        if (fs::exists(entry.path() / "host.toml")) {
            names.push_back(entry.path().filename());
        }
    }
    std::sort(names.begin(), names.end());
    return names;
}

// The record with the commands first and what was asked of the disks behind them: a command whose pipe is not
// waited for runs beside the program, so that its place among the others is not the same in each run.
std::string commandsFirst(const std::string& record) {
    std::istringstream lines(record);
    std::string commands;
    std::string others;
    for (std::string line; std::getline(lines, line);) {
        (line.rfind("run ", 0) == 0 ? commands : others) += line + "\n";
    }
    return commands + others;
}

Texts runOnHost(const std::string& name) {
    ::setenv("LC_ALL", "C", 1); // what the shell's tools say and take for text
    const TemporaryDirectory scratch;
    const fs::path work = scratch.path() / "work";
    const fs::path record = scratch.path() / "record";
    fs::create_directory(work);
    const ProcessResult result = runProcess({SIMHOST_PROGRAM, kHostsFolder / name / "host.toml", "--record",
                                             record.string(), "--", MORVANE_PROGRAM},
                                            work);
    return {{"expected.log", normalised(contentOf(work / "MorvaneLogs/Morvane.log"))},
            {"expected.record", commandsFirst(contentOf(record))},
            {"expected.output", result.output},
            {"expected.error", result.error},
            {"expected.status", std::to_string(result.status) + "\n"}};
}

void accept(const fs::path& folder, const Texts& texts) {
    for (const auto& [file, text] : texts) {
        const auto usual = kDefaults.find(file);
        if (usual != kDefaults.end() && usual->second == text) {
            fs::remove(folder / file);
        } else {
            std::ofstream(folder / file, std::ios::binary) << text;
        }
    }
}

class SimulatedHost : public testing::TestWithParam<std::string> {};

TEST_P(SimulatedHost, isReportedAsExpected) {
    const fs::path folder = kHostsFolder / GetParam();
    const Texts actual = runOnHost(GetParam());
    if (std::getenv("MORVANE_ACCEPT") != nullptr) {
        accept(folder, actual);
        return;
    }
    for (const auto& [file, text] : actual) {
        const auto usual = kDefaults.find(file);
        const bool stored = fs::exists(folder / file);
        EXPECT_TRUE(stored || usual != kDefaults.end()) << "no " << file;
        const std::string difference = firstDifference(
            stored || usual == kDefaults.end() ? contentOf(folder / file) : usual->second, text);
        EXPECT_TRUE(difference.empty()) << file << ": " << difference;
    }
}

INSTANTIATE_TEST_SUITE_P(Hosts, SimulatedHost, testing::ValuesIn(hostNames()),
                         [](const testing::TestParamInfo<std::string>& host) {
                             std::string name = host.param;
                             std::replace(name.begin(), name.end(), '-', '_');
                             return name;
                         });

} // namespace
} // namespace test
