#include "view/kernel/host_tree.hpp"

#include <dirent.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <climits>
#include <filesystem>
#include <fstream>
#include <memory>
#include <stdexcept>
#include <system_error>

namespace view {

namespace {

namespace fs = std::filesystem;

constexpr int kMostLinks = 40;                  // on the way to one folder, as the kernel has it
constexpr std::size_t kMostEntries = 1U << 20U; // of a folder: as many minor numbers as there are

[[noreturn]] void fail(const std::string& path) {
    throw std::system_error(errno != 0 ? errno : EIO, std::generic_category(), path);
}

std::string joined(const std::string& folder, const std::string& name) {
    return folder.empty() ? name : folder + '/' + name;
}

std::string parent(const std::string& folder) {
    const std::size_t slash = folder.rfind('/');
    return slash == std::string::npos ? std::string() : folder.substr(0, slash);
}

// A descriptor, closed at the end.
class Descriptor {
public:
    explicit Descriptor(int number) : mNumber(number) {}
    Descriptor(const Descriptor&) = delete;
    Descriptor& operator=(const Descriptor&) = delete;
    ~Descriptor() {
        if (mNumber >= 0) {
            close(mNumber);
        }
    }
    [[nodiscard]] int get() const { return mNumber; }

private:
    int mNumber;
};

} // namespace

Recording::Recording(std::string path) : mPath(std::move(path)) {
    std::error_code error;
    fs::create_directories(mPath, error);
    const bool isEmpty = !error && fs::is_empty(mPath, error);
    if (error) {
        throw std::system_error(error, mPath);
    }
    if (!isEmpty) {
        throw std::runtime_error(mPath + ": is not empty; name a new folder for the recording");
    }
}

// The place of `path` in the recording, its folders made; empty when it is there already.
std::string Recording::prepare(const std::string& path) {
    if (!mDone.insert(path).second) {
        return {};
    }
    const fs::path place = fs::path(mPath) / path;
    fs::create_directories(place.parent_path());
    return place;
}

void Recording::addFile(const std::string& path, std::string_view content) {
    const std::string place = prepare(path);
    if (place.empty()) {
        return;
    }
    errno = 0;
    std::ofstream file(place, std::ios::binary);
    file.write(content.data(), static_cast<std::streamsize>(content.size()));
    file.close();
    if (!file) {
        fail(place);
    }
}

void Recording::addFolder(const std::string& path) {
    const std::string place = prepare(path);
    if (!place.empty()) {
        fs::create_directory(place);
    }
}

void Recording::addLink(const std::string& path, const std::string& target) {
    const std::string place = prepare(path);
    if (!place.empty()) {
        fs::create_directory_symlink(fs::path("/" + target).lexically_relative("/" + parent(path)), place);
    }
}

HostTree::HostTree(const std::string& root, Recording* recording)
    : mRoot(open(root.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC)), mRecording(recording) {
    if (mRoot < 0) {
        fail(root);
    }
}

HostTree::~HostTree() {
    close(mRoot);
}

std::optional<std::string> HostTree::folder(const std::string& from, const std::string& path) {
    int linksLeft = kMostLinks;
    return follow(from, path, linksLeft);
}

std::optional<std::string> HostTree::follow(const std::string& from, const std::string& path,
                                            int& linksLeft) {
    std::optional<std::string> at = path.starts_with('/') ? std::string() : from;
    std::size_t begin = 0;
    while (at && begin < path.size()) {
        const std::size_t end = std::min(path.find('/', begin), path.size());
        const std::string name = path.substr(begin, end - begin);
        begin = end + 1;
        if (name == "..") {
            at = parent(*at);
        } else if (!name.empty() && name != ".") {
            at = step(*at, name, linksLeft);
        }
    }
    return at;
}

// The folder to which one name in a folder leads.
std::optional<std::string> HostTree::step(const std::string& from, const std::string& name, int& linksLeft) {
    std::string next = joined(from, name);
    if (mFolders.contains(next)) {
        return next;
    }
    std::array<char, PATH_MAX> target{};
    const ssize_t length = readlinkat(mRoot, next.c_str(), target.data(), target.size());
    if (length >= 0) {
        if (linksLeft-- == 0) {
            return std::nullopt;
        }
        auto end = follow(from, std::string(target.data(), static_cast<std::size_t>(length)), linksLeft);
        if (end && mRecording != nullptr) {
            mRecording->addFolder(*end);
            mRecording->addLink(next, *end);
        }
        return end;
    }
    struct stat facts {};
    if (fstatat(mRoot, next.c_str(), &facts, AT_SYMLINK_NOFOLLOW) != 0 || !S_ISDIR(facts.st_mode)) {
        return std::nullopt;
    }
    mFolders.insert(next);
    if (mRecording != nullptr) {
        mRecording->addFolder(next);
    }
    return next;
}

std::optional<std::string> HostTree::read(const std::string& folder, const std::string& name,
                                          std::size_t limit) {
    const std::string path = joined(folder, name);
    struct stat facts {}; // asked first: to open a device can already do something to it
    if (fstatat(mRoot, path.c_str(), &facts, AT_SYMLINK_NOFOLLOW) != 0 || !S_ISREG(facts.st_mode)) {
        return std::nullopt;
    }
    const Descriptor file(
        openat(mRoot, path.c_str(), O_RDONLY | O_NOFOLLOW | O_NONBLOCK | O_NOCTTY | O_CLOEXEC));
    std::string content;
    std::array<char, 16384> buffer{};
    ssize_t count = 0;
    while (content.size() <= limit && (count = ::read(file.get(), buffer.data(), buffer.size())) > 0) {
        content.append(buffer.data(), static_cast<std::size_t>(count));
    }
    if (count < 0 || content.size() > limit) { // a file that was not opened cannot be read either
        return std::nullopt;
    }
    if (mRecording != nullptr) {
        mRecording->addFile(path, content);
    }
    return content;
}

std::string HostTree::line(const std::string& folder, const std::string& name) {
    std::string text = read(folder, name).value_or("");
    text.resize(text.find_last_not_of(" \n") + 1);
    return text;
}

std::vector<std::string> HostTree::list(const std::string& folder) const {
    const int number =
        openat(mRoot, folder.empty() ? "." : folder.c_str(), O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC);
    const std::unique_ptr<DIR, int (*)(DIR*)> directory(number < 0 ? nullptr : fdopendir(number), closedir);
    std::vector<std::string> names;
    if (directory == nullptr) {
        return names;
    }
    while (const dirent* entry = readdir(directory.get())) {
        const std::string name = entry->d_name;
        if (name == "." || name == "..") {
            continue;
        }
        if (names.size() == kMostEntries) {
            throw std::runtime_error(folder + ": holds more entries than a host can have");
        }
        names.push_back(name);
    }
    std::sort(names.begin(), names.end(), [](const std::string& one, const std::string& other) {
        return one.size() != other.size() ? one.size() < other.size() : one < other;
    });
    return names;
}

} // namespace view
