// fault_matrix SIMHOST HOST MORVANE INJECTOR MOST: runs Morvane on a simulated host, once whole and then once
// for each of many faults, judges every outcome and prints the matrix. Exit status 0 when none is outside
// what the run's texts allow.
//
// Every log is held against what Morvane said to it, text for text: after status 0 all of it is there, after
// any other end its beginning, without a hole. Allowed outcomes:
//  - complete:   status 0, every tree to its end. The fault is reported where it happened, or nobody needs
//                the call.
//  - guarded:    status 0; a tree ended early with its guard's line, every other one ran to its end.
//  - start-up:   status 1 with one of the two lines that say so on standard output, and one on standard
//                error that says why.
//  - assertion:  status 1 with the line of a failed assertion at the log's end.
//  - ended:      status 1 with one line on standard error and no success line, for a failure outside the
//                guards: before the first tree, behind the last, or of the log itself.
//  - named:      killed within a call: the log holds all that was said before, and ends with that call.
// Everything else is not: a signal, a run that takes too long, a tree lost that the guards should have saved,
// a log that is not whole and a run that says nothing of it.
#include <algorithm>
#include <array>
#include <atomic>
#include <csignal>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <map>
#include <mutex>
#include <regex>
#include <set>
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
    std::string mode; // "only", "from", "kill"
    unsigned long number = 0;
    bool isOverEarlierLog = false;

    [[nodiscard]] std::string text() const { return kind + ":" + mode + ":" + std::to_string(number); }
};

struct Run {
    test::ProcessResult process;
    std::string log;
    std::string said;
    bool hasHit = false;
    std::map<std::string, unsigned long> calls;
};

bool contains(const std::string& text, const std::string& part) {
    return text.find(part) != std::string::npos;
}

Run readRun(const std::filesystem::path& folder, test::ProcessResult process) {
    Run result{std::move(process),
               test::contentOf(folder / "MorvaneLogs/Morvane.log"),
               test::contentOf(folder / "report.said"),
               false,
               {}};
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

Run runWith(const Programs& programs, const std::string& fault, bool isOverEarlierLog) {
    const test::TemporaryDirectory folder;
    if (isOverEarlierLog) {
        std::filesystem::create_directory(folder.path() / "MorvaneLogs");
        std::ofstream(folder.path() / "MorvaneLogs/Morvane.log") << std::string(100000, 'x');
    }
    return readRun(folder.path(), test::runProcess(command(programs, folder.path(), fault), folder.path()));
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

bool isOneLine(const std::string& text) {
    return !text.empty() && text.find('\n') == text.size() - 1;
}

// The kinds of calls in which Morvane may wait, each with the last line of the log of a run that is killed
// there: what the call is, or what stood before it. Some texts are gathered before the stream has them, so
// that only the log tells whether they are there.
const std::map<std::string, std::regex>& lastLines() {
    static const std::map<std::string, std::regex> kLastLines = {
        {"device-open", std::regex("\nEntered Function open Line [0-9]+\n$")},
        {"file-open", std::regex("\nEntered Function (readInitiatorIQN|gatherLogicalInfo) Line [0-9]+\n$")},
        {"hba-call",
         std::regex("\n((Going to|Invoking) [^\n]+|Entered Function HA_GetNumberOfAdapters Line [0-9]+)\n$")},
        {"ioctl", std::regex("\nEntered Function doScsiIo Line [0-9]+\n$")},
        {"read",
         std::regex("\n(Calling popen|(Left Function (sBreakOutput|readInitiatorIQN|processCmdOutput)|"
                    "Entered Function readInitiatorIQN) Line [0-9]+)\n$")},
        {"sleep", std::regex("\nLeft Function sExecuteCommand Line [0-9]+\n$")},
        {"spawn", std::regex("\n(Calling popen|=+ ISCSI DEVICE DETAILS =+\n=+)\n$")},
        {"wait", std::regex("\n(Fread returned ERROR|Left Function processCmdOutput Line [0-9]+)\n$")}};
    return kLastLines;
}

// Whether the log of a run that was killed within a call of this kind ends with that call.
bool namesLastCall(const std::string& kind, const std::string& log) {
    constexpr std::size_t kLongest = 300; // of such lines
    if (!std::regex_search(log.substr(log.size() - std::min(log.size(), kLongest)), lastLines().at(kind))) {
        return false;
    }
    const auto command = log.rfind("SCSI Inquiry CDB Dump:");
    const auto answer = log.rfind("Left Function doScsiIo ");
    return kind != "ioctl" ||
           (command != std::string::npos && (answer == std::string::npos || answer < command));
}

std::string judgeKilled(const Fault& fault, const Run& run) {
    if (run.process.status != 128 + SIGKILL || !run.process.output.empty()) {
        return "NOT ALLOWED: killed, but status " + std::to_string(run.process.status);
    }
    if (run.log != run.said) {
        return "NOT ALLOWED: the log lacks what was said before the call";
    }
    const bool isBeforeLog = run.said.empty() && fault.kind == "device-open"; // its directory
    return isBeforeLog || namesLastCall(fault.kind, run.log) ? "named"
                                                             : "NOT ALLOWED: the log does not name the call";
}

// The outcome's name, or "NOT ALLOWED: " and why.
std::string judgeFinished(const Fault& fault, const Run& run) {
    if (run.log != run.said) {
        return "NOT ALLOWED: status 0 and a log that is not whole";
    }
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

// Kinds of calls that are the log's alone: the failure of one is the log's failure, wherever the run is.
bool isOfLog(const Fault& fault) {
    static const std::set<std::string> kKinds = {"log-text", "log-write", "flush"};
    return kKinds.count(fault.kind) != 0;
}

std::string judge(const Fault& fault, const Run& run) {
    const int status = run.process.status;
    if (!run.hasHit) {
        return "NOT ALLOWED: the fault did not happen";
    }
    if (fault.mode == "kill") {
        return judgeKilled(fault, run);
    }
    if (status == 0) {
        return judgeFinished(fault, run);
    }
    if (status != 1) {
        return "NOT ALLOWED: status " + std::to_string(status);
    }
    if (run.process.output == "Failed in creating the directory for keeping the log files\n" ||
        run.process.output == "Failed in opening the logfile\n") {
        return run.said.empty() && isOneLine(run.process.error)
                   ? "start-up"
                   : "NOT ALLOWED: a start-up line without a reason";
    }
    if (run.said.compare(0, run.log.size(), run.log) != 0) {
        return "NOT ALLOWED: the log is not the beginning of what was said";
    }
    if (contains(run.process.output, "Test completed.")) {
        return "NOT ALLOWED: status 1 and the success line";
    }
    if (endsInAssertion(run.log)) {
        return "assertion";
    }
    if (!isOneLine(run.process.error)) {
        return "NOT ALLOWED: status 1 and not one line that says why";
    }
    const bool isBeforeTrees = !contains(run.log, "FC DEVICE DETAILS");
    const bool isBehindTrees = contains(run.log, std::string("Left Function ") + kTrees.back() + " ") ||
                               contains(run.log, guardLine(kTrees.size() - 1)) ||
                               contains(run.log, "Failed to build Logical tree.\n");
    return isBeforeTrees || isBehindTrees || isOfLog(fault) ? "ended" : "NOT ALLOWED: ended within the trees";
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

using Calls = std::map<std::string, unsigned long>;

// Faults at a share of the calls: one fails, all fail from one on, and death where Morvane may wait.
void planCalls(std::vector<Fault>& faults, const Calls& calls, unsigned long most, bool isOverEarlierLog) {
    const auto plan = [&](const std::string& kind, const char* mode, unsigned long share) {
        for (const unsigned long number : sample(calls.at(kind), share)) {
            faults.push_back({kind, mode, number, isOverEarlierLog});
        }
    };
    for (const auto& [kind, count] : calls) {
        if (kind == "signal") {
            continue;
        }
        if (kind != "fork" && kind != "hba-call") { // a process that may not fork any more stays so
            plan(kind, "only", most);
        }
        if (kind != "hba-call") {
            plan(kind, "from", most / 4);
        }
        if (lastLines().count(kind) != 0) {
            plan(kind, "kill", most);
        }
    }
}

// `again` are the calls of a run over an earlier log, which opens it in another way.
std::vector<Fault> planFaults(const Run& whole, const Run& again, unsigned long most) {
    std::vector<Fault> faults;
    planCalls(faults, whole.calls, most, false);
    Calls opening;
    for (const char* kind : {"log-open", "stat", "lock", "truncate", "mode", "stream"}) {
        opening[kind] = again.calls.at(kind);
    }
    planCalls(faults, opening, most, true);
    for (const unsigned long microseconds : {5000UL, 1000UL, 200UL}) {
        faults.push_back({"signal", "from", microseconds});
    }
    return faults;
}

class Matrix {
public:
    void add(const Fault& fault, const Run& run, const std::string& outcome) {
        const std::lock_guard lock(mMutex);
        ++mCounts[fault.kind + " (" + fault.mode + ")"][outcome.substr(0, outcome.find(':'))];
        if (outcome.compare(0, 3, "NOT") == 0) {
            mFindings.push_back(fault.text() + (fault.isOverEarlierLog ? " over an earlier log" : "") + "  " +
                                outcome + "\n  standard error: " + run.process.error);
        }
    }

    void print(std::ostream& out) const {
        constexpr std::array<const char*, 7> kOutcomes = {"complete", "guarded", "start-up",   "assertion",
                                                          "ended",    "named",   "NOT ALLOWED"};
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
    Run whole = runWith(programs, "", false);
    Run again = runWith(programs, "", true);
    for (Run* const run : {&whole, &again}) {
        run->hasHit = true;
        const std::string outcome = judge({"none", "only", 0}, *run);
        if (outcome != "complete" || run->calls.empty() || run->said.empty()) {
            std::cerr << "the run without a fault: " << outcome << "\n" << run->process.error;
            return EXIT_FAILURE;
        }
    }
    const std::vector<Fault> faults = planFaults(whole, again, most);
    Matrix matrix;
    std::atomic<std::size_t> next = 0;
    const auto work = [&] {
        for (std::size_t index = next++; index < faults.size(); index = next++) {
            const Fault& fault = faults[index];
            const Run run = runWith(programs, fault.text(), fault.isOverEarlierLog);
            matrix.add(fault, run, judge(fault, run));
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
