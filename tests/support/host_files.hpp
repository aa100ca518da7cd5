// The fixed paths that the host's trees are read from, kept in a directory of the test's own.
#pragma once

#include <set>
#include <string>
#include <vector>

#include "tests/support/temporary_directory.hpp"

// While it lives, every path that begins with one of the fixed ones leads into a directory that is empty at
// first.
class HostFiles {
public:
    HostFiles();
    HostFiles(const HostFiles&) = delete;
    HostFiles& operator=(const HostFiles&) = delete;
    ~HostFiles();

    void file(const std::string& path, const std::string& text) const;
    void directory(const std::string& path) const;
    void link(const std::string& path, const std::string& target) const;
    void pipe(const std::string& path) const;

    // From now on the file system does not tell the type of this directory entry.
    void hideType(const std::string& entryName) { mUntyped.insert(entryName); }
    bool isTypeHidden(const std::string& entryName) const { return mUntyped.contains(entryName); }

    // The names in a directory, in the order in which it is read.
    std::vector<std::string> entries(const std::string& path) const;

    // Where `path` leads.
    std::string resolve(const std::string& path) const;

private:
    void makeParent(const std::string& path) const;

    TemporaryDirectory mRoot;
    std::set<std::string> mUntyped;
};
