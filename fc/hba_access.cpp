#include "fc/hba_access.hpp"

#include <algorithm>
#include <cstring>
#include <new>
#include <string>

#include "fc/hba_status.hpp"
#include "foundation/exceptions.hpp"
#include "foundation/log.hpp"
#include "foundation/trace.hpp"

namespace {

constexpr std::size_t kAdapterNameSize = 256;

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
        mRecords = new (std::nothrow) HBA_PORTATTRIBUTES*[count];
    }
}

PortAttributes::~PortAttributes() {
    for (uint32 i = 0; i < mMade; ++i) {
        delete mRecords[i];
    }
    delete[] mRecords;
}

bool PortAttributes::allocateRecords() {
    constexpr uint32 kMostRecords = 0x7FFFFFFF / sizeof(HBA_PORTATTRIBUTES);
    if (mCount > kMostRecords) {
        return false;
    }
    for (; mMade < mCount; ++mMade) {
        mRecords[mMade] = new (std::nothrow) HBA_PORTATTRIBUTES();
        if (mRecords[mMade] == nullptr) {
            return false;
        }
    }
    return true;
}

void HA_LoadHbaapi() {
    const FunctionTrace trace("HA_LoadHbaapi");
    logPrintf("Going to open HBAAPI library\n");
    flushLog();
    const HBA_STATUS status = HBA_LoadLibrary();
    if (status != HBA_STATUS_OK) {
        logPrintf("Failed to load HBAAPI library : %s\n", hbaStatusName(status));
        trace.fail<THbaapiEx>("HBA_LoadLibrary failed");
    }
    trace.exit();
}

void HA_FreeHbaapi() {
    const FunctionTrace trace("HA_FreeHbaapi");
    logPrintf("Going to free the HBAAPI library\n");
    flushLog();
    static_cast<void>(HBA_FreeLibrary());
    logPrintf("Freed HBAAPI library\n");
    trace.exit();
}

uint32 HA_GetNumberOfAdapters() {
    const FunctionTrace trace("HA_GetNumberOfAdapters");
    flushLog();
    const uint32 count = HBA_GetNumberOfAdapters();
    trace.exit();
    return count;
}

void HA_GetAdapterNames(uint32 count, std::vector<ZebString>& names) {
    const FunctionTrace trace("HA_GetAdapterNames");
    for (uint32 index = 0; index < count; ++index) {
        char name[kAdapterNameSize + 1] = {}; // ends even a name that fills its field
        logPrintf("Going to get adapter name, # = <%d>\n", static_cast<int32>(index));
        flushLog();
        const HBA_STATUS status = HBA_GetAdapterName(index, name);
        if (status != HBA_STATUS_OK) {
            logPrintf("Failed to get adapter #%d name - %s\n", static_cast<int32>(index),
                      hbaStatusName(status));
            trace.fail<THbaapiEx>("HBA_GetAdapterName method failed\n");
        }
        name[kAdapterNameSize] = '\0';
        logPrintf("Adapter name: %s\n", name);
        names[index] = name;
    }
    trace.exit();
}

HBA_HANDLE HA_OpenAdapter(char* name) {
    const FunctionTrace trace("HA_OpenAdapter");
    logPrintf("Going to open adapter, adapter name = <%s>\n", name);
    flushLog();
    const HBA_HANDLE handle = HBA_OpenAdapter(name);
    if (handle == 0) {
        logPrintf("Failed to open adapter, adapter name = <%s>\n", name);
        trace.fail<THbaapiEx>("HBA_OpenAdapter method failed\n");
    }
    trace.exit();
    return handle;
}

void HA_CloseAdapter(HBA_HANDLE handle) {
    const FunctionTrace trace("HA_CloseAdapter");
    logPrintf("Going to close adapter...\n");
    flushLog();
    HBA_CloseAdapter(handle);
    logPrintf("Closed adapter\n");
    trace.exit();
}

std::unique_ptr<HBA_ADAPTERATTRIBUTES> HA_GetAdapterAttributes(HBA_HANDLE handle) {
    const FunctionTrace trace("HA_GetAdapterAttributes");
    std::unique_ptr<HBA_ADAPTERATTRIBUTES> attributes(new (std::nothrow) HBA_ADAPTERATTRIBUTES());
    if (!attributes) {
        trace.logAndFail<THaltEx>("Failed to allocate adapter attributes\n",
                                  "No memory for adapter attributes\n");
    }
    logPrintf("Going to get adapter attributes\n");
    flushLog();
    const HBA_STATUS status = HBA_GetAdapterAttributes(handle, attributes.get());
    if (status == HBA_STATUS_ERROR_NOT_SUPPORTED) {
        logPrintf("Encountered non-supported Adapter - %s\n", hbaStatusName(status));
        trace.exit();
        return nullptr;
    }
    if (status != HBA_STATUS_OK) {
        logPrintf("Failed to get adapter attributes - %s\n", hbaStatusName(status));
        trace.fail<THbaapiEx>("HBA_GetAdapterAttributes method failed\n");
    }
    if (attributes->NumberOfPorts == 0) {
        trace.logAndFail<THaltEx>("No ports on the adapter\n", "ZERO Ports on the Adapter\n");
    }
    logPrintf("Adapter info: Manufacturer %.64s Model %.256s NumPorts=%d\n", attributes->Manufacturer,
              attributes->Model, static_cast<int32>(attributes->NumberOfPorts));
    trace.exit();
    return attributes;
}

std::unique_ptr<PortAttributes> HA_GetAdapterPorts(HBA_HANDLE handle, const HBA_ADAPTERATTRIBUTES& adapter) {
    const FunctionTrace trace("HA_GetAdapterPorts");
    std::unique_ptr<PortAttributes> ports(new (std::nothrow) PortAttributes(adapter.NumberOfPorts));
    if (!ports || !ports->hasRoom()) {
        trace.logAndFail<THaltEx>("Failed to allocate port attributes ptr array\n",
                                  "No memory for Port Attributes\n");
    }
    if (!ports->allocateRecords()) {
        trace.logAndFail<THaltEx>("Failed to allocate port attributes\n", "No memory for Port Attributes\n");
    }
    for (uint32 index = 0; index < ports->count(); ++index) {
        logPrintf("Going to get port attributes\n");
        flushLog();
        const HBA_STATUS status = HBA_GetAdapterPortAttributes(handle, index, &(*ports)[index]);
        if (status != HBA_STATUS_OK) {
            logPrintf("Failed to get port attributes - %s\n", hbaStatusName(status));
            trace.fail<THbaapiEx>("HBA_GetAdapterPortAttributes method failed\n");
        }
    }
    trace.exit();
    return ports;
}

MappingBlock<HBA_FCPTARGETMAPPING> HA_GetTargetMappings(HBA_HANDLE handle) {
    const FunctionTrace trace("HA_GetTargetMappings");
    logPrintf("Allocating memory for single target mapping\n");
    uint32 room = 1;
    auto mapping = allocateMapping(mappingBlockSize<HBA_FCPTARGETMAPPING, HBA_FCPSCSIENTRY>(room));
    if (!mapping) {
        trace.logAndFail<THaltEx>("Failed to allocate memory for target mappings\n",
                                  "No memory for target mapping\n");
    }
    mapping->NumberOfEntries = 1;
    logPrintf("Going to invoke HBA_GetFcpTargetMapping to get target mappings\n");
    flushLog();
    HBA_STATUS status = HBA_GetFcpTargetMapping(handle, mapping.get());
    const uint32 count = mapping->NumberOfEntries;
    logPrintf("The status of get fcp target mapping: %u\n", status);
    logPrintf("The number of targets is %u\n", count);
    if (status != HBA_STATUS_OK && status != HBA_STATUS_ERROR_MORE_DATA) {
        logPrintf("Failed to get target mappings - %s\n", hbaStatusName(status));
        trace.fail<THbaapiEx>("HBA_GetFcpTargetMapping method failed\n");
    }
    if (status == HBA_STATUS_ERROR_MORE_DATA && count > 1) {
        mapping.reset();
        logPrintf("Allocating memory for multiple target mapping\n");
        // Room for the longer entries of the built mapping, though the library fills the shorter ones.
        room = roomForCount(count);
        mapping = allocateMapping(mappingBlockSize<HBA_FCPTARGETMAPPING, HBA_FCPSCSIENTRYV2>(count));
        if (!mapping) {
            trace.logAndFail<THaltEx>("Failed to allocate target mappings\n",
                                      "No memory for target mappings\n");
        }
        mapping->NumberOfEntries = count;
        logPrintf("Invoking HBA_GetFcpTargetMapping to get <%d> target mappings\n",
                  static_cast<int32>(count));
        flushLog();
        status = HBA_GetFcpTargetMapping(handle, mapping.get());
        logPrintf("The status of get fcp target mapping: %u\n", status);
        if (status != HBA_STATUS_OK) {
            logPrintf("Failed to get <%d> target mappings - %s\n", static_cast<int32>(count),
                      hbaStatusName(status));
            trace.fail<THbaapiEx>("HBA_GetFcpTargetMapping method failed\n");
        }
    }
    trace.exit();
    return withinBlock(std::move(mapping), room);
}
