#include "tests/support/process.hpp"

#include <fcntl.h>
#include <sys/prctl.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <csignal>
#include <cstdlib>
#include <fstream>
#include <sstream>
#include <system_error>

namespace test {
namespace {

constexpr int kCannotStart = 126;

// In the child: never returns.
[[noreturn]] void become(const std::vector<char*>& arguments, const std::filesystem::path& directory,
                         const std::filesystem::path& output, const std::filesystem::path& error) {
    ::prctl(PR_SET_PDEATHSIG, SIGKILL); // a test that is stopped leaves nothing behind
    const int in = ::open("/dev/null", O_RDONLY);
    const int out = ::open(output.c_str(), O_WRONLY | O_CREAT | O_TRUNC, 0600);
    const int err = ::open(error.c_str(), O_WRONLY | O_CREAT | O_TRUNC, 0600);
    if (::dup2(in, STDIN_FILENO) < 0 || ::dup2(out, STDOUT_FILENO) < 0 || ::dup2(err, STDERR_FILENO) < 0 ||
        ::chdir(directory.c_str()) != 0) {
        ::_exit(kCannotStart);
    }
    ::close(in);
    ::close(out);
    ::close(err);
    ::execv(arguments[0], arguments.data());
    ::_exit(kCannotStart);
}

} // namespace

ProcessResult runProcess(const std::vector<std::string>& arguments, const std::filesystem::path& directory) {
    std::vector<std::string> copies = arguments;
    std::vector<char*> pointers;
    pointers.reserve(copies.size() + 1);
    for (std::string& copy : copies) {
        pointers.push_back(copy.data());
    }
    pointers.push_back(nullptr);

    const TemporaryDirectory streams;
    const std::filesystem::path output = streams.path() / "output";
    const std::filesystem::path error = streams.path() / "error";
    const pid_t child = ::fork();
    if (child < 0) {
        throw std::system_error(errno, std::generic_category(), "fork");
    }
    if (child == 0) {
        become(pointers, directory, output, error);
    }
    int status = 0;
    while (::waitpid(child, &status, 0) < 0) {
        if (errno != EINTR) {
            throw std::system_error(errno, std::generic_category(), "waitpid");
        }
    }
    ProcessResult result;
    result.status = WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
    result.output = contentOf(output);
    result.error = contentOf(error);
    return result;
}

TemporaryDirectory::TemporaryDirectory() {
    std::string pattern = (std::filesystem::temp_directory_path() / "morvane-test-XXXXXX").string();
    if (::mkdtemp(pattern.data()) == nullptr) {
        throw std::system_error(errno, std::generic_category(), pattern);
    }
    mPath = pattern;
}

TemporaryDirectory::~TemporaryDirectory() {
    std::error_code ignored;
    std::filesystem::remove_all(mPath, ignored);
}

std::string contentOf(const std::filesystem::path& path) {
    const std::ifstream file(path, std::ios::binary);
    std::ostringstream content;
    content << file.rdbuf();
    return content.str();
}

} // namespace test
