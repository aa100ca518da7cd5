// A simulated disk's side of one SCSI command.
#pragma once

#include <cstdint>
#include <map>
#include <span>

#include "simhost/description.hpp"

namespace simhost {

// What the SCSI generic driver was asked for.
struct ScsiRequest {
    std::span<const std::uint8_t> cdb;
    std::uint32_t transferLength = 0; // dxfer_len
    std::uint8_t senseRoom = 0;       // mx_sb_len
};

// What it answers.
struct ScsiReply {
    int errorNumber = 0; // the ioctl fails with it and nothing else counts, unless 0
    std::uint32_t delayMilliseconds = 0;
    std::uint8_t status = 0;
    std::uint16_t hostStatus = 0;
    std::uint16_t driverStatus = 0;
    Bytes data;  // no longer than the transfer length
    Bytes sense; // no longer than the sense room
    std::uint8_t senseLength = 0;
    std::int32_t resid = 0;
};

// A node of a disk: the disk's answers, and how often each command has come by this path.
class DiskNode {
public:
    // Keeps a reference to the disk.
    explicit DiskNode(const Disk& disk) : mDisk(&disk) {}

    // Answers the next command.
    ScsiReply answer(const ScsiRequest& request);

private:
    const Fault* faultFor(int command);

    const Disk* mDisk;
    std::map<int, std::uint32_t> mCount; // by command
    std::uint32_t mTotal = 0;
};

} // namespace simhost
