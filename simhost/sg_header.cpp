#include "simhost/sg_header.hpp"

#include <sys/uio.h>

#include <cstddef>
#include <cstring>

namespace simhost {
namespace {

// struct sg_io_hdr of a program whose pointers are `Pointer`.
template <typename Pointer>
struct Header {
    std::int32_t interfaceId = 0;
    std::int32_t direction = 0;
    std::uint8_t cdbLength = 0;
    std::uint8_t senseRoom = 0;
    std::uint16_t scatterCount = 0;
    std::uint32_t transferLength = 0;
    Pointer data = 0;
    Pointer cdb = 0;
    Pointer sense = 0;
    std::uint32_t timeout = 0;
    std::uint32_t flags = 0;
    std::int32_t packetId = 0;
    Pointer user = 0;
    SgOutcome outcome;
};
static_assert(sizeof(SgOutcome) == 20);
static_assert(sizeof(Header<std::uint32_t>) == 64 && offsetof(Header<std::uint32_t>, outcome) == 44);
static_assert(sizeof(Header<std::uint64_t>) == 88 && offsetof(Header<std::uint64_t>, outcome) == 64);

template <typename Pointer>
std::optional<SgRequest> readHeader(pid_t process, RemoteAddress address) {
    Header<Pointer> header{};
    if (!readMemory(process, address, &header, sizeof header)) {
        return std::nullopt;
    }
    SgRequest request;
    request.interfaceId = header.interfaceId;
    request.direction = header.direction;
    request.cdbLength = header.cdbLength;
    request.senseRoom = header.senseRoom;
    request.scatterCount = header.scatterCount;
    request.transferLength = header.transferLength;
    request.timeout = header.timeout;
    request.data = header.data;
    request.cdb = header.cdb;
    request.sense = header.sense;
    request.outcome = address + offsetof(Header<Pointer>, outcome);
    return request;
}

} // namespace

void* pointerTo(RemoteAddress address) {
    void* pointer = nullptr;
    static_assert(sizeof pointer == sizeof address);
    std::memcpy(&pointer, &address, sizeof pointer);
    return pointer;
}

bool readMemory(pid_t process, RemoteAddress from, void* to, std::size_t size) {
    const iovec local{to, size};
    const iovec remote{pointerTo(from), size};
    return process_vm_readv(process, &local, 1, &remote, 1, 0) == static_cast<ssize_t>(size);
}

std::optional<SgRequest> readSgHeader(pid_t process, RemoteAddress address, bool wide) {
    return wide ? readHeader<std::uint64_t>(process, address) : readHeader<std::uint32_t>(process, address);
}

} // namespace simhost
