// Owned file descriptors, and system calls whose failure is an exception.
#pragma once

#include <unistd.h>

#include <cerrno>
#include <string>
#include <system_error>
#include <utility>

namespace simhost {

// Returns the call's result; throws std::system_error with `what` when it is negative.
template <typename Result>
Result check(Result result, const std::string& what) {
    if (result < 0) {
        throw std::system_error(errno, std::generic_category(), what);
    }
    return result;
}

class FileDescriptor {
public:
    explicit FileDescriptor(int number = -1) : mNumber(number) {}
    ~FileDescriptor() { reset(); }
    FileDescriptor(FileDescriptor&& other) noexcept : mNumber(std::exchange(other.mNumber, -1)) {}
    FileDescriptor& operator=(FileDescriptor&& other) noexcept {
        reset();
        mNumber = std::exchange(other.mNumber, -1);
        return *this;
    }
    FileDescriptor(const FileDescriptor&) = delete;
    FileDescriptor& operator=(const FileDescriptor&) = delete;

    [[nodiscard]] int get() const { return mNumber; }
    explicit operator bool() const { return mNumber >= 0; }

    void reset() {
        if (mNumber >= 0) {
            ::close(std::exchange(mNumber, -1));
        }
    }

private:
    int mNumber;
};

} // namespace simhost
