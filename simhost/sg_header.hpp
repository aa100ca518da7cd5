// The request header of the SCSI generic driver (scsi/sg.h), read from and answered into another process,
// which may have the other word size.
#pragma once

#include <sys/types.h>

#include <cstdint>
#include <optional>

namespace simhost {

// A pointer of the program under test.
using RemoteAddress = std::uint64_t;

// The address as process_vm_readv and process_vm_writev take it; nothing here is at it.
void* pointerTo(RemoteAddress address);

// What the program fills in, the fields that matter to a simulated disk.
struct SgRequest {
    std::int32_t interfaceId = 0;
    std::int32_t direction = 0;
    std::uint8_t cdbLength = 0;
    std::uint8_t senseRoom = 0;
    std::uint16_t scatterCount = 0;
    std::uint32_t transferLength = 0;
    std::uint32_t timeout = 0; // milliseconds
    RemoteAddress data = 0;
    RemoteAddress cdb = 0;
    RemoteAddress sense = 0;
    RemoteAddress outcome = 0; // where the driver's output fields begin
};

// The driver's output fields: the same for both word sizes, at the end of the header.
struct SgOutcome {
    std::uint8_t status = 0;
    std::uint8_t maskedStatus = 0;
    std::uint8_t messageStatus = 0;
    std::uint8_t senseWritten = 0;
    std::uint16_t hostStatus = 0;
    std::uint16_t driverStatus = 0;
    std::int32_t resid = 0;
    std::uint32_t duration = 0; // milliseconds
    std::uint32_t info = 0;
};

// Copies `size` bytes of the process's memory to `to`; false when they cannot be read.
bool readMemory(pid_t process, RemoteAddress from, void* to, std::size_t size);

// Reads the header at `address`; none when it cannot be read. `wide` says that the caller's pointers have 64
// bits.
std::optional<SgRequest> readSgHeader(pid_t process, RemoteAddress address, bool wide);

} // namespace simhost
