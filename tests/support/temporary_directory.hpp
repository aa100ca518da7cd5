// A directory of a test's own.
#pragma once

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <stdexcept>
#include <string>

// Made empty, removed with everything in it.
class TemporaryDirectory {
public:
    TemporaryDirectory() : mPath((std::filesystem::temp_directory_path() / "morvane-XXXXXX").string()) {
        if (mkdtemp(mPath.data()) == nullptr) {
            throw std::runtime_error("no temporary directory");
        }
    }
    TemporaryDirectory(const TemporaryDirectory&) = delete;
    TemporaryDirectory& operator=(const TemporaryDirectory&) = delete;
    ~TemporaryDirectory() {
        std::error_code ignored;
        std::filesystem::remove_all(mPath, ignored);
    }

    const std::string& path() const { return mPath; }

    // The path of something in it.
    std::string path(const std::string& name) const { return mPath + "/" + name; }

    // Writes a file in it and returns its path.
    std::string file(const std::string& name, const std::string& text) const {
        std::ofstream(path(name)) << text;
        return path(name);
    }

    // The whole text of a file in it.
    std::string textOf(const std::string& name) const {
        std::ifstream stream(path(name));
        return {std::istreambuf_iterator<char>(stream), {}};
    }

private:
    std::string mPath;
};
