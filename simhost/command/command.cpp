// Stands in a simulated host for iscsiadm, pgrep and powermt: prints what the description gives for this call
// of the command that it was called as, and ends with the described status. Linked statically and written on
// the bare system calls: a host's commands start as fast as they can.
#include <fcntl.h>
#include <sys/file.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>

namespace {

constexpr const char* kOwnFolder = "/.simhost/";

// The number in a file that simhost wrote.
long numberIn(const std::string& path) {
    char text[32] = {};
    const int file = ::open(path.c_str(), O_RDONLY | O_CLOEXEC);
    if (file >= 0) {
        if (::read(file, text, sizeof text - 1) < 0) {
            text[0] = '\0';
        }
        ::close(file);
    }
    return std::strtol(text, nullptr, 10);
}

// Counts this call; returns how many came before it.
long countCall(const std::string& path) {
    const int file = ::open(path.c_str(), O_RDWR | O_CLOEXEC);
    ::flock(file, LOCK_EX);
    const long before = numberIn(path);
    ::dprintf(file, "%ld", before + 1);
    ::close(file);
    return before;
}

// Copies a file to a descriptor; a reader that is gone ends the program as it ends any other.
void print(const std::string& path, int to) {
    const int file = ::open(path.c_str(), O_RDONLY | O_CLOEXEC);
    char bytes[65536];
    for (ssize_t size = 0; (size = ::read(file, bytes, sizeof bytes)) > 0;) {
        for (ssize_t done = 0; done < size;) {
            const ssize_t written = ::write(to, bytes + done, static_cast<size_t>(size - done));
            if (written < 0) {
                return;
            }
            done += written;
        }
    }
    ::close(file);
}

void record(char** arguments) {
    const int file = ::open((std::string(kOwnFolder) + "record").c_str(), O_WRONLY | O_APPEND | O_CLOEXEC);
    if (file < 0) {
        return; // nobody asked for one
    }
    std::string line = "run";
    for (; *arguments != nullptr; ++arguments) {
        line += std::string(" ") + *arguments;
    }
    line += "\n";
    if (::write(file, line.data(), line.size()) < 0) {
        std::perror("simhost: writing the record");
    }
    ::close(file);
}

} // namespace

int main(int argumentCount, char** arguments) {
    if (argumentCount < 1) {
        return 2;
    }
    record(arguments);
    const char* slash = std::strrchr(arguments[0], '/');
    const std::string name = slash == nullptr ? arguments[0] : slash + 1;
    const std::string folder = std::string(kOwnFolder) + "commands/" + name + "/";
    const long last = numberIn(folder + "answers") - 1;
    const long call = countCall(folder + "calls");
    const std::string answer = folder + std::to_string(call < last ? call : last) + "/";
    print(answer + "output", STDOUT_FILENO);
    print(answer + "error", STDERR_FILENO);
    return static_cast<int>(numberIn(answer + "status"));
}
