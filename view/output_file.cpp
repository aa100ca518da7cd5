#include "view/output_file.hpp"

#include <ext/stdio_filebuf.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iostream>

#include "view/input_log.hpp"
#include "view/trouble.hpp"

namespace view {

namespace {

namespace fs = std::filesystem;

void refuseToSpoil(const std::string& path, const std::vector<std::string>& inputs) {
    std::error_code ignored;
    for (const std::string& input : inputs) {
        if (fs::equivalent(path, input, ignored)) {
            throw troubleWith(path, "is a log that is to be read; name another file to write to");
        }
    }
    if (isLog(path)) {
        throw troubleWith(path, "is a Morvane log; name another file to write to");
    }
}

// A link that somebody else put there could lead to any file: it is no way to one of the caller's.
void refuseOthersLink(const std::string& path) {
    struct stat entry {};
    if (lstat(path.c_str(), &entry) == 0 && S_ISLNK(entry.st_mode) && entry.st_uid != geteuid() &&
        entry.st_uid != 0) {
        throw troubleWith(path, "is a link of another user; name the file that it leads to");
    }
}

void writeTo(std::filebuf& buffer, const std::string& path, const std::function<void(std::ostream&)>& write) {
    std::ostream file(&buffer);
    if (buffer.is_open()) {
        write(file);
    }
    if (!file || buffer.close() == nullptr) {
        throw systemTrouble(path);
    }
}

// A file of its own name beside `path`, gone at the end unless it was put in its place.
class FileBeside {
public:
    explicit FileBeside(const std::string& path)
        : mPath(path), mName(path + ".XXXXXX"), mBuffer(created(), std::ios::out | std::ios::binary) {
        const mode_t mask = umask(0);
        umask(mask);
        struct stat old {};
        const mode_t mode = stat(path.c_str(), &old) == 0 ? old.st_mode & 0777U : 0666U & ~mask;
        if (fchmod(mBuffer.fd(), mode) != 0) {
            unlink(mName.c_str());
            throw systemTrouble(path);
        }
    }
    FileBeside(const FileBeside&) = delete;
    FileBeside& operator=(const FileBeside&) = delete;
    ~FileBeside() {
        if (!mName.empty()) {
            unlink(mName.c_str());
        }
    }

    // Writes to the file that was created, whatever others have put under its name since.
    [[nodiscard]] std::filebuf& buffer() { return mBuffer; }

    void takePlace() {
        if (std::rename(mName.c_str(), mPath.c_str()) != 0) {
            throw systemTrouble(mPath);
        }
        mName.clear();
    }

private:
    int created() {
        const int file = mkstemp(mName.data());
        if (file < 0) {
            throw systemTrouble(mPath);
        }
        return file;
    }

    std::string mPath;
    std::string mName;
    __gnu_cxx::stdio_filebuf<char> mBuffer;
};

} // namespace

void writeOutput(const std::string& path, const std::vector<std::string>& inputs,
                 const std::function<void(std::ostream&)>& write) {
    if (path == "-") {
        write(std::cout);
        return;
    }
    refuseOthersLink(path);
    std::error_code ignored;
    const fs::file_status place = fs::status(path, ignored); // of what a link leads to
    if (fs::exists(place) && !fs::is_regular_file(place)) {
        errno = 0;
        std::filebuf buffer;
        buffer.open(path, std::ios::out | std::ios::binary);
        writeTo(buffer, path, write);
        return;
    }
    refuseToSpoil(path, inputs);
    // A link stays one: its target is replaced.
    const fs::path target =
        fs::is_symlink(fs::symlink_status(path, ignored)) ? fs::weakly_canonical(path) : fs::path(path);
    FileBeside beside(target.string());
    errno = 0;
    writeTo(beside.buffer(), path, write);
    beside.takePlace();
}

} // namespace view
