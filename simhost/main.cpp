// Runs a program on a simulated host; README.md says how.
#include <fcntl.h>
#include <linux/sched.h>
#include <sys/prctl.h>
#include <sys/syscall.h>
#include <sys/wait.h>

#include <algorithm>
#include <chrono>
#include <csignal>
#include <cstring>
#include <filesystem>
#include <iostream>
#include <string>
#include <string_view>
#include <thread>

#include <CLI/CLI.hpp>

#include "simhost/description.hpp"
#include "simhost/file_descriptor.hpp"
#include "simhost/memory.hpp"
#include "simhost/record.hpp"
#include "simhost/supervisor.hpp"
#include "simhost/world.hpp"

namespace simhost {
namespace {

namespace fs = std::filesystem;

constexpr int kCannotSetUp = 125;
constexpr int kCannotRun = 127;

constexpr int kWrongUsage = 2;

struct Arguments {
    fs::path description;
    fs::path record; // empty = none
    fs::path keep;   // empty = none
    fs::path memory; // empty = none
    char** program = nullptr;
};

// Reads the command line up to "--"; what follows is the program's and goes to it as it is. Returns the
// status to end with when there is nothing to run: help was asked for, or the line makes no sense and
// standard error says why.
int readArguments(int count, char** values, Arguments& arguments) {
    char** end = values + count;
    char** own = std::find(values, end, std::string_view("--"));
    CLI::App app{"Runs a program on a simulated host.", "simhost"};
    app.footer("The program and its arguments follow behind --:\n"
               "  simhost HOST.toml [OPTIONS] -- PROGRAM [ARGUMENT...]");
    app.add_option("HOST", arguments.description, "the description of the host, TOML")->required();
    app.add_option("--record", arguments.record, "write what the program asks of the host to FILE")
        ->type_name("FILE");
    app.add_option("--keep", arguments.keep, "copy the files that are made for the host into DIR")
        ->type_name("DIR");
    app.add_option(
           "--memory", arguments.memory,
           "write what the kernel and multipath remember into folders of DIR; no program is needed then")
        ->type_name("DIR");
    try {
        app.parse(static_cast<int>(own - values), values);
        if (end - own < 2 && (own != end || arguments.memory.empty())) {
            throw CLI::RequiredError("-- PROGRAM");
        }
    } catch (const CLI::ParseError& error) {
        arguments.memory.clear();
        return app.exit(error) == 0 ? 0 : kWrongUsage;
    }
    arguments.program = own == end ? nullptr : own + 1;
    return 0;
}

// The status that a shell gives for a process that ended like this.
int shellStatus(int waitStatus) {
    return WIFEXITED(waitStatus) ? WEXITSTATUS(waitStatus) : 128 + WTERMSIG(waitStatus);
}

// Lets processes that the program left behind come to their own end, for a while: what they do is then the
// same in every run. What is left after that ends with the host.
void awaitOrphans() {
    using namespace std::chrono_literals;
    const auto deadline = std::chrono::steady_clock::now() + 1s;
    while (::waitpid(-1, nullptr, WNOHANG) >= 0 && std::chrono::steady_clock::now() < deadline) {
        std::this_thread::sleep_for(1ms);
    }
}

// The simulated host's first process: builds the host, runs the program in it and ends with its status. It is
// not the program itself because the kernel spares a first process from signals that would end another.
// It sends the number of its listener through `report`, and goes on when `proceed` is closed.
int firstProcess(const Host& host, const Arguments& arguments, FileDescriptor report,
                 const FileDescriptor& proceed) {
    check(::prctl(PR_SET_PDEATHSIG, SIGKILL), "tying the host to its supervisor");
    const fs::path folder = fs::read_symlink("/proc/self/exe").parent_path();
    const Helpers helpers{folder / "simhost-command", folder / "libsimhba64.so", folder / "libsimhba32.so"};
    enterWorld(host, helpers, arguments.record, arguments.keep);
    {
        const FileDescriptor listener = installSgIoFilter();
        const int number = listener.get();
        check(::write(report.get(), &number, sizeof number), "reporting");
        report.reset();
        char none = 0;
        check(::read(proceed.get(), &none, 1), "waiting for the supervisor");
    }
    const pid_t program = check(::fork(), "fork");
    if (program == 0) {
        ::prctl(PR_SET_PDEATHSIG, 0);
        ::execvp(arguments.program[0], arguments.program);
        std::cerr << "simhost: " << arguments.program[0] << ": " << std::strerror(errno) << '\n';
        ::_exit(kCannotRun);
    }
    int status = 0;
    while (check(::waitpid(-1, &status, 0), "waiting for the program") != program) {
        // a process that the program left behind
    }
    awaitOrphans();
    return shellStatus(status);
}

struct Pipe {
    FileDescriptor reading;
    FileDescriptor writing;
};

Pipe makePipe() {
    int ends[2];
    check(::pipe2(ends, O_CLOEXEC), "pipe");
    return {FileDescriptor(ends[0]), FileDescriptor(ends[1])};
}

int run(const Host& host, Arguments arguments) {
    Record record;
    if (!arguments.record.empty()) {
        record = Record(arguments.record);
        arguments.record = fs::absolute(arguments.record);
    }
    if (!arguments.keep.empty()) {
        fs::create_directories(arguments.keep);
        arguments.keep = fs::absolute(arguments.keep);
    }
    Pipe report = makePipe();
    Pipe proceed = makePipe();
    clone_args namespaces{}; // clone3 takes the same on every architecture; clone's arguments differ in order
    namespaces.flags = CLONE_NEWNS | CLONE_NEWUTS | CLONE_NEWPID;
    namespaces.exit_signal = SIGCHLD;
    const auto init = static_cast<pid_t>(check(::syscall(SYS_clone3, &namespaces, sizeof namespaces),
                                               "making the host's namespaces (simhost needs root)"));
    if (init == 0) {
        report.reading.reset();
        proceed.writing.reset();
        try {
            ::_exit(firstProcess(host, arguments, std::move(report.writing), proceed.reading));
        } catch (const std::exception& error) {
            std::cerr << "simhost: " << error.what() << '\n';
            ::_exit(kCannotSetUp);
        }
    }
    report.writing.reset();
    int listenerNumber = -1;
    if (::read(report.reading.get(), &listenerNumber, sizeof listenerNumber) == sizeof listenerNumber) {
        const FileDescriptor initDescriptor(
            static_cast<int>(check(::syscall(SYS_pidfd_open, init, 0), "watching the host")));
        FileDescriptor listener(static_cast<int>(check(
            ::syscall(__NR_pidfd_getfd, initDescriptor.get(), listenerNumber, 0), "taking the listener")));
        Supervisor supervisor(std::move(listener), init, host.disks, record);
        proceed.writing.reset();
        supervisor.run(initDescriptor.get());
    }
    int status = 0;
    check(::waitpid(init, &status, 0), "waiting for the host");
    return shellStatus(status);
}

} // namespace
} // namespace simhost

int main(int argumentCount, char** argumentValues) {
    try {
        simhost::Arguments arguments;
        const int status = simhost::readArguments(argumentCount, argumentValues, arguments);
        if (arguments.program == nullptr && arguments.memory.empty()) {
            return status;
        }
        const simhost::Host host = simhost::readDescription(arguments.description);
        if (!arguments.memory.empty()) {
            simhost::writeMemories(host, arguments.memory);
        }
        return arguments.program == nullptr ? 0 : simhost::run(host, arguments);
    } catch (const std::exception& error) {
        std::cerr << "simhost: " << error.what() << '\n';
        return simhost::kCannotSetUp;
    }
}
