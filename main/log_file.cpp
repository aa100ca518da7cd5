#include "main/log_file.hpp"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <sys/sysmacros.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <climits>
#include <cstdlib>
#include <exception>
#include <list>
#include <string>

#include "foundation/clib_error.hpp"
#include "foundation/clib_path.hpp"
#include "foundation/clib_stream.hpp"
#include "foundation/exceptions.hpp"
#include "foundation/log.hpp"

namespace {

constexpr const char* kDirectory = "./MorvaneLogs";
constexpr const char* kName = "Morvane.log";
constexpr mode_t kDirectoryMode = 0777;                             // less the umask
constexpr mode_t kFileMode = S_IRUSR | S_IWUSR | S_IRGRP | S_IROTH; // less the umask
constexpr mode_t kOthersMayWrite = S_IWGRP | S_IWOTH;

// Held open, and with it the lock, until the process ends.
int gDirectory = -1;

// Why there is no log; a message for standard error.
struct Refusal {
    std::string reason;
};

[[noreturn]] void refuse(const std::string& what, int error) {
    throw Refusal{what + ": " + ErrnoText(error).text};
}

[[noreturn]] void refuseStart(const char* line, const std::string& reason) {
    static_cast<void>(std::fprintf(stderr, "morvane: %s\n", reason.c_str()));
    Clib_printf("%s", line);
    std::exit(1);
}

std::string userName(uid_t user) {
    return user == 0 ? "root" : "user " + std::to_string(user);
}

// Adds to a reason whose directory it is, where that is not the user's own.
std::string inDirectoryOf(const struct stat& directory) {
    return directory.st_uid == geteuid() ? ""
                                         : " (the directory belongs to " + userName(directory.st_uid) + ")";
}

void makeDirectory() {
    struct stat status {};
    try {
        Clib_stat(kDirectory, &status);
    } catch (const ClibStatFailedEx&) {
        try {
            Clib_mkdir(kDirectory, kDirectoryMode);
        } catch (const ClibMkdirFailedEx& exception) {
            refuseStart("Failed in creating the directory for keeping the log files\n",
                        std::string(kDirectory) + ": " + exception.what());
        } catch (const ExistsEx&) {
            return; // another process made it meanwhile
        }
    }
}

// The steps of a path from one directory to the next; the first of an absolute one is "/".
std::list<std::string> stepsOf(const std::string& path) {
    std::list<std::string> steps;
    if (!path.empty() && path.front() == '/') {
        steps.emplace_back("/");
    }
    for (std::size_t at = 0; at < path.size();) {
        const std::size_t end = std::min(path.find('/', at), path.size());
        if (end > at) {
            steps.push_back(path.substr(at, end - at));
        }
        at = end + 1;
    }
    return steps;
}

// Opens the directory at `path`. Links on the way, the directory's own name among them, are followed if the
// user or root made them. Every step is taken from a directory that is held open: nobody can exchange what
// was looked at.
int openTrusted(const char* path) {
    constexpr int kMostLinks = 40;
    std::list<std::string> steps = stepsOf(path);
    int place = open(".", O_PATH | O_DIRECTORY | O_CLOEXEC);
    for (int links = 0; place >= 0 && !steps.empty();) {
        const std::string step = steps.front();
        steps.pop_front();
        const int next = openat(place, step.c_str(), O_PATH | O_NOFOLLOW | O_CLOEXEC);
        struct stat status {};
        if (next < 0 || fstat(next, &status) != 0) {
            refuse(path, errno);
        }
        if (!S_ISLNK(status.st_mode)) {
            close(place);
            place = next;
            continue;
        }
        if (status.st_uid != geteuid() && status.st_uid != 0) {
            throw Refusal{std::string(path) + ": a link that " + userName(status.st_uid) + " made"};
        }
        char target[PATH_MAX] = {};
        if (readlinkat(next, "", target, sizeof target - 1) < 0 || ++links > kMostLinks) {
            refuse(path, links > kMostLinks ? ELOOP : errno);
        }
        close(next);
        steps.splice(steps.begin(), stepsOf(target));
    }
    const int directory = place < 0 ? -1 : openat(place, ".", O_RDONLY | O_DIRECTORY | O_CLOEXEC);
    if (directory < 0) {
        refuse(path, errno);
    }
    close(place);
    return directory;
}

// The process that holds the lock of `file`, as the kernel lists it; 0 when that cannot be told.
long lockHolder(const struct stat& file) {
    char place[64] = {};
    Clib_snprintf(place, sizeof place, "%02x:%02x:%llu ", major(file.st_dev), minor(file.st_dev),
                  static_cast<unsigned long long>(file.st_ino));
    std::FILE* const locks = std::fopen("/proc/locks", "re");
    if (locks == nullptr) {
        return 0;
    }
    long holder = 0;
    char line[256] = {};
    while (holder == 0 && std::fgets(line, sizeof line, locks) != nullptr) {
        const std::string text = line; // such as "3: FLOCK  ADVISORY  WRITE 4711 fe:00:655 0 EOF"
        const std::size_t at = text.find(place);
        if (text.find(" FLOCK ") != std::string::npos && at != std::string::npos && at > 1) {
            holder =
                std::atol(text.c_str() + text.rfind(' ', at - 2)); // NOLINT(cert-err34-c): 0 says nothing
        }
    }
    static_cast<void>(std::fclose(locks));
    return holder;
}

void lock(int directory, const struct stat& status) {
    if (flock(directory, LOCK_EX | LOCK_NB) == 0) {
        return;
    }
    if (errno != EWOULDBLOCK) {
        refuse(kDirectory, errno);
    }
    const long holder = lockHolder(status);
    throw Refusal{std::string(kDirectory) + ": locked" +
                  (holder > 0 ? " by process " + std::to_string(holder) : "") +
                  ", as by a run that is writing its log there"};
}

// Whether the log may be written over: a regular file of the user's with no other name. One that others may
// write to is not: somebody may have it open.
bool isOwn(const struct stat& status) {
    return S_ISREG(status.st_mode) && status.st_uid == geteuid() && status.st_nlink == 1 &&
           (status.st_mode & kOthersMayWrite) == 0;
}

bool isSame(const struct stat& a, const struct stat& b) {
    return a.st_dev == b.st_dev && a.st_ino == b.st_ino;
}

// Opens the log that an earlier run of the user's left, emptied; -1 where there is no such log, and nothing
// in its place any more.
int reopenOwn(const struct stat& directory) {
    const std::string path = kLogFile;
    struct stat found {};
    if (fstatat(gDirectory, kName, &found, AT_SYMLINK_NOFOLLOW) != 0) {
        if (errno != ENOENT) {
            throw Refusal{path + ": " + ErrnoText().text + inDirectoryOf(directory)};
        }
        return -1;
    }
    if (!isOwn(found)) {
        if (unlinkat(gDirectory, kName, 0) != 0) {
            throw Refusal{path + ": not a log of " + userName(geteuid()) +
                          "'s, and cannot be replaced: " + ErrnoText().text + inDirectoryOf(directory)};
        }
        return -1;
    }
    // Not opened for good before it has turned out to be the file that was looked at.
    const int file = openat(gDirectory, kName, O_RDWR | O_NOFOLLOW | O_NONBLOCK | O_CLOEXEC);
    struct stat opened {};
    if (file < 0 || fstat(file, &opened) != 0) {
        throw Refusal{path + ": " + ErrnoText().text + inDirectoryOf(directory)};
    }
    if (!isOwn(opened) || !isSame(found, opened)) {
        throw Refusal{path + ": replaced while it was opened"};
    }
    if (ftruncate(file, 0) != 0) {
        refuse(path, errno);
    }
    return file;
}

int openFile(const struct stat& directory) {
    const int own = reopenOwn(directory);
    if (own >= 0) {
        return own;
    }
    const int file = openat(gDirectory, kName, O_RDWR | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC, kFileMode);
    if (file < 0) {
        throw Refusal{std::string(kLogFile) + ": " + ErrnoText().text + inDirectoryOf(directory)};
    }
    return file;
}

// Opens /dev/null in the place of each standard descriptor that the caller closed: the next file that is
// opened would take it, and everything written to it.
void haveStandardDescriptors() {
    for (int fd = 0; fd <= STDERR_FILENO; ++fd) {
        if (fcntl(fd, F_GETFD) == -1 && open("/dev/null", O_RDWR) != fd) {
            refuse("/dev/null", errno);
        }
    }
}

[[noreturn]] void failLog(int error) {
    throw WriteFailedEx((std::string(kLogFile) + ": " + ErrnoText(error).text).c_str());
}

} // namespace

std::FILE* openLogFile() {
    try {
        haveStandardDescriptors();
        makeDirectory();
        gDirectory = openTrusted(kDirectory);
        struct stat directory {};
        if (fstat(gDirectory, &directory) != 0) {
            refuse(kDirectory, errno);
        }
        lock(gDirectory, directory);
        return Clib_fdopen(openFile(directory), ClibFM_WriteUpdate);
    } catch (const Refusal& refusal) {
        refuseStart("Failed in opening the logfile\n", refusal.reason);
    } catch (const std::exception& exception) {
        refuseStart("Failed in opening the logfile\n", exception.what());
    }
}

void completeLogFile(std::FILE* log) {
    flushLog();
    if (logError() != 0) {
        failLog(logError());
    }
    for (const int fd : {fileno(log), gDirectory}) {
        // A file system may have nothing to bring to a disk, or no way to do so for a directory.
        if (fsync(fd) != 0 && errno != EINVAL && errno != ENOSYS && errno != EOPNOTSUPP) {
            failLog(errno);
        }
    }
    struct stat written {};
    struct stat named {};
    if (fstat(fileno(log), &written) != 0 || lstat(kLogFile, &named) != 0) {
        failLog(errno);
    }
    // A file that was cut has its size again, and NULs at its beginning, as soon as the next text is written.
    char first = '\0';
    if (!isSame(written, named) || written.st_size != ftello(log) || pread(fileno(log), &first, 1, 0) != 1 ||
        first != '\n') {
        throw WriteFailedEx((std::string(kLogFile) + ": changed during the run by somebody else").c_str());
    }
}
