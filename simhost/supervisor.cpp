#include "simhost/supervisor.hpp"

#include <linux/audit.h>
#include <linux/filter.h>
#include <linux/seccomp.h>
#include <poll.h>
#include <scsi/sg.h>
#include <sys/ioctl.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <sys/uio.h>

#include <array>
#include <bit>
#include <cstddef>

#include "simhost/sg_header.hpp"

#ifndef SECCOMP_IOCTL_NOTIF_SET_FLAGS // Linux 6.6
#define SECCOMP_IOCTL_NOTIF_SET_FLAGS SECCOMP_IOW(4, __u64)
#define SECCOMP_USER_NOTIF_FD_SYNC_WAKE_UP (1UL << 0)
#endif

namespace simhost {
namespace {

// How seccomp names simhost's own architecture; a program of another one is of its 32-bit kind.
#if defined(__x86_64__)
constexpr std::uint32_t kOwnArchitecture = AUDIT_ARCH_X86_64;
#elif defined(__aarch64__)
constexpr std::uint32_t kOwnArchitecture = AUDIT_ARCH_AARCH64;
#elif defined(__s390x__)
constexpr std::uint32_t kOwnArchitecture = AUDIT_ARCH_S390X;
#elif defined(__powerpc64__)
constexpr std::uint32_t kOwnArchitecture = AUDIT_ARCH_PPC64LE;
#endif
constexpr std::uint32_t kIoctlNumber32 = 54; // on every architecture's 32-bit kind

constexpr std::size_t kLongestCdb = 32; // the driver accepts no longer one
constexpr std::uint32_t kInfoCheck = 1; // SG_INFO_CHECK: status, host status or driver status is not 0

std::string procPath(pid_t process, const std::string& rest) {
    return "/proc/" + std::to_string(process) + rest;
}

// Waits, but no longer than the process of the descriptor lives.
void pause(std::uint32_t milliseconds, int initDescriptor) {
    pollfd init{initDescriptor, POLLIN, 0};
    ::poll(&init, 1, static_cast<int>(milliseconds));
}

// Writes data, sense and the driver's output fields into the program; false when one cannot be written.
bool deliver(pid_t process, const SgRequest& request, ScsiReply& reply) {
    SgOutcome outcome;
    outcome.status = reply.status;
    outcome.maskedStatus = static_cast<std::uint8_t>((reply.status >> 1U) & 0x1fU);
    outcome.senseWritten = reply.senseLength;
    outcome.hostStatus = reply.hostStatus;
    outcome.driverStatus = reply.driverStatus;
    outcome.resid = reply.resid;
    outcome.duration = reply.delayMilliseconds;
    outcome.info = reply.status != 0 || reply.hostStatus != 0 || reply.driverStatus != 0 ? kInfoCheck : 0;

    std::array<iovec, 3> local{};
    std::array<iovec, 3> remote{};
    std::size_t parts = 0;
    ssize_t total = 0;
    const auto add = [&](void* from, RemoteAddress to, std::size_t size) {
        if (size == 0) {
            return;
        }
        local.at(parts) = {from, size};
        remote.at(parts) = {pointerTo(to), size};
        ++parts;
        total += static_cast<ssize_t>(size);
    };
    const bool reads = request.direction == SG_DXFER_FROM_DEV || request.direction == SG_DXFER_TO_FROM_DEV;
    add(reply.data.data(), request.data, reads ? reply.data.size() : 0);
    add(reply.sense.data(), request.sense, request.sense == 0 ? 0 : reply.sense.size());
    add(&outcome, request.outcome, sizeof outcome);
    return process_vm_writev(process, local.data(), parts, remote.data(), parts, 0) == total;
}

} // namespace

FileDescriptor installSgIoFilter() {
    const auto at = [](std::size_t offset) { return static_cast<std::uint32_t>(offset); };
    // Of the 64-bit arguments the low half is read: a request number has 32 bits.
    constexpr std::size_t kLowHalf = std::endian::native == std::endian::big ? 4 : 0;
    std::array<sock_filter, 10> program = {{
        BPF_STMT(BPF_LD | BPF_W | BPF_ABS, at(offsetof(seccomp_data, arch))),
        BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, kOwnArchitecture, 0, 2),
        BPF_STMT(BPF_LD | BPF_W | BPF_ABS, at(offsetof(seccomp_data, nr))),
        BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, SYS_ioctl, 2, 5),
        BPF_STMT(BPF_LD | BPF_W | BPF_ABS, at(offsetof(seccomp_data, nr))),
        BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, kIoctlNumber32, 0, 3),
        BPF_STMT(BPF_LD | BPF_W | BPF_ABS, at(offsetof(seccomp_data, args[1]) + kLowHalf)),
        BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, SG_IO, 0, 1),
        BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_USER_NOTIF),
        BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ALLOW),
    }};
    const sock_fprog filter{static_cast<unsigned short>(program.size()), program.data()};
    return FileDescriptor(static_cast<int>(
        check(::syscall(SYS_seccomp, SECCOMP_SET_MODE_FILTER,
                        SECCOMP_FILTER_FLAG_NEW_LISTENER | SECCOMP_FILTER_FLAG_SPEC_ALLOW, &filter),
              "installing the SG_IO filter")));
}

Supervisor::Supervisor(FileDescriptor listener, pid_t init, const std::vector<Disk>& disks, Record& record)
    : mListener(std::move(listener)), mRecord(record) {
    // One CPU hands over to the other side at once instead of waking a second one.
    ::ioctl(mListener.get(), SECCOMP_IOCTL_NOTIF_SET_FLAGS, SECCOMP_USER_NOTIF_FD_SYNC_WAKE_UP);
    for (const Disk& disk : disks) {
        if (disk.open != Disk::Open::Succeeds) {
            continue;
        }
        for (const std::string& path : disk.nodes) {
            struct stat entry {};
            check(::stat(procPath(init, "/root" + path).c_str(), &entry), path);
            mDevice = entry.st_dev;
            mNodes.try_emplace(entry.st_ino, Node{path, DiskNode(disk)});
        }
    }
}

Supervisor::Node* Supervisor::nodeOf(pid_t process, int descriptor) const {
    struct stat entry {};
    if (::stat(procPath(process, "/fd/" + std::to_string(descriptor)).c_str(), &entry) != 0 ||
        entry.st_dev != mDevice) {
        return nullptr;
    }
    const auto node = mNodes.find(entry.st_ino);
    return node == mNodes.end() ? nullptr : &node->second;
}

// Returns 0 or the error number that the ioctl fails with.
int Supervisor::serve(const seccomp_notif& call, int initDescriptor) {
    const auto process = static_cast<pid_t>(call.pid);
    const bool wide = call.data.arch == kOwnArchitecture;
    Node* node = nodeOf(process, static_cast<int>(call.data.args[0]));
    const auto request = readSgHeader(process, call.data.args[2], wide);
    std::array<std::uint8_t, kLongestCdb> bytes{};
    const std::size_t cdbLength = request ? std::min<std::size_t>(request->cdbLength, bytes.size()) : 0;
    const bool readable =
        request && (cdbLength == 0 || readMemory(process, request->cdb, bytes.data(), cdbLength));
    const std::span<const std::uint8_t> cdb(bytes.data(), cdbLength);
    if (readable) {
        mRecord.sgIo(node == nullptr ? "-" : node->path, *request, cdb);
    }
    if (node == nullptr) {
        return ENOTTY;
    }
    if (!readable) {
        return EFAULT;
    }
    if (request->interfaceId != 'S' || request->scatterCount != 0) {
        return EINVAL;
    }
    if (request->cdbLength > kLongestCdb) {
        return EMSGSIZE;
    }

    ScsiReply reply = node->disk.answer({cdb, request->transferLength, request->senseRoom});
    if (reply.delayMilliseconds != 0) {
        pause(reply.delayMilliseconds, initDescriptor);
    }
    if (reply.errorNumber != 0) {
        return reply.errorNumber;
    }
    return deliver(process, *request, reply) ? 0 : EFAULT;
}

void Supervisor::run(int initDescriptor) {
    std::array<pollfd, 2> sources = {{{mListener.get(), POLLIN, 0}, {initDescriptor, POLLIN, 0}}};
    for (;;) {
        if (::poll(sources.data(), sources.size(), -1) < 0 && errno != EINTR) {
            check(-1, "waiting for the program");
        }
        if (sources[1].revents != 0) {
            return;
        }
        if ((sources[0].revents & POLLIN) == 0) {
            continue;
        }
        seccomp_notif call{};
        if (::ioctl(mListener.get(), SECCOMP_IOCTL_NOTIF_RECV, &call) != 0) {
            continue; // the caller was killed meanwhile
        }
        seccomp_notif_resp response{};
        response.id = call.id;
        response.error = -serve(call, initDescriptor);
        ::ioctl(mListener.get(), SECCOMP_IOCTL_NOTIF_SEND, &response); // fails only if the caller was killed
    }
}

} // namespace simhost
