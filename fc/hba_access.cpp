#include "fc/hba_access.hpp"

#include <algorithm>
#include <cstring>
#include <new>
#include <string>

#include "fc/hba_status.hpp"
#include "foundation/exceptions.hpp"
#include "foundation/trace.hpp"

namespace {

constexpr std::size_t kAdapterNameSize = 256;

// Logs nothing: `message` is the exception's.
[[noreturn]] void leaveWithHbaapiEx(const char* caller, const char* message) {
    TRACE_EXIT(caller);
    throw THbaapiEx(message);
}

[[noreturn]] void leaveWithHaltEx(const char* caller, const char* logLine, const char* message) {
    logPrintf("%s", logLine);
    TRACE_EXIT(caller);
    throw THaltEx(message);
}

// A zeroed block of `size` bytes; null when there is no memory, and for size 0.
MappingBlock<HBA_FCPTARGETMAPPING> allocateMapping(std::size_t size) {
    void* const block = size != 0 ? std::calloc(1, size) : nullptr;
    return {static_cast<HBA_FCPTARGETMAPPING*>(block), &std::free};
}

// The mapping as it is handed out: a count above what the block has `room` for is cut to it.
MappingBlock<HBA_FCPTARGETMAPPING> withinBlock(MappingBlock<HBA_FCPTARGETMAPPING> mapping, uint32 room) {
    mapping->NumberOfEntries = std::min(mapping->NumberOfEntries, room);
    return mapping;
}

// How many of the library's entries fit into a block that was made for `count` of the longer built ones. The
// records' sizes are those of the 64-bit header, whose ratio is the smaller: both builds take in as many.
uint32 roomForCount(uint32 count) {
    constexpr uint64 kEntrySize = 304;
    constexpr uint64 kBuiltEntrySize = 560;
    static_assert(sizeof(HBA_FCPSCSIENTRYV2) * kEntrySize >= kBuiltEntrySize * sizeof(HBA_FCPSCSIENTRY));
    return static_cast<uint32>(count * kBuiltEntrySize / kEntrySize);
}

} // namespace

PortAttributes::PortAttributes(uint32 count) : mCount(count) {
    // Pointers count as the 32-bit program's, for the same line between possible and not in both builds.
    constexpr uint32 kMostPointers = 0x7FFFFFFF / 4;
    if (count <= kMostPointers) {
        mpRecords = new (std::nothrow) HBA_PORTATTRIBUTES*[count];
    }
}

PortAttributes::~PortAttributes() {
    for (uint32 i = 0; i < mMade; ++i) {
        delete mpRecords[i];
    }
    delete[] mpRecords;
}

bool PortAttributes::allocateRecords() {
    constexpr uint32 kMostRecords = 0x7FFFFFFF / sizeof(HBA_PORTATTRIBUTES);
    if (mCount > kMostRecords) {
        return false;
    }
    for (; mMade < mCount; ++mMade) {
        mpRecords[mMade] = new (std::nothrow) HBA_PORTATTRIBUTES();
        if (mpRecords[mMade] == nullptr) {
            return false;
        }
    }
    return true;
}

void HA_LoadHbaapi() {
    TRACE_ENTRY("HA_LoadHbaapi");
    logPrintf("Going to open HBAAPI library\n");
    const HBA_STATUS status = HBA_LoadLibrary();
    if (status != HBA_STATUS_OK) {
        logPrintf("Failed to load HBAAPI library : %s\n", hbaStatusName(status));
        leaveWithHbaapiEx("HA_LoadHbaapi", "HBA_LoadLibrary failed");
    }
    TRACE_EXIT("HA_LoadHbaapi");
}

void HA_FreeHbaapi() {
    TRACE_ENTRY("HA_FreeHbaapi");
    logPrintf("Going to free the HBAAPI library\n");
    static_cast<void>(HBA_FreeLibrary());
    logPrintf("Freed HBAAPI library\n");
    TRACE_EXIT("HA_FreeHbaapi");
}

uint32 HA_GetNumberOfAdapters() {
    TRACE_ENTRY("HA_GetNumberOfAdapters");
    const uint32 count = HBA_GetNumberOfAdapters();
    TRACE_EXIT("HA_GetNumberOfAdapters");
    return count;
}

void HA_GetAdapterNames(uint32 count, std::vector<ZebString>& names) {
    TRACE_ENTRY("HA_GetAdapterNames");
    for (uint32 index = 0; index < count; ++index) {
        char name[kAdapterNameSize + 1] = {}; // ends even a name that fills its field
        logPrintf("Going to get adapter name, # = <%d>\n", static_cast<int32>(index));
        const HBA_STATUS status = HBA_GetAdapterName(index, name);
        if (status != HBA_STATUS_OK) {
            logPrintf("Failed to get adapter #%d name - %s\n", static_cast<int32>(index),
                      hbaStatusName(status));
            leaveWithHbaapiEx("HA_GetAdapterNames", "HBA_GetAdapterName method failed\n");
        }
        name[kAdapterNameSize] = '\0';
        logPrintf("Adapter name: %s\n", name);
        names[index] = name;
    }
    TRACE_EXIT("HA_GetAdapterNames");
}

HBA_HANDLE HA_OpenAdapter(char* name) {
    TRACE_ENTRY("HA_OpenAdapter");
    logPrintf("Going to open adapter, adapter name = <%s>\n", name);
    const HBA_HANDLE handle = HBA_OpenAdapter(name);
    if (handle == 0) {
        logPrintf("Failed to open adapter, adapter name = <%s>\n", name);
        leaveWithHbaapiEx("HA_OpenAdapter", "HBA_OpenAdapter method failed\n");
    }
    TRACE_EXIT("HA_OpenAdapter");
    return handle;
}

void HA_CloseAdapter(HBA_HANDLE handle) {
    TRACE_ENTRY("HA_CloseAdapter");
    logPrintf("Going to close adapter...\n");
    HBA_CloseAdapter(handle);
    logPrintf("Closed adapter\n");
    TRACE_EXIT("HA_CloseAdapter");
}

std::unique_ptr<HBA_ADAPTERATTRIBUTES> HA_GetAdapterAttributes(HBA_HANDLE handle) {
    TRACE_ENTRY("HA_GetAdapterAttributes");
    std::unique_ptr<HBA_ADAPTERATTRIBUTES> attributes(new (std::nothrow) HBA_ADAPTERATTRIBUTES());
    if (!attributes) {
        leaveWithHaltEx("HA_GetAdapterAttributes", "Failed to allocate adapter attributes\n",
                        "No memory for adapter attributes\n");
    }
    logPrintf("Going to get adapter attributes\n");
    const HBA_STATUS status = HBA_GetAdapterAttributes(handle, attributes.get());
    if (status == HBA_STATUS_ERROR_NOT_SUPPORTED) {
        logPrintf("Encountered non-supported Adapter - %s\n", hbaStatusName(status));
        TRACE_EXIT("HA_GetAdapterAttributes");
        return nullptr;
    }
    if (status != HBA_STATUS_OK) {
        logPrintf("Failed to get adapter attributes - %s\n", hbaStatusName(status));
        leaveWithHbaapiEx("HA_GetAdapterAttributes", "HBA_GetAdapterAttributes method failed\n");
    }
    if (attributes->NumberOfPorts == 0) {
        leaveWithHaltEx("HA_GetAdapterAttributes", "No ports on the adapter\n",
                        "ZERO Ports on the Adapter\n");
    }
    logPrintf("Adapter info: Manufacturer %.64s Model %.256s NumPorts=%d\n", attributes->Manufacturer,
              attributes->Model, static_cast<int32>(attributes->NumberOfPorts));
    TRACE_EXIT("HA_GetAdapterAttributes");
    return attributes;
}

std::unique_ptr<PortAttributes> HA_GetAdapterPorts(HBA_HANDLE handle, const HBA_ADAPTERATTRIBUTES& adapter) {
    TRACE_ENTRY("HA_GetAdapterPorts");
    std::unique_ptr<PortAttributes> ports(new (std::nothrow) PortAttributes(adapter.NumberOfPorts));
    if (!ports || !ports->hasRoom()) {
        leaveWithHaltEx("HA_GetAdapterPorts", "Failed to allocate port attributes ptr array\n",
                        "No memory for Port Attributes\n");
    }
    if (!ports->allocateRecords()) {
        leaveWithHaltEx("HA_GetAdapterPorts", "Failed to allocate port attributes\n",
                        "No memory for Port Attributes\n");
    }
    for (uint32 index = 0; index < ports->count(); ++index) {
        logPrintf("Going to get port attributes\n");
        const HBA_STATUS status = HBA_GetAdapterPortAttributes(handle, index, &(*ports)[index]);
        if (status != HBA_STATUS_OK) {
            logPrintf("Failed to get port attributes - %s\n", hbaStatusName(status));
            leaveWithHbaapiEx("HA_GetAdapterPorts", "HBA_GetAdapterPortAttributes method failed\n");
        }
    }
    TRACE_EXIT("HA_GetAdapterPorts");
    return ports;
}

MappingBlock<HBA_FCPTARGETMAPPING> HA_GetTargetMappings(HBA_HANDLE handle) {
    TRACE_ENTRY("HA_GetTargetMappings");
    logPrintf("Allocating memory for single target mapping\n");
    uint32 room = 1;
    auto mapping = allocateMapping(mappingBlockSize<HBA_FCPTARGETMAPPING, HBA_FCPSCSIENTRY>(room));
    if (!mapping) {
        leaveWithHaltEx("HA_GetTargetMappings", "Failed to allocate memory for target mappings\n",
                        "No memory for target mapping\n");
    }
    mapping->NumberOfEntries = 1;
    logPrintf("Going to invoke HBA_GetFcpTargetMapping to get target mappings\n");
    HBA_STATUS status = HBA_GetFcpTargetMapping(handle, mapping.get());
    const uint32 count = mapping->NumberOfEntries;
    logPrintf("The status of get fcp target mapping: %u\n", status);
    logPrintf("The number of targets is %u\n", count);
    if (status != HBA_STATUS_OK && status != HBA_STATUS_ERROR_MORE_DATA) {
        logPrintf("Failed to get target mappings - %s\n", hbaStatusName(status));
        leaveWithHbaapiEx("HA_GetTargetMappings", "HBA_GetFcpTargetMapping method failed\n");
    }
    if (status == HBA_STATUS_ERROR_MORE_DATA && count > 1) {
        mapping.reset();
        logPrintf("Allocating memory for multiple target mapping\n");
        // Room for the longer entries of the built mapping, though the library fills the shorter ones.
        room = roomForCount(count);
        mapping = allocateMapping(mappingBlockSize<HBA_FCPTARGETMAPPING, HBA_FCPSCSIENTRYV2>(count));
        if (!mapping) {
            leaveWithHaltEx("HA_GetTargetMappings", "Failed to allocate target mappings\n",
                            "No memory for target mappings\n");
        }
        mapping->NumberOfEntries = count;
        logPrintf("Invoking HBA_GetFcpTargetMapping to get <%d> target mappings\n",
                  static_cast<int32>(count));
        status = HBA_GetFcpTargetMapping(handle, mapping.get());
        logPrintf("The status of get fcp target mapping: %u\n", status);
        if (status != HBA_STATUS_OK) {
            logPrintf("Failed to get <%d> target mappings - %s\n", static_cast<int32>(count),
                      hbaStatusName(status));
            leaveWithHbaapiEx("HA_GetTargetMappings", "HBA_GetFcpTargetMapping method failed\n");
        }
    }
    TRACE_EXIT("HA_GetTargetMappings");
    return withinBlock(std::move(mapping), room);
}
