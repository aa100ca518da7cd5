// fault_matrix SIMHOST HOST MORVANE INJECTOR: runs Morvane on a simulated host, once whole and then once for
// each of many faults, judges every outcome and prints the matrix. Exit status 0 when none is outside what
// the run's texts allow.
//
// Allowed outcomes:
//  - complete:   status 0, every tree to its end. The fault is reported where it happened, or nobody needs
//                the call.
//  - guarded:    status 0; a tree ended early with its guard's line, every other one ran to its end.
//  - start-up:   status 1 with one of the two lines that say so on standard output.
//  - assertion:  status 1 with the line of a failed assertion at the log's end.
//  - log cut:    on a full file system, as ended or with status 0: the log holds what fitted. Exit flushes
//  the
//                log's last buffer, and what does not fit then is lost without a word.
//  - ended:      status 1 with the exception's text on standard error, for a failure outside the guards:
//  before
//                the first tree, behind the last, or of the log itself.
// Everything else is not: a signal, a run that takes too long, a tree lost that the guards should have saved.
#include <algorithm>
#include <array>
#include <atomic>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <map>
#include <mutex>
#include <regex>
#include <sstream>
#include <string>
#include <thread>
#include <vector>

#include "tests/support/process.hpp"

namespace {

constexpr const char* kMostSeconds = "20"; // of a run that takes a tenth of one
constexpr std::array<const char*, 4> kTrees = {"BuildFcTree", "BuildIscsiTree_Linux", "BuildDasTree_Linux",
                                               "BuildLogicalTree_Linux"};
constexpr std::array<const char*, 4> kTreeNames = {"FC", "ISCSI", "DAS", "LOGICAL"};

struct Programs {
    std::string simhost;
    std::string host;
    std::string morvane;
    std::string injector;
};

struct Fault {
    std::string kind;
    std::string mode; // "only", "from"
    unsigned long number = 0;

    [[nodiscard]] std::string text() const { return kind + ":" + mode + ":" + std::to_string(number); }
};

struct Run {
    test::ProcessResult process;
    std::string log;
    bool hasHit = false;
    std::map<std::string, unsigned long> calls;
};

bool contains(const std::string& text, const std::string& part) {
    return text.find(part) != std::string::npos;
}

Run readRun(const std::filesystem::path& folder, test::ProcessResult process) {
    Run result{std::move(process), test::contentOf(folder / "MorvaneLogs/Morvane.log"), false, {}};
    std::istringstream report(test::contentOf(folder / "report"));
    for (std::string word; report >> word;) {
        if (word == "hit") {
            result.hasHit = true;
        } else {
            report >> result.calls[word];
        }
    }
    return result;
}

std::vector<std::string> command(const Programs& programs, const std::filesystem::path& folder,
                                 const std::string& fault) {
    std::vector<std::string> words = {"/usr/bin/timeout", "--signal=KILL", kMostSeconds,
                                      programs.simhost,   programs.host,   "--",
                                      "/usr/bin/env"};
    words.push_back("LD_PRELOAD=" + programs.injector);
    words.push_back("MORVANE_FAULT_REPORT=" + (folder / "report").string());
    if (!fault.empty()) {
        words.push_back("MORVANE_FAULT=" + fault);
    }
    words.push_back(programs.morvane);
    return words;
}

Run runWith(const Programs& programs, const std::string& fault) {
    const test::TemporaryDirectory folder;
    return readRun(folder.path(), test::runProcess(command(programs, folder.path(), fault), folder.path()));
}

// With the log directory on a file system of `size` bytes, made for this run alone. The log as far as it
// fits.
Run runOnFullDisk(const Programs& programs, const std::string& size) {
    const test::TemporaryDirectory folder;
    std::vector<std::string> words = {
        "/usr/bin/unshare",
        "--mount",
        "/bin/sh",
        "-c",
        "mkdir MorvaneLogs && mount -t tmpfs -o size=" + size +
            " none MorvaneLogs || exit 99; \"$@\"; status=$?; cp MorvaneLogs/Morvane.log .; exit $status",
        "sh"};
    const std::vector<std::string> inner = command(programs, folder.path(), "");
    words.insert(words.end(), inner.begin(), inner.end());
    Run result = readRun(folder.path(), test::runProcess(words, folder.path()));
    result.log = test::contentOf(folder.path() / "Morvane.log");
    result.hasHit = true;
    return result;
}

std::string guardLine(std::size_t tree) {
    return std::string("Caught exception while building ") + kTreeNames.at(tree) + " tree: ";
}

// Whether the log ends with the line of an assertion. A text may stand before it in its line.
bool endsInAssertion(const std::string& log) {
    const std::string end = " ] failed\n";
    const auto start = log.rfind("Assertion [ ");
    return start != std::string::npos && log.size() >= end.size() &&
           log.compare(log.size() - end.size(), end.size(), end) == 0 &&
           log.find('\n', start) == log.size() - 1;
}

// The log's whole lines, without what differs from run to run: times, addresses.
std::vector<std::string> comparableLines(const std::string& log) {
    static const std::regex kVolatile("0x[0-9a-f]{6,}|[0-9]+\\.[0-9]{2}");
    std::vector<std::string> lines;
    std::istringstream stream(log.substr(0, log.rfind('\n') + 1));
    for (std::string line; std::getline(stream, line);) {
        lines.push_back(std::regex_replace(line, kVolatile, "#"));
    }
    return lines;
}

std::string judgeOnFullDisk(const Run& run, const Run& whole) {
    const std::vector<std::string> lines = comparableLines(run.log);
    const std::vector<std::string> expected = comparableLines(whole.log);
    if (lines.empty() || lines.size() >= expected.size() ||
        !std::equal(lines.begin(), lines.end(), expected.begin())) {
        return "NOT ALLOWED: the log is not the beginning of a whole one";
    }
    const bool isCompleted = run.process.status == 0 && run.process.output == "Test completed.\n";
    const bool isEnded = run.process.status == 1 && !run.process.error.empty();
    return isCompleted || isEnded ? "log cut" : "NOT ALLOWED: status " + std::to_string(run.process.status);
}

// The outcome's name, or "NOT ALLOWED: " and why.
std::string judgeFinished(const Fault& fault, const Run& run) {
    if (run.process.output != "Test completed.\n" || !contains(run.log, "\t\t\t   END \n")) {
        return "NOT ALLOWED: status 0 without the closing texts";
    }
    std::size_t guarded = 0;
    for (std::size_t tree = 0; tree < kTrees.size(); ++tree) {
        const bool isEntered = contains(run.log, std::string("Entered Function ") + kTrees.at(tree) + " ");
        const bool isLeft = contains(run.log, std::string("Left Function ") + kTrees.at(tree) + " ");
        const bool isGuarded = contains(run.log, guardLine(tree));
        guarded += isGuarded ? 1U : 0U;
        if (!isGuarded && !(isEntered && isLeft)) {
            return std::string("NOT ALLOWED: the ") + kTreeNames.at(tree) + " tree is lost without a line";
        }
    }
    if (fault.mode == "only" && guarded > 1) {
        return "NOT ALLOWED: one fault, and more than one tree lost";
    }
    return guarded != 0 ? "guarded" : "complete";
}

std::string judge(const Fault& fault, const Run& run, const Run& whole) {
    const int status = run.process.status;
    if (!run.hasHit) {
        return "NOT ALLOWED: the fault did not happen";
    }
    if (fault.kind == "full-disk") {
        return judgeOnFullDisk(run, whole);
    }
    if (status == 0) {
        return judgeFinished(fault, run);
    }
    if (status != 1) {
        return "NOT ALLOWED: status " + std::to_string(status);
    }
    if (run.process.output == "Failed in creating the directory for keeping the log files\n" ||
        run.process.output == "Failed in opening the logfile\n") {
        return "start-up";
    }
    if (endsInAssertion(run.log)) {
        return "assertion";
    }
    const bool isBeforeTrees = !contains(run.log, "FC DEVICE DETAILS");
    const bool isBehindTrees = contains(run.log, std::string("Left Function ") + kTrees.back() + " ") ||
                               contains(run.log, guardLine(kTrees.size() - 1)) ||
                               contains(run.log, "Failed to build Logical tree.\n");
    const bool isLogGone = fault.kind == "log-write" && fault.mode == "from";
    if (run.process.error.empty()) {
        return "NOT ALLOWED: status 1 without a word";
    }
    return isBeforeTrees || isBehindTrees || isLogGone
               ? "ended"
               : "NOT ALLOWED: ended within the trees: " + run.process.error;
}

// At most `most` numbers from 1 to `count`: the first, the last, and those between at even distances.
std::vector<unsigned long> sample(unsigned long count, unsigned long most) {
    std::vector<unsigned long> numbers;
    const unsigned long taken = std::min(count, most);
    for (unsigned long i = 0; i < taken; ++i) {
        numbers.push_back(taken == 1 ? 1 : 1 + i * (count - 1) / (taken - 1));
    }
    return numbers;
}

std::vector<Fault> planFaults(const std::map<std::string, unsigned long>& calls, unsigned long most) {
    std::vector<Fault> faults;
    for (const auto& [kind, count] : calls) {
        if (kind == "signal") {
            continue;
        }
        // A process that may not fork any more stays so.
        for (const char* mode : {"only", "from"}) {
            if (kind == "fork" && std::string(mode) == "only") {
                continue;
            }
            const unsigned long share = std::string(mode) == "only" ? most : most / 4;
            for (const unsigned long number : sample(count, share)) {
                faults.push_back({kind, mode, number});
            }
        }
    }
    for (const unsigned long microseconds : {5000UL, 1000UL, 200UL}) {
        faults.push_back({"signal", "from", microseconds});
    }
    for (const unsigned long kibibytes : {4UL, 8UL, 16UL, 32UL, 48UL}) {
        faults.push_back({"full-disk", "from", kibibytes});
    }
    return faults;
}

class Matrix {
public:
    void add(const Fault& fault, const Run& run, const std::string& outcome) {
        const std::lock_guard lock(mMutex);
        ++mCounts[fault.kind + " (" + fault.mode + ")"][outcome.substr(0, outcome.find(':'))];
        if (outcome.compare(0, 3, "NOT") == 0) {
            mFindings.push_back(fault.text() + "  " + outcome + "\n  standard error: " + run.process.error);
        }
    }

    void print(std::ostream& out) const {
        constexpr std::array<const char*, 7> kOutcomes = {"complete", "guarded", "start-up",   "assertion",
                                                          "ended",    "log cut", "NOT ALLOWED"};
        const auto cell = [&](std::string text, std::size_t width) {
            text.resize(std::max(width, text.size()), ' ');
            out << text;
        };
        cell("fault", 24);
        for (const char* outcome : kOutcomes) {
            cell(outcome, 13);
        }
        out << "tried\n";
        for (const auto& [row, counts] : mCounts) {
            cell(row, 24);
            unsigned tried = 0;
            for (const char* outcome : kOutcomes) {
                const auto found = counts.find(outcome);
                const unsigned count = found == counts.end() ? 0 : found->second;
                tried += count;
                cell(count == 0 ? "-" : std::to_string(count), 13);
            }
            out << tried << "\n";
        }
        for (const std::string& finding : mFindings) {
            out << finding << "\n";
        }
    }

    [[nodiscard]] bool isClean() const { return mFindings.empty(); }

private:
    std::mutex mMutex;
    std::map<std::string, std::map<std::string, unsigned>> mCounts;
    std::vector<std::string> mFindings;
};

int runMatrix(const Programs& programs, unsigned long most) {
    Run whole = runWith(programs, "");
    whole.hasHit = true;
    const std::string outcome = judge({"none", "only", 0}, whole, whole);
    if (outcome != "complete" || whole.calls.empty()) {
        std::cerr << "the run without a fault: " << outcome << "\n" << whole.process.error;
        return EXIT_FAILURE;
    }
    const std::vector<Fault> faults = planFaults(whole.calls, most);
    Matrix matrix;
    std::atomic<std::size_t> next = 0;
    const auto work = [&] {
        for (std::size_t index = next++; index < faults.size(); index = next++) {
            const Fault& fault = faults[index];
            const Run run = fault.kind == "full-disk"
                                ? runOnFullDisk(programs, std::to_string(fault.number) + "k")
                                : runWith(programs, fault.text());
            matrix.add(fault, run, judge(fault, run, whole));
        }
    };
    std::thread second(work);
    work();
    second.join();
    matrix.print(std::cout);
    return matrix.isClean() ? EXIT_SUCCESS : EXIT_FAILURE;
}

} // namespace

int main(int argc, char** argv) {
    const std::vector<std::string> arguments(argv + 1, argv + argc);
    if (arguments.size() != 5) {
        std::cerr << "usage: fault_matrix SIMHOST HOST MORVANE INJECTOR MOST\n"
                     "MOST: how many of the calls of one kind fail in turn\n";
        return 2;
    }
    try {
        return runMatrix({arguments[0], arguments[1], arguments[2], arguments[3]}, std::stoul(arguments[4]));
    } catch (const std::exception& exception) {
        std::cerr << exception.what() << "\n";
        return 2;
    }
}
