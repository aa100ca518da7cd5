// Preloaded into Morvane: lets chosen calls of its own fail, or ends the program in the middle of one, counts
// them all, and keeps what was said to the log.
//
// A call is Morvane's own when it returns into the executable; what the C library, libstdc++, libHBAAPI or
// the vendor library do on their own account stays whole, but for the C library's writing to the log's file.
// In any other program (the shell of a command) nothing happens.
//
// MORVANE_FAULT is KIND:MODE:N, for the Nth call of that kind (from 1): it alone fails ("only"), it and all
// later ones do ("from"), or SIGKILL comes when it is made ("kill"). Absent for a run that is only counted.
// MORVANE_FAULT_REPORT names a file that gets a line "hit" when the fault has happened and, at exit, a line
// "KIND COUNT" for each kind; beside it, with ".said" at its name's end, stands every text that Morvane gave
// to the log's stream, whether the stream took it or not.
#include <dirent.h>
#include <dlfcn.h>
#include <fcntl.h>
#include <link.h>
#include <linux/filter.h>
#include <linux/seccomp.h>
#include <spawn.h>
#include <sys/file.h>
#include <sys/ioctl.h>
#include <sys/prctl.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <sys/time.h>
#include <sys/timeb.h>
#include <sys/uio.h>
#include <sys/wait.h>
#include <ucontext.h>
#include <unistd.h>

#include <cerrno>
#include <csignal>
#include <cstdarg>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <ctime> // hbaapi.h needs it
#include <new>

#include <hbaapi.h>

namespace {

enum Kind : unsigned {
    kAllocation, // malloc, calloc, new
    kFileOpen,   // fopen
    kDeviceOpen, // open: devices, the log's directory
    kLogOpen,    // openat: the log, and each step to it
    kStream,     // fdopen: the log, a command's output
    kDirectoryOpen,
    kPipe,
    kSpawn,
    kFork,     // within posix_spawn, from the Nth on
    kRead,     // fread, getline: a command's output
    kLineRead, // fgets: /proc/partitions
    kDirectoryRead,
    kLinkRead,
    kIoctl,
    kLateAnswer, // the command succeeds, but the clock says that it took eleven seconds
    kLogText,    // the log's stream refuses a text
    kLogWrite,   // the kernel refuses what the stream writes to the log's file
    kFlush,
    kSync,
    kLock,
    kTruncate,
    kMode,  // fchmod
    kClose, // close, fclose
    kStat,  // of a path, of a descriptor
    kMkdir,
    kHostName,
    kSleep,
    kWait,    // for a command's end
    kHbaCall, // is only counted, and ended in: what it may answer is the simulated hosts' matter
    kSignal,  // interrupts everything, all the time; N is the microseconds between two
    kKinds
};

constexpr const char* kNames[kKinds] = {
    "allocation", "file-open", "device-open", "log-open", "stream",    "directory-open",
    "pipe",       "spawn",     "fork",        "read",     "line-read", "directory-read",
    "link-read",  "ioctl",     "late-answer", "log-text", "log-write", "flush",
    "sync",       "lock",      "truncate",    "mode",     "close",     "stat",
    "mkdir",      "host-name", "sleep",       "wait",     "hba-call",  "signal"};

// The log's descriptor is moved here: no other file of Morvane's or of a command's is, so that a filter of
// system calls tells the log's by its number alone.
constexpr int kLogDescriptor = 700;

struct Plan {
    std::uintptr_t programStart = 0;
    std::uintptr_t programEnd = 0;
    Kind kind = kKinds;
    bool isFromThenOn = false;
    bool isToKill = false;
    unsigned long number = 0;
    unsigned long calls[kKinds] = {};
    bool hasHit = false;
    long clockShiftSeconds = 0;
    char report[4096] = {};
    int said = -1;
    std::FILE* log = nullptr;
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

// Counts a call, and tells whether it is to fail.
bool failsNext(Kind kind) {
    const unsigned long number = ++gPlan.calls[kind];
    if (kind != gPlan.kind || number < gPlan.number || (number > gPlan.number && !gPlan.isFromThenOn)) {
        return false;
    }
    if (!gPlan.hasHit) {
        gPlan.hasHit = true;
        say("hit\n");
    }
    if (gPlan.isToKill) {
        kill(getpid(), SIGKILL);
    }
    return true;
}

// The same for a call that returns to `caller`, if that is Morvane's own.
bool fails(Kind kind, const void* caller) {
    const auto address = reinterpret_cast<std::uintptr_t>(caller);
    return address >= gPlan.programStart && address < gPlan.programEnd && failsNext(kind);
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

template <std::size_t Length>
void filterSystemCalls(const sock_filter (&program)[Length]) {
    const sock_fprog filter = {Length, const_cast<sock_filter*>(program)}; // only read
    if (prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0) != 0 ||
        syscall(SYS_seccomp, SECCOMP_SET_MODE_FILTER, 0, &filter) != 0) {
        std::abort();
    }
}

// From now on no process can be made.
void refuseForks() {
    filterSystemCalls({
        BPF_STMT(BPF_LD | BPF_W | BPF_ABS, offsetof(seccomp_data, nr)),
        BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, SYS_clone, 3, 0),
        BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, SYS_clone3, 2, 0),
        BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, SYS_fork, 1, 0),
        BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, SYS_vfork, 0, 1),
        BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ERRNO | EAGAIN),
        BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ALLOW),
    });
}

// Stands in for a write to the log: the kernel hands it over as a signal.
void writeLog(int /*signal*/, siginfo_t* /*info*/, void* context) {
    greg_t* const registers = static_cast<ucontext_t*>(context)->uc_mcontext.gregs;
#ifdef __x86_64__
    constexpr int kResult = REG_RAX;
    constexpr int kText = REG_RSI;
    constexpr int kLength = REG_RDX;
#else
    constexpr int kResult = REG_EAX;
    constexpr int kText = REG_ECX;
    constexpr int kLength = REG_EDX;
#endif
    if (failsNext(kLogWrite)) {
        registers[kResult] = -ENOSPC;
        return;
    }
    const int error = errno;
    // The register holds the address.
    const iovec text = {reinterpret_cast<void*>(registers[kText]), // NOLINT(performance-no-int-to-ptr)
                        static_cast<std::size_t>(registers[kLength])};
    const long written = syscall(SYS_writev, kLogDescriptor, &text, 1); // which the filter lets pass
    registers[kResult] = static_cast<greg_t>(written < 0 ? -errno : written);
    errno = error;
}

void takeLogWrites() {
    struct sigaction action {};
    action.sa_sigaction = writeLog;
    action.sa_flags = SA_SIGINFO;
    sigaction(SIGSYS, &action, nullptr);
    filterSystemCalls({
        BPF_STMT(BPF_LD | BPF_W | BPF_ABS, offsetof(seccomp_data, nr)),
        BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, SYS_write, 0, 3),
        BPF_STMT(BPF_LD | BPF_W | BPF_ABS, offsetof(seccomp_data, args[0])), // the lower half of it
        BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, kLogDescriptor, 0, 1),
        BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_TRAP),
        BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ALLOW),
    });
}

// Moves the log's descriptor, and begins to keep what is said to it. Returns where it is now.
int beginLog(int fd) {
    if (fd < 0 || gPlan.programEnd == 0) {
        return fd;
    }
    const int moved = static_cast<int>(syscall(SYS_dup3, fd, kLogDescriptor, O_CLOEXEC));
    syscall(SYS_close, fd);
    char path[sizeof gPlan.report + 8] = {};
    std::snprintf(path, sizeof path, "%s.said", gPlan.report);
    gPlan.said = static_cast<int>(
        syscall(SYS_openat, AT_FDCWD, path, O_WRONLY | O_CREAT | O_APPEND | O_CLOEXEC, 0600));
    if (moved != kLogDescriptor || gPlan.said < 0) {
        std::abort();
    }
    takeLogWrites();
    return moved;
}

bool isLog(const char* path) {
    return std::strcmp(path, "Morvane.log") == 0;
}

void keepSaid(std::FILE* stream, const void* text, std::size_t length) {
    if (stream == gPlan.log && stream != nullptr) {
        static_cast<void>(!syscall(SYS_write, gPlan.said, text, length));
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
            gPlan.isToKill = std::strncmp(text + length, ":kill:", 6) == 0;
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
    errno = ENOSPC;
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
    return OWN_CALL_FAILS(kFileOpen) ? (failWith(EMFILE), nullptr) : kReal(path, mode);
}

std::FILE* fopen64(const char* path, const char* mode) {
    static auto* const kReal = real(&fopen64, "fopen64");
    return OWN_CALL_FAILS(kFileOpen) ? (failWith(EMFILE), nullptr) : kReal(path, mode);
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

int openat(int directory, const char* path, int flags, ...) {
    static auto* const kReal = real(&openat, "openat");
    va_list arguments;
    va_start(arguments, flags);
    const mode_t mode = (flags & O_CREAT) != 0 ? va_arg(arguments, mode_t) : 0;
    va_end(arguments);
    if (OWN_CALL_FAILS(kLogOpen)) {
        return failWith(ENFILE);
    }
    const int fd = kReal(directory, path, flags, mode);
    return isLog(path) ? beginLog(fd) : fd;
}

int openat64(int directory, const char* path, int flags, ...) {
    static auto* const kReal = real(&openat64, "openat64");
    va_list arguments;
    va_start(arguments, flags);
    const mode_t mode = (flags & O_CREAT) != 0 ? va_arg(arguments, mode_t) : 0;
    va_end(arguments);
    if (OWN_CALL_FAILS(kLogOpen)) {
        return failWith(ENFILE);
    }
    const int fd = kReal(directory, path, flags, mode);
    return isLog(path) ? beginLog(fd) : fd;
}

std::FILE* fdopen(int fd, const char* mode) noexcept {
    static auto* const kReal = real(&fdopen, "fdopen");
    if (OWN_CALL_FAILS(kStream)) {
        errno = ENOMEM;
        return nullptr;
    }
    std::FILE* const stream = kReal(fd, mode);
    if (fd == kLogDescriptor) {
        gPlan.log = stream;
    }
    return stream;
}

int pipe2(int* ends, int flags) noexcept {
    static auto* const kReal = real(&pipe2, "pipe2");
    return OWN_CALL_FAILS(kPipe) ? failWith(EMFILE) : kReal(ends, flags);
}

int posix_spawn(pid_t* process, const char* path, const posix_spawn_file_actions_t* actions,
                const posix_spawnattr_t* attributes, char* const* arguments, char* const* environment) {
    static auto* const kReal = real(&posix_spawn, "posix_spawn");
    if (OWN_CALL_FAILS(kSpawn)) {
        return ENOMEM;
    }
    if (OWN_CALL_FAILS(kFork)) {
        refuseForks();
    }
    return kReal(process, path, actions, attributes, arguments, environment);
}

pid_t waitpid(pid_t process, int* status, int options) {
    static auto* const kReal = real(&waitpid, "waitpid");
    return OWN_CALL_FAILS(kWait) ? failWith(ECHILD) : kReal(process, status, options);
}

std::size_t fread(void* buffer, std::size_t size, std::size_t count, std::FILE* stream) {
    static auto* const kReal = real(&fread, "fread");
    return OWN_CALL_FAILS(kRead) ? (setError(stream), 0) : kReal(buffer, size, count, stream);
}

char* fgets(char* buffer, int size, std::FILE* stream) {
    static auto* const kReal = real(&fgets, "fgets");
    return OWN_CALL_FAILS(kLineRead) ? (setError(stream), nullptr) : kReal(buffer, size, stream);
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

ssize_t readlinkat(int directory, const char* path, char* buffer, std::size_t size) noexcept {
    static auto* const kReal = real(&readlinkat, "readlinkat");
    return OWN_CALL_FAILS(kLinkRead) ? failWith(EIO) : kReal(directory, path, buffer, size);
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

int __vfprintf_chk(std::FILE* stream, int flag, const char* format, va_list arguments)
    __attribute__((format(printf, 3, 0)));
int __vfprintf_chk(std::FILE* stream, int flag, const char* format, va_list arguments) {
    static auto* const kReal = real(&__vfprintf_chk, "__vfprintf_chk");
    static char sText[65536];
    va_list copy;
    va_copy(copy, arguments);
    const int length = std::vsnprintf(sText, sizeof sText, format, copy);
    va_end(copy);
    if (length < 0 || static_cast<std::size_t>(length) >= sizeof sText) {
        std::abort();
    }
    keepSaid(stream, sText, static_cast<std::size_t>(length));
    return OWN_CALL_FAILS(kLogText) ? (setError(stream), -1) : kReal(stream, flag, format, arguments);
}

std::size_t fwrite_unlocked(const void* text, std::size_t size, std::size_t count, std::FILE* stream) {
    static auto* const kReal = real(&fwrite_unlocked, "fwrite_unlocked");
    keepSaid(stream, text, size * count);
    const bool isText = size * count != 0; // no stream refuses nothing
    return isText && OWN_CALL_FAILS(kLogText) ? (setError(stream), 0) : kReal(text, size, count, stream);
}

int fflush(std::FILE* stream) {
    static auto* const kReal = real(&fflush, "fflush");
    return OWN_CALL_FAILS(kFlush) ? (setError(stream), -1) : kReal(stream);
}

int fsync(int fd) {
    static auto* const kReal = real(&fsync, "fsync");
    return OWN_CALL_FAILS(kSync) ? failWith(EIO) : kReal(fd);
}

int flock(int fd, int operation) noexcept {
    static auto* const kReal = real(&flock, "flock");
    return OWN_CALL_FAILS(kLock) ? failWith(ENOLCK) : kReal(fd, operation);
}

int ftruncate(int fd, off_t length) noexcept {
    static auto* const kReal = real(&ftruncate, "ftruncate");
    return OWN_CALL_FAILS(kTruncate) ? failWith(EIO) : kReal(fd, length);
}

int ftruncate64(int fd, off64_t length) noexcept {
    static auto* const kReal = real(&ftruncate64, "ftruncate64");
    return OWN_CALL_FAILS(kTruncate) ? failWith(EIO) : kReal(fd, length);
}

int fchmod(int fd, mode_t mode) noexcept {
    static auto* const kReal = real(&fchmod, "fchmod");
    return OWN_CALL_FAILS(kMode) ? failWith(EROFS) : kReal(fd, mode);
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

int fstat(int fd, struct stat* status) noexcept {
    static auto* const kReal = real(&fstat, "fstat");
    return OWN_CALL_FAILS(kStat) ? failWith(EIO) : kReal(fd, status);
}

int fstat64(int fd, struct stat64* status) noexcept {
    static auto* const kReal = real(&fstat64, "fstat64");
    return OWN_CALL_FAILS(kStat) ? failWith(EIO) : kReal(fd, status);
}

int fstatat(int directory, const char* path, struct stat* status, int flags) noexcept {
    static auto* const kReal = real(&fstatat, "fstatat");
    return OWN_CALL_FAILS(kStat) ? failWith(EIO) : kReal(directory, path, status, flags);
}

int fstatat64(int directory, const char* path, struct stat64* status, int flags) noexcept {
    static auto* const kReal = real(&fstatat64, "fstatat64");
    return OWN_CALL_FAILS(kStat) ? failWith(EIO) : kReal(directory, path, status, flags);
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

HBA_STATUS HBA_LoadLibrary() {
    static auto* const kReal = real(&HBA_LoadLibrary, "HBA_LoadLibrary");
    static_cast<void>(OWN_CALL_FAILS(kHbaCall));
    return kReal();
}

HBA_STATUS HBA_FreeLibrary() {
    static auto* const kReal = real(&HBA_FreeLibrary, "HBA_FreeLibrary");
    static_cast<void>(OWN_CALL_FAILS(kHbaCall));
    return kReal();
}

HBA_UINT32 HBA_GetNumberOfAdapters() {
    static auto* const kReal = real(&HBA_GetNumberOfAdapters, "HBA_GetNumberOfAdapters");
    static_cast<void>(OWN_CALL_FAILS(kHbaCall));
    return kReal();
}

HBA_STATUS HBA_GetAdapterName(HBA_UINT32 index, char* name) {
    static auto* const kReal = real(&HBA_GetAdapterName, "HBA_GetAdapterName");
    static_cast<void>(OWN_CALL_FAILS(kHbaCall));
    return kReal(index, name);
}

HBA_HANDLE HBA_OpenAdapter(char* name) {
    static auto* const kReal = real(&HBA_OpenAdapter, "HBA_OpenAdapter");
    static_cast<void>(OWN_CALL_FAILS(kHbaCall));
    return kReal(name);
}

void HBA_CloseAdapter(HBA_HANDLE handle) {
    static auto* const kReal = real(&HBA_CloseAdapter, "HBA_CloseAdapter");
    static_cast<void>(OWN_CALL_FAILS(kHbaCall));
    kReal(handle);
}

HBA_STATUS HBA_GetAdapterAttributes(HBA_HANDLE handle, HBA_ADAPTERATTRIBUTES* attributes) {
    static auto* const kReal = real(&HBA_GetAdapterAttributes, "HBA_GetAdapterAttributes");
    static_cast<void>(OWN_CALL_FAILS(kHbaCall));
    return kReal(handle, attributes);
}

HBA_STATUS HBA_GetAdapterPortAttributes(HBA_HANDLE handle, HBA_UINT32 index, HBA_PORTATTRIBUTES* attributes) {
    static auto* const kReal = real(&HBA_GetAdapterPortAttributes, "HBA_GetAdapterPortAttributes");
    static_cast<void>(OWN_CALL_FAILS(kHbaCall));
    return kReal(handle, index, attributes);
}

HBA_STATUS HBA_GetFcpTargetMapping(HBA_HANDLE handle, HBA_FCPTARGETMAPPING* mapping) {
    static auto* const kReal = real(&HBA_GetFcpTargetMapping, "HBA_GetFcpTargetMapping");
    static_cast<void>(OWN_CALL_FAILS(kHbaCall));
    return kReal(handle, mapping);
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
