#include "tests/support/fake_commands.hpp"

#include <dlfcn.h>

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <memory>
#include <set>

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

extern "C" {

std::FILE* popen(const char* command, const char* modes) {
    if (gCommands == nullptr) {
        static auto* const real =
            reinterpret_cast<std::FILE* (*)(const char*, const char*)>(dlsym(RTLD_NEXT, "popen"));
        return real(command, modes);
    }
    FakeRun run = gCommands->take(command);
    if (!run.canStart) {
        errno = EMFILE;
        return nullptr;
    }
    auto output = std::make_unique<Output>();
    output->run = std::move(run);
    std::FILE* const stream =
        fopencookie(output.release(), modes,
                    {.read = readOutput, .write = nullptr, .seek = nullptr, .close = closeOutput});
    gOpenStreams.insert(stream);
    return stream;
}

int pclose(std::FILE* stream) {
    if (gOpenStreams.erase(stream) == 0) {
        static auto* const real = reinterpret_cast<int (*)(std::FILE*)>(dlsym(RTLD_NEXT, "pclose"));
        return real(stream);
    }
    return std::fclose(stream);
}
}
