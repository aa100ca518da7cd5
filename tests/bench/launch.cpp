// launch RESULT PROGRAM [ARGUMENT...]: runs the program and writes three numbers into RESULT: its CPU
// seconds, those of the children that it waited for, and its peak resident memory in KiB. Runs within a
// simulated host, so that neither the host's set-up nor its devices' work counts.
#include <fcntl.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <cstring>

namespace {

double seconds(const timeval& time) {
    return static_cast<double>(time.tv_sec) + static_cast<double>(time.tv_usec) / 1e6;
}

// The process's own time on a CPU, which a zombie still tells, unlike its children's: nanoseconds, the first
// number of schedstat.
double ownSeconds(pid_t process) {
    char path[64];
    std::snprintf(path, sizeof path, "/proc/%d/schedstat", process);
    char text[128] = {};
    const int fd = open(path, O_RDONLY);
    const ssize_t count = fd >= 0 ? read(fd, text, sizeof text - 1) : -1;
    return count > 0 ? static_cast<double>(std::strtoull(text, nullptr, 10)) / 1e9 : -1;
}

} // namespace

int main(int argc, char** argv) {
    if (argc < 3) {
        return 2;
    }
    const pid_t child = fork();
    if (child == 0) {
        execv(argv[2], argv + 2);
        _exit(127);
    }
    siginfo_t info{};
    waitid(P_PID, static_cast<id_t>(child), &info, WEXITED | WNOWAIT);
    const double own = ownSeconds(child);
    int status = 0;
    rusage usage{};
    wait4(child, &status, 0, &usage);
    const double all = seconds(usage.ru_utime) + seconds(usage.ru_stime);
    std::FILE* const result = std::fopen(argv[1], "w");
    if (result == nullptr) {
        return 2;
    }
    std::fprintf(result, "%.6f %.6f %ld\n", own, all - own, usage.ru_maxrss);
    std::fclose(result);
    return WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
}
