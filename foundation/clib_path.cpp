#include "foundation/clib_path.hpp"

#include <unistd.h>
#include <utime.h>

#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <string>

#include "foundation/assertion.hpp"
#include "foundation/clib_error.hpp"
#include "foundation/clib_stream.hpp"
#include "foundation/exceptions.hpp"

namespace {

// Drops the environment entry that is `block` itself.
void removeFromEnvironment(const char* block) {
    char** entry = environ;
    while (entry != nullptr && *entry != nullptr && *entry != block) {
        ++entry;
    }
    while (entry != nullptr && *entry != nullptr) {
        *entry = entry[1];
        ++entry;
    }
}

} // namespace

int Clib_chdir(const char* path) {
    const int result = chdir(path);
    if (result != 0) {
        throwErrno<ClibChdirFailedEx>();
    }
    return result;
}

int Clib_chmod(const char* path, mode_t mode) {
    const int result = chmod(path, mode);
    if (result != 0) {
        throwErrno<ClibChmodFailedEx>();
    }
    return result;
}

char* Clib_getcwd(char* buffer, std::size_t size) {
    char* const result = getcwd(buffer, size);
    if (result == nullptr) {
        throwErrno<ClibPwdFailedEx>();
    }
    return result;
}

int Clib_mkdir(const char* path, mode_t mode) {
    const int result = mkdir(path, mode);
    if (result == -1) {
        if (errno == EEXIST) {
            throwErrno<ExistsEx>();
        }
        throwErrno<ClibMkdirFailedEx>();
    }
    return result;
}

int Clib_rmdir(const char* path) {
    const int result = rmdir(path);
    if (result == -1) {
        throwErrno<ClibRmdirFailedEx>();
    }
    return result;
}

int Clib_unlink(const char* path) {
    const int result = unlink(path);
    if (result == -1) {
        throwErrno<ClibUnlinkFailedEx>();
    }
    return result;
}

int Clib_stat(const char* path, struct stat* status) {
    const int result = stat(path, status);
    if (result == -1) {
        throwErrno<ClibStatFailedEx>();
    }
    return result;
}

int Clib_utime(const char* path) {
    const int result = utime(path, nullptr);
    if (result == -1) {
        throwErrno<ClibUtimeFailedEx>();
    }
    return result;
}

int Clib_checkProcess(int processId) {
    char path[sizeof "/proc/-2147483648"];
    Clib_snprintf(path, sizeof path, "/proc/%d", processId);
    struct stat status {};
    const int result = stat(path, &status);
    if (result == -1) {
        throwErrno<ClibGetProcStatusFailedEx>();
    }
    return result;
}

int Clib_setenv(const char* name, const char* value) {
    std::string text(name);
    text += "=";
    text += value;
    auto* const block = static_cast<char*>(std::calloc(text.size() + 1, 1));
    if (block == nullptr) {
        throw NoMemoryEx("No Memory\n");
    }
    std::memcpy(block, text.c_str(), text.size());
    const int result = putenv(block);
    const int error = errno;
    // putenv keeps the block itself, and the block is about to go.
    removeFromEnvironment(block);
    std::memset(block, 0, text.size() + 1);
    std::free(block);
    if (result != 0) {
        throw ClibPutenvFailedEx(ErrnoText(error).text);
    }
    return result;
}

int Clib_mkstemp(char* templateFile) {
    ASSERT_OR_EXIT(templateFile != __null); // NOLINT(modernize-use-nullptr): the text that the log shows
    return mkstemp(templateFile);
}

char* Clib_getenv(const char* name) {
    return std::getenv(name);
}

pid_t Clib_getpid() {
    return getpid();
}

mode_t Clib_umask(mode_t mask) {
    return umask(mask);
}
