// Reading a directory entry by entry.
#pragma once

#include <dirent.h>

// An open directory, closed with the object.
class Directory {
public:
    explicit Directory(const char* path) : mStream(opendir(path)) {}
    Directory(const Directory&) = delete;
    Directory& operator=(const Directory&) = delete;
    ~Directory() {
        if (mStream != nullptr) {
            closedir(mStream);
        }
    }

    bool isOpen() const { return mStream != nullptr; }

    // The next entry, owned by this object and good until the next call; null at the end and on a read error.
    dirent* next() const {
        dirent* result = nullptr;
#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Wdeprecated-declarations" // an entry of our own, which its reader may change
        const int error = readdir_r(mStream, &mEntry, &result);
#pragma GCC diagnostic pop
        return error == 0 ? result : nullptr;
    }

private:
    DIR* mStream;
    mutable dirent mEntry = {};
};
