#include "foundation/clib_file.hpp"

#include <fcntl.h>
#include <unistd.h>

#include <cerrno>

#include "foundation/clib_error.hpp"
#include "foundation/exceptions.hpp"

int Clib_open(const char* path, int flags, mode_t mode) {
    const int fd = open(path, flags, mode);
    if (fd < 0) {
        throwErrno<OpenFailedEx>();
    }
    return fd;
}

int Clib_creat(const char* path, mode_t mode) {
    const int fd = creat(path, mode);
    if (fd == -1) {
        throwErrno<CreateFailedEx>();
    }
    return fd;
}

int Clib_close(int fd) {
    const int result = close(fd);
    if (result != 0) {
        throwErrno<CloseFailedEx>();
    }
    return result;
}

ssize_t Clib_read(int fd, void* buffer, std::size_t length) {
    const ssize_t count = read(fd, buffer, length);
    if (count == -1) {
        throwErrno<ReadFailedEx>();
    }
    return count;
}

int Clib_dup(int fd) {
    const int copy = dup(fd);
    if (copy == -1) {
        throwErrno<ClibDupFailedEx>();
    }
    return copy;
}

int Clib_dup2(int oldFd, int newFd) {
    const int copy = dup2(oldFd, newFd);
    if (copy == -1) {
        throwErrno<ClibDup2FailedEx>();
    }
    return copy;
}

std::size_t Clib_readAll(int fd, void* buffer, std::size_t length) {
    std::size_t remaining = length;
    auto* position = static_cast<char*>(buffer);
    while (remaining != 0) {
        const ssize_t count = read(fd, position, remaining);
        if (count < 0) {
            if (remaining == length) {
                if (errno == EAGAIN) {
                    throwErrno<TryAgainEx>();
                }
                throwErrno<ReadFailedEx>();
            }
            break;
        }
        if (count == 0) {
            break;
        }
        remaining -= static_cast<std::size_t>(count);
        position += count;
    }
    return length - remaining;
}

std::size_t Clib_writeAll(int fd, const void* buffer, std::size_t length) {
    std::size_t remaining = length;
    const auto* position = static_cast<const char*>(buffer);
    while (remaining != 0) {
        const ssize_t count = write(fd, position, remaining);
        if (count < 0) {
            if (remaining == length) {
                throwErrno<WriteFailedEx>();
            }
            break;
        }
        if (count == 0) {
            break;
        }
        remaining -= static_cast<std::size_t>(count);
        position += count;
    }
    return length - remaining;
}
