#include "tests/support/fake_kernel.hpp"

#include <fcntl.h>
#include <scsi/sg.h>
#include <sys/timeb.h>

#include <algorithm>
#include <cerrno>
#include <cstdarg>

#include <gtest/gtest.h>

namespace {

FakeKernel* gKernel = nullptr;

int fail(int error) {
    errno = error;
    return -1;
}

int openNode(const char* path, int flags, mode_t mode) {
    gKernel->opens.push_back({path, flags, mode});
    if (gKernel->openError != 0) {
        return fail(gKernel->openError);
    }
    const int fd = FakeKernel::kFirstFd + static_cast<int>(gKernel->opens.size()) - 1;
    gKernel->openDescriptors.insert(fd);
    return fd;
}

void copyInto(unsigned char* target, uint32 room, const Bytes& source) {
    std::copy_n(source.begin(), std::min<std::size_t>(room, source.size()), target);
}

} // namespace

FakeKernel::FakeKernel() {
    gKernel = this;
}

FakeKernel::~FakeKernel() {
    gKernel = nullptr;
    EXPECT_TRUE(answers.empty()) << answers.size() << " answers nobody asked for";
    EXPECT_EQ(closesOfNothing, 0) << "a descriptor closed twice";
    EXPECT_EQ(unclearedTimes, 0);
}

// The linker's --wrap gives the code under test these for the C library's functions, which keep the second
// names.
extern "C" {

int realOpen(const char* path, int flags, ...) asm("__real_open");
int realOpen64(const char* path, int flags, ...) asm("__real_open64");
int realClose(int fd) asm("__real_close");

int wrappedOpen(const char* path, int flags, ...) asm("__wrap_open");
int wrappedOpen64(const char* path, int flags, ...) asm("__wrap_open64");
int wrappedClose(int fd) asm("__wrap_close");
int wrappedIoctl(int fd, unsigned long request, void* argument) asm("__wrap_ioctl");
int wrappedFtime(timeb* now) asm("__wrap_ftime");

int wrappedOpen(const char* path, int flags, ...) {
    va_list arguments;
    va_start(arguments, flags);
    const auto mode = va_arg(arguments, mode_t);
    va_end(arguments);
    return gKernel != nullptr ? openNode(path, flags, mode) : realOpen(path, flags, mode);
}

int wrappedOpen64(const char* path, int flags, ...) {
    va_list arguments;
    va_start(arguments, flags);
    const auto mode = va_arg(arguments, mode_t);
    va_end(arguments);
    return gKernel != nullptr ? openNode(path, flags, mode) : realOpen64(path, flags, mode);
}

int wrappedClose(int fd) {
    if (gKernel == nullptr) {
        return realClose(fd);
    }
    ++gKernel->closes;
    if (gKernel->openDescriptors.erase(fd) == 0) {
        ++gKernel->closesOfNothing;
        return fail(EBADF);
    }
    return gKernel->closeError != 0 ? fail(gKernel->closeError) : 0;
}

int wrappedIoctl(int fd, unsigned long request, void* argument) {
    auto& header = *static_cast<sg_io_hdr*>(argument);
    gKernel->commands.push_back({fd, request, Bytes(header.cmdp, header.cmdp + header.cmd_len),
                                 header.dxfer_direction, header.dxfer_len, header.timeout});
    if (gKernel->answers.empty()) {
        ADD_FAILURE() << "a command without an answer";
        return fail(EIO);
    }
    const SgAnswer answer = gKernel->answers.front();
    gKernel->answers.pop_front();
    gKernel->clockMs += answer.elapsedMs;
    if (answer.ioctlError != 0) {
        return fail(answer.ioctlError);
    }
    const uint32 allocationLength = header.cmd_len == 6 ? header.cmdp[3] * 256U + header.cmdp[4] : 0;
    const uint32 room = answer.overruns ? header.dxfer_len : std::min(header.dxfer_len, allocationLength);
    copyInto(static_cast<unsigned char*>(header.dxferp), room, answer.data);
    header.status = answer.status;
    header.host_status = answer.hostStatus;
    header.driver_status = answer.driverStatus;
    copyInto(header.sbp, header.mx_sb_len, answer.sense);
    header.sb_len_wr =
        static_cast<unsigned char>(std::min<std::size_t>(header.mx_sb_len, answer.sense.size()));
    return 0;
}

int wrappedFtime(timeb* now) {
    if (now->time != 0 || now->millitm != 0 || now->timezone != 0 || now->dstflag != 0) {
        ++gKernel->unclearedTimes;
    }
    const bool isStart = gKernel->timesAsked++ % 2 == 0;
    if (isStart && gKernel->beforeCommand) {
        gKernel->beforeCommand();
    }
    now->time = static_cast<time_t>(gKernel->clockMs / 1000);
    now->millitm = static_cast<unsigned short>(gKernel->clockMs % 1000);
    errno = EDOM; // nobody's error: a caller that looks at errno behind this sees it
    return 0;
}

} // extern "C"
