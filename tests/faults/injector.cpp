// Preloaded into Morvane: lets chosen calls of its own fail, and counts them all.
//
// A call is Morvane's own when it returns into the executable; what the C library, libstdc++, libHBAAPI or
// the vendor library do on their own account stays whole. In any other program (the shell of a popen) nothing
// happens.
//
// MORVANE_FAULT is KIND:MODE:N, for the Nth call of that kind (from 1) alone ("only") or it and all later
// ones
// ("from"); absent for a run that is only counted. MORVANE_FAULT_REPORT names a file that gets a line "hit"
// when the fault has happened and, at exit, a line "KIND COUNT" for each kind.
#include <dirent.h>
#include <dlfcn.h>
#include <fcntl.h>
#include <link.h>
#include <linux/filter.h>
#include <linux/seccomp.h>
#include <sys/ioctl.h>
#include <sys/prctl.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <sys/time.h>
#include <sys/timeb.h>
#include <unistd.h>

#include <cerrno>
#include <csignal>
#include <cstdarg>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <new>

namespace {

enum Kind : unsigned {
    kAllocation, // malloc, calloc, new
    kLogOpen,    // fopen: the log itself, files
    kDeviceOpen, // open
    kDirectoryOpen,
    kPopen,
    kFork, // within popen, from the Nth popen on
    kRead, // fread, fgets, getline
    kDirectoryRead,
    kLinkRead,
    kIoctl,
    kLateAnswer, // the command succeeds, but the clock says that it took eleven seconds
    kLogWrite,
    kClose, // close, fclose
    kStat,
    kMkdir,
    kHostName,
    kSleep,
    kSignal, // interrupts everything, all the time; N is the microseconds between two
    kKinds
};

constexpr const char* kNames[kKinds] = {
    "allocation", "file-open",      "device-open", "directory-open", "popen",       "fork",
    "read",       "directory-read", "link-read",   "ioctl",          "late-answer", "log-write",
    "close",      "stat",           "mkdir",       "host-name",      "sleep",       "signal"};

struct Plan {
    std::uintptr_t programStart = 0;
    std::uintptr_t programEnd = 0;
    Kind kind = kKinds;
    bool isFromThenOn = false;
    unsigned long number = 0;
    unsigned long calls[kKinds] = {};
    bool hasHit = false;
    long clockShiftSeconds = 0;
    char report[4096] = {};
};
Plan gPlan;

void say(const char* text) {
    const int fd = static_cast<int>(
        syscall(SYS_openat, AT_FDCWD, gPlan.report, O_WRONLY | O_CREAT | O_APPEND | O_CLOEXEC, 0600));
    if (fd >= 0) {
        static_cast<void>(!syscall(SYS_write, fd, text, std::strlen(text)));
        syscall(SYS_close, fd);
    }
}

// Counts a call that returns to `caller`, and tells whether it is to fail.
bool fails(Kind kind, const void* caller) {
    const auto address = reinterpret_cast<std::uintptr_t>(caller);
    if (address < gPlan.programStart || address >= gPlan.programEnd) {
        return false;
    }
    const unsigned long number = ++gPlan.calls[kind];
    if (kind != gPlan.kind || number < gPlan.number || (number > gPlan.number && !gPlan.isFromThenOn)) {
        return false;
    }
    if (!gPlan.hasHit) {
        gPlan.hasHit = true;
        say("hit\n");
    }
    return true;
}

// Whether a block is the reserve that the C++ runtime, a part of the executable, keeps from before main on
// for exceptions that find no memory. What becomes of a program without it is the runtime's business.
bool isReserveForExceptions(std::size_t size) {
    return gPlan.calls[kStat] == 0 && size > 16384;
}

template <typename Function>
Function* real(Function* /*own*/, const char* name) {
    return reinterpret_cast<Function*>(dlsym(RTLD_NEXT, name));
}

// From now on no process can be made.
void refuseForks() {
    sock_filter program[] = {
        BPF_STMT(BPF_LD | BPF_W | BPF_ABS, offsetof(seccomp_data, nr)),
        BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, SYS_clone, 3, 0),
        BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, SYS_clone3, 2, 0),
        BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, SYS_fork, 1, 0),
        BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, SYS_vfork, 0, 1),
        BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ERRNO | EAGAIN),
        BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ALLOW),
    };
    const sock_fprog filter = {sizeof program / sizeof program[0], program};
    if (prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0) != 0 ||
        syscall(SYS_seccomp, SECCOMP_SET_MODE_FILTER, 0, &filter) != 0) {
        std::abort();
    }
}

void ignore(int /*signal*/) {}

void interruptAllTheTime(unsigned long microseconds) {
    struct sigaction action {};
    action.sa_handler = ignore; // without SA_RESTART
    sigaction(SIGALRM, &action, nullptr);
    const timeval period = {0, static_cast<suseconds_t>(microseconds)};
    const itimerval timer = {period, period};
    setitimer(ITIMER_REAL, &timer, nullptr);
    say("hit\n");
}

int findProgram(dl_phdr_info* info, std::size_t /*size*/, void* /*data*/) {
    for (int i = 0; i < info->dlpi_phnum; ++i) {
        const ElfW(Phdr)& segment = info->dlpi_phdr[i];
        if (segment.p_type == PT_LOAD && (segment.p_flags & PF_X) != 0) {
            gPlan.programStart = info->dlpi_addr + segment.p_vaddr;
            gPlan.programEnd = gPlan.programStart + segment.p_memsz;
        }
    }
    return 1; // the program comes first
}

void takePlan(const char* text) {
    for (unsigned kind = 0; kind < kKinds; ++kind) {
        const std::size_t length = std::strlen(kNames[kind]);
        if (std::strncmp(text, kNames[kind], length) == 0 && text[length] == ':') {
            gPlan.kind = static_cast<Kind>(kind);
            gPlan.isFromThenOn = std::strncmp(text + length, ":from:", 6) == 0;
            gPlan.number = std::strtoul(text + length + 6, nullptr, 10); // ":only:" is as long
        }
    }
    if (gPlan.kind == kKinds) {
        std::abort();
    }
}

__attribute__((constructor)) void begin() {
    char program[4096] = {};
    const char* const report = getenv("MORVANE_FAULT_REPORT");
    const char* const slash =
        readlink("/proc/self/exe", program, sizeof program - 1) > 0 ? std::strrchr(program, '/') : nullptr;
    if (report == nullptr || slash == nullptr || std::strcmp(slash, "/morvane") != 0) {
        return;
    }
    std::strncpy(gPlan.report, report, sizeof gPlan.report - 1);
    unsetenv("LD_PRELOAD");
    if (const char* const fault = getenv("MORVANE_FAULT")) {
        takePlan(fault);
    }
    dl_iterate_phdr(findProgram, nullptr);
    if (gPlan.kind == kSignal) {
        interruptAllTheTime(gPlan.number);
    }
}

__attribute__((destructor)) void end() {
    if (gPlan.programEnd == 0) {
        return;
    }
    for (unsigned kind = 0; kind < kKinds; ++kind) {
        char line[64] = {};
        std::snprintf(line, sizeof line, "%s %lu\n", kNames[kind], gPlan.calls[kind]);
        say(line);
    }
}

int failWith(int error) {
    errno = error;
    return -1;
}

// The error flag that ferror() tells; the C library has no call to set it.
void setError(std::FILE* stream) {
    constexpr int kErrorSeen = 0x20;
    stream->_flags |= kErrorSeen;
    errno = EIO;
}

} // namespace

#define OWN_CALL_FAILS(kind) fails(kind, __builtin_return_address(0))

extern "C" {

void* __libc_malloc(std::size_t size);
void* __libc_calloc(std::size_t count, std::size_t size);

void* malloc(std::size_t size) noexcept {
    if (!isReserveForExceptions(size) && OWN_CALL_FAILS(kAllocation)) {
        errno = ENOMEM;
        return nullptr;
    }
    return __libc_malloc(size);
}

void* calloc(std::size_t count, std::size_t size) noexcept {
    if (OWN_CALL_FAILS(kAllocation)) {
        errno = ENOMEM;
        return nullptr;
    }
    return __libc_calloc(count, size);
}

std::FILE* fopen(const char* path, const char* mode) {
    static auto* const kReal = real(&fopen, "fopen");
    return OWN_CALL_FAILS(kLogOpen) ? (failWith(EMFILE), nullptr) : kReal(path, mode);
}

std::FILE* fopen64(const char* path, const char* mode) {
    static auto* const kReal = real(&fopen64, "fopen64");
    return OWN_CALL_FAILS(kLogOpen) ? (failWith(EMFILE), nullptr) : kReal(path, mode);
}

// Morvane creates no file with open, so the mode says nothing.
int open(const char* path, int flags, ...) {
    static auto* const kReal = real(&open, "open");
    return OWN_CALL_FAILS(kDeviceOpen) ? failWith(EMFILE) : kReal(path, flags, 0600);
}

int open64(const char* path, int flags, ...) {
    static auto* const kReal = real(&open64, "open64");
    return OWN_CALL_FAILS(kDeviceOpen) ? failWith(EMFILE) : kReal(path, flags, 0600);
}

DIR* opendir(const char* path) {
    static auto* const kReal = real(&opendir, "opendir");
    return OWN_CALL_FAILS(kDirectoryOpen) ? (failWith(EACCES), nullptr) : kReal(path);
}

std::FILE* popen(const char* command, const char* mode) {
    static auto* const kReal = real(&popen, "popen");
    if (OWN_CALL_FAILS(kPopen)) {
        errno = ENOMEM;
        return nullptr;
    }
    if (OWN_CALL_FAILS(kFork)) {
        refuseForks();
    }
    return kReal(command, mode);
}

std::size_t fread(void* buffer, std::size_t size, std::size_t count, std::FILE* stream) {
    static auto* const kReal = real(&fread, "fread");
    return OWN_CALL_FAILS(kRead) ? (setError(stream), 0) : kReal(buffer, size, count, stream);
}

char* fgets(char* buffer, int size, std::FILE* stream) {
    static auto* const kReal = real(&fgets, "fgets");
    return OWN_CALL_FAILS(kRead) ? (setError(stream), nullptr) : kReal(buffer, size, stream);
}

ssize_t __getdelim(char** line, std::size_t* size, int delimiter, std::FILE* stream) {
    static auto* const kReal = real(&__getdelim, "__getdelim");
    return OWN_CALL_FAILS(kRead) ? (setError(stream), -1) : kReal(line, size, delimiter, stream);
}

#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Wdeprecated-declarations" // readdir_r, ftime: what Morvane calls
int readdir_r(DIR* directory, dirent* entry, dirent** result) {
    static auto* const kReal = real(&readdir_r, "readdir_r");
    return OWN_CALL_FAILS(kDirectoryRead) ? EIO : kReal(directory, entry, result);
}

int readdir64_r(DIR* directory, dirent64* entry, dirent64** result) {
    static auto* const kReal = real(&readdir64_r, "readdir64_r");
    return OWN_CALL_FAILS(kDirectoryRead) ? EIO : kReal(directory, entry, result);
}

int ftime(timeb* now) {
    static auto* const kReal = real(&ftime, "ftime");
    const int result = kReal(now);
    now->time += gPlan.clockShiftSeconds;
    return result;
}
#pragma GCC diagnostic pop

ssize_t readlink(const char* path, char* buffer, std::size_t size) noexcept {
    static auto* const kReal = real(&readlink, "readlink");
    return OWN_CALL_FAILS(kLinkRead) ? failWith(EIO) : kReal(path, buffer, size);
}

int ioctl(int fd, unsigned long request, ...) noexcept {
    static auto* const kReal = real(&ioctl, "ioctl");
    constexpr long kLateSeconds = 11;
    va_list arguments;
    va_start(arguments, request);
    void* const argument = va_arg(arguments, void*);
    va_end(arguments);
    if (OWN_CALL_FAILS(kIoctl)) {
        return failWith(EIO);
    }
    if (OWN_CALL_FAILS(kLateAnswer)) {
        gPlan.clockShiftSeconds += kLateSeconds;
    }
    return kReal(fd, request, argument);
}

int __vfprintf_chk(std::FILE* stream, int flag, const char* format, va_list arguments) {
    static auto* const kReal = real(&__vfprintf_chk, "__vfprintf_chk");
    return OWN_CALL_FAILS(kLogWrite) ? (setError(stream), -1) : kReal(stream, flag, format, arguments);
}

int close(int fd) {
    static auto* const kReal = real(&close, "close");
    const bool isToFail = OWN_CALL_FAILS(kClose);
    const int result = kReal(fd);
    return isToFail ? failWith(EIO) : result;
}

int fclose(std::FILE* stream) {
    static auto* const kReal = real(&fclose, "fclose");
    const bool isToFail = OWN_CALL_FAILS(kClose);
    const int result = kReal(stream);
    return isToFail ? failWith(EIO) : result;
}

int stat(const char* path, struct stat* status) noexcept {
    static auto* const kReal = real(&stat, "stat");
    return OWN_CALL_FAILS(kStat) ? failWith(EACCES) : kReal(path, status);
}

int stat64(const char* path, struct stat64* status) noexcept {
    static auto* const kReal = real(&stat64, "stat64");
    return OWN_CALL_FAILS(kStat) ? failWith(EACCES) : kReal(path, status);
}

int mkdir(const char* path, mode_t mode) noexcept {
    static auto* const kReal = real(&mkdir, "mkdir");
    return OWN_CALL_FAILS(kMkdir) ? failWith(EROFS) : kReal(path, mode);
}

int gethostname(char* name, std::size_t size) noexcept {
    static auto* const kReal = real(&gethostname, "gethostname");
    return OWN_CALL_FAILS(kHostName) ? failWith(EPERM) : kReal(name, size);
}

int usleep(useconds_t microseconds) {
    static auto* const kReal = real(&usleep, "usleep");
    return OWN_CALL_FAILS(kSleep) ? failWith(EINTR) : kReal(microseconds);
}

} // extern "C"

void* operator new(std::size_t size) {
    void* const block = OWN_CALL_FAILS(kAllocation) ? nullptr : __libc_malloc(size);
    if (block == nullptr) {
        throw std::bad_alloc();
    }
    return block;
}

void* operator new(std::size_t size, const std::nothrow_t& /*tag*/) noexcept {
    return OWN_CALL_FAILS(kAllocation) ? nullptr : __libc_malloc(size);
}

void* operator new[](std::size_t size, const std::nothrow_t& /*tag*/) noexcept {
    return OWN_CALL_FAILS(kAllocation) ? nullptr : __libc_malloc(size);
}
