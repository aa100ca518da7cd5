#include "simhost/disk.hpp"

#include <algorithm>

namespace simhost {
namespace {

constexpr std::uint8_t kCheckCondition = 0x02;
constexpr std::uint16_t kDriverSense = 0x08;

// Fixed-format sense: ILLEGAL REQUEST with this additional sense code, qualifier 0.
Bytes illegalRequest(char additionalSenseCode) {
    return {0x70, 0, 5, 0, 0, 0, 0, 10, 0, 0, 0, 0, additionalSenseCode, 0, 0, 0, 0, 0};
}
constexpr char kInvalidOperationCode = 0x20;
constexpr char kInvalidFieldInCdb = 0x24;

constexpr std::uint8_t kInquiry = 0x12;

bool isInquiry(const ScsiRequest& request) {
    return request.cdb.size() >= 6 && request.cdb[0] == kInquiry;
}

// The command as descriptions name it.
int commandOf(const ScsiRequest& request) {
    if (!isInquiry(request)) {
        return kOtherCommand;
    }
    const bool vitalProductData = (request.cdb[1] & 1U) != 0;
    if (vitalProductData) {
        return request.cdb[2];
    }
    return request.cdb[2] == 0 ? kStandardInquiry : kOtherCommand; // a page code needs EVPD
}

std::size_t allocationLength(const ScsiRequest& request) {
    return isInquiry(request) ? request.cdb[3] * 256U + request.cdb[4] : 0;
}

} // namespace

const Fault* DiskNode::faultFor(int command) {
    ++mTotal;
    const std::uint32_t count = ++mCount[command];
    for (const Fault& fault : mDisk->faults) {
        if (fault.command && *fault.command != command) {
            continue;
        }
        const std::uint32_t number = fault.command ? count : mTotal;
        if (number >= fault.first && number <= fault.last) {
            return &fault;
        }
    }
    return nullptr;
}

ScsiReply DiskNode::answer(const ScsiRequest& request) {
    const int command = commandOf(request);
    const Fault* fault = faultFor(command);
    ScsiReply reply;
    if (fault != nullptr) {
        reply.errorNumber = fault->errorNumber;
        reply.delayMilliseconds = fault->delayMilliseconds;
    }
    if (fault != nullptr && fault->failed) {
        reply.status = fault->status;
        reply.hostStatus = fault->hostStatus;
        reply.driverStatus = fault->driverStatus;
        reply.sense = fault->sense;
    } else if (const auto described = mDisk->answers.find(command); described != mDisk->answers.end()) {
        reply.data = described->second;
    } else if (fault == nullptr || !fault->data) {
        reply.status = kCheckCondition;
        reply.driverStatus = kDriverSense;
        reply.sense = illegalRequest(isInquiry(request) ? kInvalidFieldInCdb : kInvalidOperationCode);
    }
    if (fault != nullptr && fault->data) {
        reply.data = *fault->data;
    }

    if (!mDisk->ignoresAllocationLength) {
        reply.data.resize(std::min(reply.data.size(), allocationLength(request)));
    }
    reply.data.resize(std::min<std::size_t>(reply.data.size(), request.transferLength));
    reply.sense.resize(std::min<std::size_t>(reply.sense.size(), request.senseRoom));
    reply.senseLength = static_cast<std::uint8_t>(reply.sense.size());
    reply.resid = static_cast<std::int32_t>(request.transferLength - reply.data.size());
    if (fault != nullptr && fault->senseLength) {
        reply.senseLength = *fault->senseLength;
    }
    if (fault != nullptr && fault->resid) {
        reply.resid = *fault->resid;
    }
    return reply;
}

} // namespace simhost
