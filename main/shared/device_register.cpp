#include "main/shared/device_register.hpp"

#include "foundation/clib_memory.hpp"
#include "foundation/log.hpp"
#include "foundation/trace.hpp"

ZebTwoLevelMap<uint32>::Map DevMap;

uint32 EmulexHash(const char* name) {
    constexpr uint32 kSeed = 9000;
    constexpr uint32 kMultiplier = 0x5BE1D995;

    std::size_t left = Clib_strlen(name);
    uint32 h = static_cast<uint32>(left) ^ kSeed;
    const auto* byte = reinterpret_cast<const uint8*>(name);
    for (; left >= 4; left -= 4, byte += 4) {
        uint32 k = byte[0] | static_cast<uint32>(byte[1]) << 8 | static_cast<uint32>(byte[2]) << 16 |
                   static_cast<uint32>(byte[3]) << 24;
        k *= kMultiplier;
        k ^= k >> 24;
        k *= kMultiplier;
        h *= kMultiplier;
        h ^= k;
    }
    switch (left) {
    case 3:
        h ^= static_cast<uint32>(byte[2]) << 16;
        [[fallthrough]];
    case 2:
        h ^= static_cast<uint32>(byte[1]) << 8;
        [[fallthrough]];
    case 1:
        h ^= byte[0];
        h *= kMultiplier;
        break;
    default:
        break;
    }
    h ^= h >> 13;
    h *= kMultiplier;
    h ^= h >> 15;
    return h;
}

void addDeviceNameMap(uint32 type, const ZebString& name) {
    const FunctionTrace trace("addDeviceNameMap");
    const uint32 hash = EmulexHash(name.c_str());
    ZebTwoLevelMap<uint32>::insert(DevMap, hash, name, type);
    reportPrintf("Added to DevMap %u --> %s --> %x\n", hash, name.c_str(), type);
    trace.exit();
}

uint32 getDeviceType(const ZebString& name) {
    const FunctionTrace trace("getDeviceType");
    const uint32 hash = EmulexHash(name.c_str());
    if (ZebTwoLevelMap<uint32>::contains(DevMap, hash, name)) {
        return ZebTwoLevelMap<uint32>::lookup(DevMap, hash, name);
    }
    trace.exit();
    return 0;
}
