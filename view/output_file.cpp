#include "view/output_file.hpp"

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

void writeTo(std::ofstream& file, const std::string& path, const std::function<void(std::ostream&)>& write) {
    if (file) {
        write(file);
        file.close();
    }
    if (!file) {
        throw systemTrouble(path);
    }
}

// A file of its own name beside `path`, gone at the end unless it was put in its place.
class FileBeside {
public:
    explicit FileBeside(const std::string& path) : mPath(path), mName(path + ".XXXXXX") {
        const int fd = mkstemp(mName.data());
        if (fd < 0) {
            throw systemTrouble(path);
        }
        const mode_t mask = umask(0);
        umask(mask);
        struct stat old {};
        const mode_t mode = stat(path.c_str(), &old) == 0 ? old.st_mode & 0777U : 0666U & ~mask;
        const bool isUsable = fchmod(fd, mode) == 0;
        close(fd);
        if (!isUsable) {
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

    [[nodiscard]] const std::string& name() const { return mName; }

    void takePlace() {
        if (std::rename(mName.c_str(), mPath.c_str()) != 0) {
            throw systemTrouble(mPath);
        }
        mName.clear();
    }

private:
    std::string mPath;
    std::string mName;
};

} // namespace

void writeOutput(const std::string& path, const std::vector<std::string>& inputs,
                 const std::function<void(std::ostream&)>& write) {
    if (path == "-") {
        write(std::cout);
        return;
    }
    std::error_code ignored;
    const fs::file_status place = fs::status(path, ignored); // of what a link leads to
    if (fs::exists(place) && !fs::is_regular_file(place)) {
        errno = 0;
        std::ofstream file(path, std::ios::binary);
        writeTo(file, path, write);
        return;
    }
    refuseToSpoil(path, inputs);
    // A link stays one: its target is replaced.
    const fs::path target =
        fs::is_symlink(fs::symlink_status(path, ignored)) ? fs::weakly_canonical(path) : fs::path(path);
    FileBeside beside(target.string());
    errno = 0;
    std::ofstream file(beside.name(), std::ios::binary);
    writeTo(file, path, write);
    beside.takePlace();
}

} // namespace view
