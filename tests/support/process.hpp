// Runs a program to its end, in a directory of its own.
#pragma once

#include <filesystem>
#include <string>
#include <vector>

namespace test {

struct ProcessResult {
    int status = 0; // the exit status; 128 + N when signal N ended it
    std::string output;
    std::string error;
};

// Runs arguments[0] (a path) with standard input empty and `directory` as its working directory.
ProcessResult runProcess(const std::vector<std::string>& arguments, const std::filesystem::path& directory);

// A new directory that is removed with all its content at the end of the scope.
class TemporaryDirectory {
public:
    TemporaryDirectory();
    ~TemporaryDirectory();
    TemporaryDirectory(const TemporaryDirectory&) = delete;
    TemporaryDirectory& operator=(const TemporaryDirectory&) = delete;

    [[nodiscard]] const std::filesystem::path& path() const { return mPath; }

private:
    std::filesystem::path mPath;
};

// The whole content of a file; "" when it cannot be read.
std::string contentOf(const std::filesystem::path& path);

} // namespace test
