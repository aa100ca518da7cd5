// The commands that the program runs, answered by the test.
#pragma once

#include <deque>
#include <map>
#include <string>
#include <vector>

// One run of a command.
struct FakeRun {
    std::string output;
    bool canStart = true;   // false: the command cannot be started
    bool readFails = false; // behind the output stands a read error in place of the end
};

// While it lives no command is run: each run of a command gives its next answer, and prints nothing once the
// answers are used up. Streams that are left open are closed at its end. Without one,
// no command can be started.
class FakeCommands {
public:
    FakeCommands();
    FakeCommands(const FakeCommands&) = delete;
    FakeCommands& operator=(const FakeCommands&) = delete;
    ~FakeCommands();

    void answer(const std::string& command, FakeRun run) { mAnswers[command].push_back(std::move(run)); }
    void answer(const std::string& command, const std::string& output) {
        answer(command, FakeRun{.output = output});
    }

    // The answer to the next run of `command`, which it records.
    FakeRun take(const std::string& command);

    const std::vector<std::string>& runs() const { return mRuns; } // the commands, in the order of their runs

    static std::size_t openStreams(); // those that popen gave and pclose has not taken back

private:
    std::map<std::string, std::deque<FakeRun>> mAnswers;
    std::vector<std::string> mRuns;
};
