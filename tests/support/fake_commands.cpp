#include "tests/support/fake_commands.hpp"

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <memory>
#include <set>

#include "foundation/command_output.hpp"

namespace {

FakeCommands* gCommands = nullptr;
std::set<std::FILE*> gOpenStreams;

struct Output {
    FakeRun run;
    std::size_t position = 0;
};

ssize_t readOutput(void* cookie, char* buffer, std::size_t size) {
    auto& output = *static_cast<Output*>(cookie);
    const std::size_t count = std::min(size, output.run.output.size() - output.position);
    if (count == 0 && output.run.readFails) {
        errno = EIO;
        return -1;
    }
    output.run.output.copy(buffer, count, output.position);
    output.position += count;
    return static_cast<ssize_t>(count);
}

int closeOutput(void* cookie) {
    const std::unique_ptr<Output> output(static_cast<Output*>(cookie));
    return 0;
}

} // namespace

FakeCommands::FakeCommands() {
    gCommands = this;
}

FakeCommands::~FakeCommands() {
    gCommands = nullptr;
    for (std::FILE* const stream : gOpenStreams) {
        static_cast<void>(std::fclose(stream));
    }
    gOpenStreams.clear();
}

FakeRun FakeCommands::take(const std::string& command) {
    mRuns.push_back(command);
    auto& answers = mAnswers[command];
    if (answers.empty()) {
        return {};
    }
    FakeRun run = std::move(answers.front());
    answers.pop_front();
    return run;
}

std::size_t FakeCommands::openStreams() {
    return gOpenStreams.size();
}

// In the place of foundation's own.

CommandOutput::CommandOutput(const char* command) {
    if (gCommands == nullptr) {
        return; // no command can be started
    }
    FakeRun run = gCommands->take(command);
    if (!run.canStart) {
        return;
    }
    auto output = std::make_unique<Output>();
    output->run = std::move(run);
    mStream = fopencookie(output.release(), "r",
                          {.read = readOutput, .write = nullptr, .seek = nullptr, .close = closeOutput});
    mProcess = 0; // none to be waited for
    gOpenStreams.insert(mStream);
}

CommandOutput::~CommandOutput() {
    finish();
}

void CommandOutput::close() {
    finish();
}

void CommandOutput::finish() noexcept {
    if (mStream != nullptr) {
        gOpenStreams.erase(mStream);
        static_cast<void>(std::fclose(mStream));
        mStream = nullptr;
    }
}
