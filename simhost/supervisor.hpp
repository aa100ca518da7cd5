// Answers the program's SG_IO calls in the place of disks.
//
// Why a seccomp filter with user notification: the program under test must be the one that ships, of either
// word size, and its SG_IO must cost about what a driver's costs.
//  - A real kernel disk would be a loaded module (scsi_debug, a target driver): it changes the host for
//    everybody, needs that module, and cannot give the statuses, senses and errors that tests need.
//  - Character devices in user space (CUSE) need a kernel option that many hosts lack.
//  - Interposing ioctl() with a preloaded library would not meet static programs, depends on which of the C
//    library's symbols a program uses, and must itself be built for each word size and sanitizer.
//  - ptrace stops the program at every system call, not at these alone.
// The filter hands over ioctl calls with request SG_IO and nothing else; all others run at full speed. It
// holds for every process that the program starts, and the kernel drops it with them.
#pragma once

#include <sys/types.h>

#include <unordered_map>
#include <vector>

#include "simhost/disk.hpp"
#include "simhost/file_descriptor.hpp"
#include "simhost/record.hpp"

struct seccomp_notif;

namespace simhost {

// Puts the calling process and its later children under the filter; returns the listener that the supervisor
// reads.
FileDescriptor installSgIoFilter();

class Supervisor {
public:
    // The nodes stand in the file system of process `init`, whose root is the simulated host's. Keeps
    // references to the disks and the record.
    Supervisor(FileDescriptor listener, pid_t init, const std::vector<Disk>& disks, Record& record);

    // Answers until the process of `initDescriptor` (a pidfd) ends.
    void run(int initDescriptor);

private:
    struct Node {
        std::string path;
        DiskNode disk;
    };

    Node* nodeOf(pid_t process, int descriptor) const;
    int serve(const seccomp_notif& call, int initDescriptor);

    FileDescriptor mListener;
    Record& mRecord;
    dev_t mDevice = 0; // the file system that all nodes stand on
    mutable std::unordered_map<ino_t, Node> mNodes;
};

} // namespace simhost
