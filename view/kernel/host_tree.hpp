#pragma once

#include <cstddef>
#include <optional>
#include <set>
#include <string>
#include <string_view>
#include <unordered_set>
#include <vector>

namespace view {

// A folder into which files of a host are copied as they are read: regular files, folders, and links that
// stay inside.
class Recording {
public:
    // Makes the folder `path`, or takes an empty one. Throws std::runtime_error for one that holds anything,
    // and for what cannot be made.
    explicit Recording(std::string path);

    // Puts a file at `path` below the folder. Throws std::runtime_error when it cannot be written.
    void addFile(const std::string& path, std::string_view content);

    // Puts a folder there, or a link to the folder `target`, which is a path below the recording as well.
    // Throw likewise.
    void addFolder(const std::string& path);
    void addLink(const std::string& path, const std::string& target);

    [[nodiscard]] const std::string& path() const { return mPath; }

private:
    std::string prepare(const std::string& path);

    std::string mPath;
    std::set<std::string> mDone;
};

// The files of a host below a root: the host's own, or a recording's. Nothing here follows a link out of the
// root, opens anything but regular files and folders, or reads without a limit. Paths are below the root and
// have no slash in front; a folder is named by its path without links, as folder() gives it.
class HostTree {
public:
    // Opens `root`; a `recording`, which must outlive the tree, gets a copy of everything that is read.
    // Throws std::system_error.
    explicit HostTree(const std::string& root, Recording* recording = nullptr);
    HostTree(const HostTree&) = delete;
    HostTree& operator=(const HostTree&) = delete;
    ~HostTree();

    // The folder to which `path` leads from the folder `from`, links followed as if the root were the host's;
    // nothing when it leads to none.
    std::optional<std::string> folder(const std::string& from, const std::string& path);

    // The whole content of a file of a folder; nothing when it is no regular file, cannot be read or is
    // larger than `limit` bytes.
    std::optional<std::string> read(const std::string& folder, const std::string& name,
                                    std::size_t limit = kUsualLimit);

    // The same as one line: without blanks and line ends behind it. Empty when there is none.
    std::string line(const std::string& folder, const std::string& name);

    // The names in a folder, shorter ones first, so that sdz stands before sdaa. Throws std::runtime_error
    // when there are more than a host can have.
    std::vector<std::string> list(const std::string& folder) const;

    static constexpr std::size_t kUsualLimit = 4096; // of an attribute in sysfs: a page of memory

private:
    std::optional<std::string> follow(const std::string& from, const std::string& path, int& linksLeft);
    std::optional<std::string> step(const std::string& from, const std::string& name, int& linksLeft);

    int mRoot;
    Recording* mRecording;
    std::unordered_set<std::string> mFolders; // that are known to be some
};

} // namespace view
