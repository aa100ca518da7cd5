// whole_run SIMHOST MORVANE RECORDER FLOOR LAUNCH VIEW [SIZE...]: measures whole runs on simulated hosts of
// so many LUNs, each beside its floor, the start-up on an empty host beside /bin/true, and the reading of the
// runs' logs by morvane-view beside a grep for one word in them; prints each as a table.
#include <algorithm>
#include <filesystem>
#include <fstream>
#include <iomanip>
#include <iostream>
#include <sstream>
#include <stdexcept>
#include <string>
#include <vector>

#include "tests/support/process.hpp"

namespace {

struct Programs {
    std::string simhost;
    std::string morvane;
    std::string recorder;
    std::string floor;
    std::string launch;
    std::string view;
};

struct Sample {
    double ownSeconds = 0;
    double childSeconds = 0;
    long peakKib = 0;

    [[nodiscard]] double seconds() const { return ownSeconds + childSeconds; }
};

// The disk and the adapter that all LUNs come from; each LUN is in /sys/block and /proc/partitions too.
void describeHost(const std::filesystem::path& file, unsigned luns) {
    std::ofstream out(file);
    out << "hostname = \"bench\"\n";
    if (luns == 0) {
        return;
    }
    const std::string count = "count = " + std::to_string(luns);
    out << "sys_block = [{ link = \"../devices/pci0000:00/0000:00:02.0/host1/block/sd{n}\", " << count
        << " }]\n"
        << "partitions = [{ name = \"sd{n}\", " << count << " }]\n"
        << "[[disk]]\n"
        << count << "\n"
        << R"(node = "/dev/sd{n}"
vendor = "DGC"
product = "RAID 5"
revision = "0430"
designators = [{ type = 1, text = "DGC     CK2000742002710000{n:08x}" },
               { type = 3, hex = "60060160 a1b2c3d4 00000000 {n:08x}" }]
[[adapter]]
name = "qlogic-qle2462-0"
manufacturer = "QLogic Corporation"
model = "QLE2462"
wwnn = "20:00:00:1b:32:0a:11:22"
ports = ["21:00:00:1b:32:0a:11:22"]
[[adapter.target]]
wwnn = "50:06:01:60:c1:e0:12:34"
wwpn = "50:06:01:61:41:e0:12:34"
)"
        << "luns = [{ device = \"/dev/sd{n}\", " << count << " }]\n";
}

class Bench {
public:
    Bench(Programs programs, unsigned luns) : mPrograms(std::move(programs)) {
        describeHost(path("host.toml"), luns);
    }

    // Records a run, and makes sure that the floor's log is that run's log.
    void record() {
        onHost({"/usr/bin/env", "LD_PRELOAD=" + mPrograms.recorder, "MORVANE_RECORDING=" + path("recording"),
                mPrograms.morvane});
        for (const char* const kind : {"stdio", "bytes"}) {
            floor(kind);
            if (test::contentOf(path("floor.log")) != test::contentOf(path("MorvaneLogs/Morvane.log"))) {
                throw std::runtime_error(std::string("the log of the floor of ") + kind +
                                         " is not the recorded run's");
            }
        }
    }

    Sample morvane() { return launched({mPrograms.morvane}); }

    // The floor of `kind`: stdio or bytes.
    Sample floor(const char* kind) {
        std::string output;
        Sample sample = launched({mPrograms.floor, path("recording"), path("floor.log"), kind}, &output);
        sample.ownSeconds -= std::stod(output); // the preparation
        return sample;
    }

    Sample nothing() { return launched({"/bin/true"}); }

    // The log of the last run, read.
    Sample view() { return launched({mPrograms.view}); }
    Sample grep() { return launched({"/bin/grep", "-c", "Entered", "MorvaneLogs/Morvane.log"}); }

    [[nodiscard]] std::uintmax_t logBytes() const {
        return std::filesystem::file_size(mFolder.path() / "MorvaneLogs/Morvane.log");
    }

private:
    [[nodiscard]] std::string path(const char* name) const { return mFolder.path() / name; }

    std::string onHost(const std::vector<std::string>& command) {
        std::vector<std::string> words = {mPrograms.simhost, path("host.toml"), "--"};
        words.insert(words.end(), command.begin(), command.end());
        const test::ProcessResult result = test::runProcess(words, mFolder.path());
        if (result.status != 0) {
            throw std::runtime_error(command.back() + ": status " + std::to_string(result.status) + "\n" +
                                     result.error);
        }
        return result.output;
    }

    Sample launched(const std::vector<std::string>& command, std::string* output = nullptr) {
        std::vector<std::string> words = {mPrograms.launch, path("sample")};
        words.insert(words.end(), command.begin(), command.end());
        const std::string said = onHost(words);
        if (output != nullptr) {
            *output = said;
        }
        Sample sample;
        std::istringstream numbers(test::contentOf(path("sample")));
        if (!(numbers >> sample.ownSeconds >> sample.childSeconds >> sample.peakKib)) {
            throw std::runtime_error("no sample");
        }
        return sample;
    }

    Programs mPrograms;
    test::TemporaryDirectory mFolder;
};

// The sample with the least CPU: what others do on the machine only ever adds.
const Sample& best(const std::vector<Sample>& samples) {
    return *std::min_element(samples.begin(), samples.end(), [](const Sample& left, const Sample& right) {
        return left.seconds() < right.seconds();
    });
}

double milliseconds(double seconds) {
    return seconds * 1e3;
}

void measureStartUp(const Programs& programs) {
    constexpr unsigned kRounds = 20;
    Bench bench(programs, 0);
    std::vector<Sample> morvane;
    std::vector<Sample> nothing;
    for (unsigned round = 0; round < kRounds; ++round) {
        morvane.push_back(bench.morvane());
        nothing.push_back(bench.nothing());
    }
    const Sample& own = best(morvane);
    const Sample& least = best(nothing);
    std::cout << std::fixed << std::setprecision(2)
              << "| empty host | CPU ms | in children | peak KiB |\n|---|---|---|---|\n"
              << "| morvane | " << milliseconds(own.ownSeconds) << " | " << milliseconds(own.childSeconds)
              << " | " << own.peakKib << " |\n"
              << "| /bin/true | " << milliseconds(least.ownSeconds) << " | "
              << milliseconds(least.childSeconds) << " | " << least.peakKib << " |\n\n";
}

// What it takes to read the log of a run.
struct Reading {
    unsigned luns = 0;
    std::uintmax_t logBytes = 0;
    Sample view;
    Sample grep;
};

Reading measureReading(Bench& bench, unsigned luns, unsigned rounds) {
    std::vector<Sample> view;
    std::vector<Sample> grep;
    for (unsigned round = 0; round < rounds; ++round) {
        view.push_back(bench.view());
        grep.push_back(bench.grep());
    }
    return {luns, bench.logBytes(), best(view), best(grep)};
}

void printReadings(const std::vector<Reading>& readings) {
    std::cout << "\n| LUNs | log MB | morvane-view ms | grep -c Entered ms | ratio | peak KiB |\n"
                 "|---|---|---|---|---|---|\n";
    for (const Reading& reading : readings) {
        std::cout << "| " << reading.luns << " | " << static_cast<double>(reading.logBytes) / 1e6 << " | "
                  << milliseconds(reading.view.ownSeconds) << " | " << milliseconds(reading.grep.ownSeconds)
                  << " | " << reading.view.ownSeconds / reading.grep.ownSeconds << " | "
                  << reading.view.peakKib << " |\n";
    }
}

void measureSizes(const Programs& programs, const std::vector<unsigned>& sizes) {
    std::vector<Reading> readings;
    std::cout
        << "| LUNs | log MB | morvane ms | in children | stdio floor ms | ratio | bytes floor ms | ratio "
           "| morvane us/LUN | peak KiB | KiB a LUN beyond the first row |\n"
           "|---|---|---|---|---|---|---|---|---|---|---|\n";
    long firstPeakKib = 0;
    for (const unsigned luns : sizes) {
        const unsigned rounds = std::clamp(20000U / luns, 5U, 40U);
        Bench bench(programs, luns);
        bench.record();
        std::vector<Sample> morvane;
        std::vector<Sample> stdio;
        std::vector<Sample> bytes;
        for (unsigned round = 0; round < rounds; ++round) {
            morvane.push_back(bench.morvane());
            stdio.push_back(bench.floor("stdio"));
            bytes.push_back(bench.floor("bytes"));
        }
        const Sample& own = best(morvane);
        const Sample& plain = best(stdio);
        const Sample& least = best(bytes);
        if (luns == sizes.front()) {
            firstPeakKib = own.peakKib;
        }
        const double moreLuns = std::max(1.0, static_cast<double>(luns) - sizes.front());
        std::cout << "| " << luns << std::fixed << std::setprecision(2) << " | "
                  << static_cast<double>(bench.logBytes()) / 1e6 << " | " << milliseconds(own.ownSeconds)
                  << " | " << milliseconds(own.childSeconds) << " | " << milliseconds(plain.ownSeconds)
                  << " | " << own.ownSeconds / plain.ownSeconds << " | " << milliseconds(least.ownSeconds)
                  << " | " << own.ownSeconds / least.ownSeconds << " | " << own.ownSeconds / luns * 1e6
                  << " | " << own.peakKib << " | "
                  << static_cast<double>(own.peakKib - firstPeakKib) / moreLuns << " |" << std::endl;
        readings.push_back(measureReading(bench, luns, rounds));
    }
    printReadings(readings);
}

} // namespace

int main(int argc, char** argv) {
    const std::vector<std::string> arguments(argv + 1, argv + argc);
    if (arguments.size() < 6) {
        std::cerr << "usage: whole_run SIMHOST MORVANE RECORDER FLOOR LAUNCH VIEW [SIZE...]\n";
        return 2;
    }
    std::vector<unsigned> sizes;
    for (std::size_t i = 6; i < arguments.size(); ++i) {
        sizes.push_back(static_cast<unsigned>(std::stoul(arguments[i])));
    }
    if (sizes.empty()) {
        sizes = {10, 100, 1000, 10000};
    }
    const Programs programs = {arguments[0], arguments[1], arguments[2],
                               arguments[3], arguments[4], arguments[5]};
    try {
        measureStartUp(programs);
        measureSizes(programs, sizes);
    } catch (const std::exception& exception) {
        std::cerr << exception.what() << "\n";
        return 1;
    }
    return 0;
}
