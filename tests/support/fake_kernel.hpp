// The kernel's side of SCSI commands, for code that opens device nodes and sends SG_IO to them. The program's
// own open, close, ioctl and ftime are replaced when it is linked, so the code under test is what ships.
#pragma once

#include <deque>
#include <functional>
#include <set>
#include <string>
#include <vector>

#include "foundation/integers.hpp"

using Bytes = std::vector<uint8>;

// What one command meets.
struct SgAnswer {
    Bytes data; // what the device has to say, of which it sends as much as the CDB's allocation length allows
    int ioctlError = 0; // the driver refuses the command with this errno
    uint8 status = 0;
    uint16 hostStatus = 0;
    uint16 driverStatus = 0;
    Bytes sense;
    int elapsedMs = 0;
    bool overruns = false; // the device sends all it has, as far as the buffer takes it
};

// A command as the driver got it.
struct SgCommand {
    int fd;
    unsigned long request; // of the ioctl
    Bytes cdb;
    int direction;
    uint32 transferLength;
    uint32 timeout;
};

struct OpenCall {
    std::string path;
    int flags;
    unsigned mode;
};

// Stands in for the kernel while it lives, one at a time.
class FakeKernel {
public:
    FakeKernel();
    FakeKernel(const FakeKernel&) = delete;
    FakeKernel& operator=(const FakeKernel&) = delete;
    ~FakeKernel(); // expects that every answer was asked for and no descriptor closed twice

    static constexpr int kFirstFd = 1000; // of the first node opened; they count up

    // Set before the code under test runs.
    std::deque<SgAnswer> answers; // one a command
    int openError = 0;            // every open fails with this errno
    int closeError = 0;           // every close fails with this errno, though the descriptor is gone
    long long clockMs = 1'000'000;
    std::function<void()> beforeCommand; // called before a command is sent; the one call here that may throw

    // What it did.
    std::vector<SgCommand> commands;
    std::vector<OpenCall> opens;
    std::set<int> openDescriptors;
    int closes = 0;
    int closesOfNothing = 0;
    int timesAsked = 0;     // once before and once after every command
    int unclearedTimes = 0; // time stamps that were not zeroed before they were asked for
};
