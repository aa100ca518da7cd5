#include "tests/fuzz/harness.hpp"

#include <fcntl.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstdarg>
#include <cstdio>
#include <cstdlib>
#include <cstring>

#include "foundation/assertion.hpp"
#include "foundation/command_output.hpp"
#include "foundation/exceptions.hpp"
#include "foundation/log.hpp"

ScriptedHost gHost;

namespace {

// Leaves the product in the place of its exit; no handler of the product knows it.
struct AssertionFailed {
    std::string condition;
};

constexpr int kDeviceFd = 0x5347; // of every device node; far above any real descriptor
constexpr const char* kDeviceFolder = "/dev/";
constexpr const char* kLogSink = "/dev/null";

std::FILE* memoryFile(const std::string& content) {
    // fmemopen only reads in mode "r".
    return fmemopen(const_cast<char*>(content.data()), content.size(), "r"); // NOLINT(*-const-cast)
}

std::FILE* openLogSink() {
    std::FILE* const sink = std::fopen(kLogSink, "w");
    require(sink != nullptr, "no log sink");
    return sink;
}

bool isDeviceNode(const char* path) {
    return std::strncmp(path, kDeviceFolder, std::strlen(kDeviceFolder)) == 0 &&
           std::strcmp(path, kLogSink) != 0;
}

} // namespace

void runInput(std::initializer_list<std::string_view> fatalConditions, const std::function<void()>& body) {
    if (gLogStream == nullptr) {
        gLogStream = openLogSink();
    }
    try {
        body();
    } catch (const TException&) {
        // a failure that the product reports to its caller
    } catch (const AssertionFailed& failure) {
        if (std::find(fatalConditions.begin(), fatalConditions.end(), failure.condition) ==
            fatalConditions.end()) {
            static_cast<void>(std::fprintf(stderr, "Assertion [ %s ] failed\n", failure.condition.c_str()));
            std::abort();
        }
    }
    gHost = ScriptedHost();
}

void respond(sg_io_hdr& header, std::string_view data) {
    const std::size_t count = std::min<std::size_t>(data.size(), header.dxfer_len);
    std::copy_n(data.data(), count, static_cast<char*>(header.dxferp));
    header.resid = static_cast<int>(header.dxfer_len - count);
}

// In the place of foundation's own: the command prints what the host says.
CommandOutput::CommandOutput(const char* command) {
    if (const std::string* const output = gHost.command ? gHost.command(command) : nullptr) {
        mStream = memoryFile(*output);
        mProcess = 0; // none to be waited for
    }
}

CommandOutput::~CommandOutput() {
    finish();
}

void CommandOutput::close() {
    finish();
}

void CommandOutput::finish() noexcept {
    if (mStream != nullptr) {
        static_cast<void>(std::fclose(mStream));
        mStream = nullptr;
    }
}

// In the place of the product's and the C library's functions (see CMakeLists.txt): the linker's names.
// NOLINTBEGIN(bugprone-reserved-identifier, readability-identifier-naming, cert-dcl37-c, cert-dcl51-cpp)
extern "C" {

[[noreturn]] void __wrap__Z15assertionFailedPKc(const char* conditionText) {
    throw AssertionFailed{conditionText};
}

std::FILE* __real_fopen(const char* path, const char* mode);
std::FILE* __wrap_fopen(const char* path, const char* mode) {
    if (const auto file = gHost.files.find(path); file != gHost.files.end()) {
        return memoryFile(file->second);
    }
    return __real_fopen(path, mode);
}

int __wrap_usleep(useconds_t /*microseconds*/) {
    return 0;
}

int __real_open(const char* path, int flags, ...);
int __wrap_open(const char* path, int flags, ...) {
    if (gHost.device && isDeviceNode(path)) {
        return kDeviceFd;
    }
    va_list arguments;
    va_start(arguments, flags);
    // Without O_CREAT meaningless, and then not looked at.
    const auto mode = va_arg(arguments, mode_t); // NOLINT(clang-analyzer-valist.Uninitialized): started above
    va_end(arguments);
    return __real_open(path, flags, mode);
}

int __real_close(int fd);
int __wrap_close(int fd) {
    return fd == kDeviceFd ? 0 : __real_close(fd);
}

int __real_ioctl(int fd, unsigned long request, ...);
int __wrap_ioctl(int fd, unsigned long request, ...) {
    va_list arguments;
    va_start(arguments, request);
    void* const argument = va_arg(arguments, void*);
    va_end(arguments);
    if (fd != kDeviceFd || !gHost.device) {
        return __real_ioctl(fd, request, argument);
    }
    require(request == SG_IO, "an ioctl other than SG_IO");
    const int error = gHost.device(*static_cast<sg_io_hdr*>(argument));
    if (error != 0) {
        errno = error;
        return -1;
    }
    return 0;
}

} // extern "C"
// NOLINTEND(bugprone-reserved-identifier, readability-identifier-naming, cert-dcl37-c, cert-dcl51-cpp)
