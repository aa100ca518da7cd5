// The stand-ins below need the plain declarations of the functions that they replace.
#undef _FORTIFY_SOURCE

#include "tests/support/host_files.hpp"

#include <dirent.h>
#include <dlfcn.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <filesystem>
#include <vector>

namespace {

HostFiles* gFiles = nullptr;

std::string resolved(const char* path) {
    return gFiles != nullptr ? gFiles->resolve(path) : path;
}

} // namespace

HostFiles::HostFiles() {
    gFiles = this;
}

HostFiles::~HostFiles() {
    gFiles = nullptr;
}

std::string HostFiles::resolve(const std::string& path) const {
    for (const std::string fixed : {"/proc/partitions", "/sys/block", "/etc/iscsi"}) {
        if (path.rfind(fixed, 0) == 0) {
            return mRoot.path() + path;
        }
    }
    return path == "/sy" ? mRoot.path() + path : path;
}

void HostFiles::makeParent(const std::string& path) const {
    std::filesystem::create_directories(std::filesystem::path(mRoot.path() + path).parent_path());
}

void HostFiles::file(const std::string& path, const std::string& text) const {
    makeParent(path);
    std::ofstream(mRoot.path() + path) << text;
}

void HostFiles::directory(const std::string& path) const {
    std::filesystem::create_directories(mRoot.path() + path);
}

void HostFiles::link(const std::string& path, const std::string& target) const {
    makeParent(path);
    std::filesystem::create_symlink(target, mRoot.path() + path);
}

void HostFiles::pipe(const std::string& path) const {
    makeParent(path);
    if (mkfifo((mRoot.path() + path).c_str(), 0600) != 0) {
        throw std::runtime_error("no pipe");
    }
}

std::vector<std::string> HostFiles::entries(const std::string& path) const {
    std::vector<std::string> names;
    DIR* const directory = opendir(path.c_str());
    while (const dirent* const entry = readdir(directory)) {
        names.emplace_back(entry->d_name);
    }
    closedir(directory);
    return names;
}

extern "C" {

std::FILE* fopen(const char* filename, const char* modes) {
    static auto* const kReal = reinterpret_cast<std::FILE* (*)(const char*, const char*)>(
        dlsym(RTLD_NEXT, sizeof(off_t) > sizeof(long) ? "fopen64" : "fopen"));
    return kReal(resolved(filename).c_str(), modes);
}

DIR* opendir(const char* name) {
    const int fd = open(resolved(name).c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC);
    return fd >= 0 ? fdopendir(fd) : nullptr;
}

ssize_t readlink(const char* path, char* buf, size_t len) noexcept {
    return readlinkat(AT_FDCWD, resolved(path).c_str(), buf, len);
}

int readdir_r(DIR* dirp, dirent* entry, dirent** result) {
    errno = 0;
    const dirent* const next = readdir(dirp);
    *result = nullptr;
    if (next == nullptr) {
        return errno;
    }
    *entry = *next;
    if (gFiles != nullptr && gFiles->isTypeHidden(entry->d_name)) {
        entry->d_type = DT_UNKNOWN;
    }
    *result = entry;
    return 0;
}
}
