#include "foundation/command_output.hpp"

#include <fcntl.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <csignal>

#include "foundation/exceptions.hpp"
#include "foundation/log.hpp"

namespace {

// Starts a shell on the command, its standard output going to `output`. Returns its process, or -1.
pid_t start(const char* command, int output) {
    const char* const arguments[] = {"sh", "-c", command, nullptr};
    const char* const environment[] = {"PATH=/usr/sbin:/usr/bin:/sbin:/bin", "LC_ALL=C", nullptr};
    posix_spawn_file_actions_t actions;
    posix_spawnattr_t attributes;
    if (posix_spawn_file_actions_init(&actions) != 0) {
        return -1;
    }
    if (posix_spawnattr_init(&attributes) != 0) {
        posix_spawn_file_actions_destroy(&actions);
        return -1;
    }
    sigset_t signals; // those that the run, or who started it, may have ignored
    sigemptyset(&signals);
    sigaddset(&signals, SIGPIPE);
    sigaddset(&signals, SIGXFSZ);
    pid_t process = -1;
    // The arrays of a program's arguments are only read.
    if (posix_spawn_file_actions_addopen(&actions, STDIN_FILENO, "/dev/null", O_RDONLY, 0) != 0 ||
        posix_spawn_file_actions_adddup2(&actions, output, STDOUT_FILENO) != 0 ||
        posix_spawnattr_setflags(&attributes, POSIX_SPAWN_SETSIGDEF) != 0 ||
        posix_spawnattr_setsigdefault(&attributes, &signals) != 0 ||
        posix_spawn(&process, "/bin/sh", &actions, &attributes,
                    const_cast<char* const*>(arguments),           // NOLINT(*-const-cast)
                    const_cast<char* const*>(environment)) != 0) { // NOLINT(*-const-cast)
        process = -1;
    }
    posix_spawnattr_destroy(&attributes);
    posix_spawn_file_actions_destroy(&actions);
    return process;
}

} // namespace

CommandOutput::CommandOutput(const char* command) {
    flushLog();
    int ends[2];
    if (pipe2(ends, O_CLOEXEC) != 0) {
        return;
    }
    mStream = fdopen(ends[0], "r");
    if (mStream == nullptr) {
        static_cast<void>(::close(ends[0]));
    } else if ((mProcess = start(command, ends[1])) < 0) {
        static_cast<void>(std::fclose(mStream));
        mStream = nullptr;
    }
    static_cast<void>(::close(ends[1]));
}

CommandOutput::~CommandOutput() {
    try {
        close();
    } catch (const WriteFailedEx&) {
        static_cast<void>(std::fclose(mStream));
    }
}

void CommandOutput::close() {
    if (mStream != nullptr) {
        flushLog();
        finish();
    }
}

void CommandOutput::finish() noexcept {
    static_cast<void>(std::fclose(mStream));
    mStream = nullptr;
    while (waitpid(mProcess, nullptr, 0) < 0 && errno == EINTR) {
        // interrupted: the command is still to be waited for
    }
}
