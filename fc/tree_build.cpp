#include "fc/tree_build.hpp"

#include <cstdlib>
#include <exception>
#include <list>
#include <map>
#include <vector>

#include "fc/adapter_report.hpp"
#include "fc/unique_lun_id.hpp"
#include "fc/wwn.hpp"
#include "foundation/clib_memory.hpp"
#include "foundation/exceptions.hpp"
#include "foundation/map.hpp"
#include "foundation/trace.hpp"
#include "main/device_register.hpp"
#include "main/run_state.hpp"

namespace {

using AttributesTable = ZebMap<HBA_HANDLE, std::shared_ptr<const HBA_ADAPTERATTRIBUTES>>;
using PortsTable = ZebMap<HBA_HANDLE, std::shared_ptr<const PortAttributes>>;
using BuiltMapping = std::shared_ptr<HBA_FCPTARGETMAPPINGV2>;
using MappingsTable = ZebMap<HBA_HANDLE, BuiltMapping>;

// What the pass has found, by adapter handle, in the order of opening.
std::list<HBA_HANDLE> gAdapterHandles;
AttributesTable::Map gAdapterAttributes;
PortsTable::Map gPortAttributes;
MappingsTable::Map gTargetMappings;
// Mappings that no table holds: the library's own, and built ones without an entry. Kept until exit.
std::vector<std::shared_ptr<const void>> gUnstoredMappings;

timeval wallClock() {
    timeval now = {};
    gettimeofday(&now, nullptr);
    return now;
}

// A zeroed mapping with room for `capacity` entries, and a count of 0, for sBuildTargetMappings. Throws
// NoMemoryEx "No Memory\n".
BuiltMapping allocateBuiltMapping(uint32 capacity) {
    const std::size_t size = mappingBlockSize<HBA_FCPTARGETMAPPINGV2, HBA_FCPSCSIENTRYV2>(capacity);
    void* const block = size != 0 ? std::calloc(1, size) : nullptr;
    if (block == nullptr) {
        TRACE_EXIT("sBuildTargetMappings");
        throw NoMemoryEx("No Memory\n");
    }
    return {static_cast<HBA_FCPTARGETMAPPINGV2*>(block), &std::free};
}

// The device name of a mapped LUN; empty when the host has given it none.
ZebString deviceName(const HBA_FCPSCSIENTRY& entry) {
    return {fieldText(entry.ScsiId.OSDeviceName).c_str()};
}

void logUnassignedName(const HBA_FCPSCSIENTRY& entry) {
    logPrintf("Device Name Unassigned for Lun %d under Target %s ignoring\n",
              static_cast<int32>(entry.ScsiId.ScsiOSLun), WwnText(entry.FcpId.PortWWN).text);
}

// The vendor pass: only logs.
void logVendorData(const HBA_FCPSCSIENTRY& entry) {
    const ZebString name = deviceName(entry);
    if (name.empty()) {
        logUnassignedName(entry);
        return;
    }
    const auto logFailure = [&] {
        logPrintf("Failed in getting the VendorId for device %s Lun %d Under Target %s ignoring\n",
                  name.c_str(), static_cast<int32>(entry.ScsiId.ScsiOSLun),
                  WwnText(entry.FcpId.PortWWN).text);
    };
    try {
        HA_PrintVendorProductId(name);
    } catch (const NotFoundEx&) {
        logFailure();
    } catch (const NotSupportedEx&) {
        logFailure();
    }
}

// The unique LUN identifier of a named LUN, or false when it has none and is left out.
bool readIdentifier(const ZebString& name, ZebString& identifier) {
    uint32 requestFlag = TREE_FC;
    const auto logFailure = [&] {
        logPrintf("Failed in getting the uniqueLunId for device %s ignoring\n", name.c_str());
    };
    try {
        HA_GetScsiUniqueLunId(name, identifier, requestFlag);
        return true;
    } catch (const NotFoundEx&) {
        logFailure();
    } catch (const NotSupportedEx&) {
        logFailure();
    }
    return false;
}

void logPseudoDevice(const ZebString& identifier) {
    if (!gPowerPath.isRunning()) {
        return;
    }
    try {
        const ZebString& pseudoDevice = gPowerPath.getPseudoDevice(identifier);
        logPrintf("Pseudo Device for Unique LunId %s is %s\n", identifier.c_str(), pseudoDevice.c_str());
    } catch (const NotFoundEx&) {
        logPrintf("Lun With UniqueLunId %s is not under PowerPath\n", identifier.c_str());
    }
}

// The identity pass: claims the LUN, identifies it and fills its slot. False when it is left out.
bool identify(const HBA_FCPSCSIENTRY& entry, HBA_FCPSCSIENTRYV2& slot) {
    const ZebString name = deviceName(entry);
    if (name.empty()) {
        logUnassignedName(entry);
        return false;
    }
    addDeviceNameMap(TREE_FC, name);
    ZebString identifier("");
    if (!readIdentifier(name, identifier)) {
        return false;
    }
    logPrintf("UniqueLunid = %s size = %u\n", identifier.c_str(), static_cast<uint32>(identifier.size()));
    logPseudoDevice(identifier);
    slot.ScsiId = entry.ScsiId;
    slot.FcpId = entry.FcpId;
    // One byte short of the field, which is zeroed: the text always ends.
    Clib_strncpy(slot.LUID.buffer, identifier.c_str(), sizeof slot.LUID.buffer - 1);
    return true;
}

BuiltMapping buildTargetMappings(HBA_HANDLE handle) {
    logPrintf("Going to get target mappings\n");
    const std::shared_ptr<const HBA_FCPTARGETMAPPING> source = HA_GetTargetMappings(handle);
    gUnstoredMappings.push_back(source);
    BuiltMapping result = allocateBuiltMapping(source->NumberOfEntries);
    for (uint32 i = 0; i < source->NumberOfEntries; ++i) {
        logVendorData(source->entry[i]);
    }
    for (uint32 i = 0; i < source->NumberOfEntries; ++i) {
        // Slots are filled at the source's index and counted apart, so an entry that is left out before the
        // last leaves an empty slot among the counted ones, and the last one out of them.
        if (identify(source->entry[i], result->entry[i])) {
            ++result->NumberOfEntries;
        }
    }
    if (result->NumberOfEntries != 0) {
        logPrintf("Storing Target Mappings %p\n", static_cast<const void*>(result.get()));
        MappingsTable::insert(gTargetMappings, handle, result);
    } else {
        gUnstoredMappings.push_back(result);
    }
    return result;
}

void releaseAdapter(HBA_HANDLE handle) {
    uint32 portCount = 0;
    logPrintf("Finding and deleting adapter attributes...\n");
    if (AttributesTable::contains(gAdapterAttributes, handle)) {
        portCount = AttributesTable::lookup(gAdapterAttributes, handle)->NumberOfPorts;
        gAdapterAttributes.erase(handle);
    }
    logPrintf("Finding and delete port attributes...\n");
    if (PortsTable::contains(gPortAttributes, handle)) {
        logPrintf("Deleting %u port attributes...\n", portCount);
        gPortAttributes.erase(handle);
    }
    logPrintf("Finding and deleting target mappings...\n");
    if (MappingsTable::contains(gTargetMappings, handle)) {
        logPrintf("Deleting %p\n",
                  static_cast<const void*>(MappingsTable::lookup(gTargetMappings, handle).get()));
        gTargetMappings.erase(handle);
    }
    logPrintf("Going to close adapter...\n");
    HA_CloseAdapter(handle);
}

} // namespace

double elapsedMilliseconds(const timeval& start, const timeval& end) {
    logPrintf("Time values: %.2f, %.2f, %.2f, %.2f\n", static_cast<double>(start.tv_sec),
              static_cast<double>(start.tv_usec), static_cast<double>(end.tv_sec),
              static_cast<double>(end.tv_usec));
    constexpr int64 kMicrosecondsPerSecond = 1000000;
    const int64 microseconds =
        (int64{end.tv_sec} - start.tv_sec) * kMicrosecondsPerSecond + (int64{end.tv_usec} - start.tv_usec);
    return static_cast<double>(microseconds) / 1000.0;
}

std::string expandAdapterName(const char* name) {
    std::string expanded;
    for (const char* position = name; *position != '\0'; ++position) {
        expanded += *position;
        if (*position != '%') {
            continue;
        }
        if (position[1] == '\0') {
            throw WriteFailedEx("String Write failed\n");
        }
        if (position[1] == '%') {
            ++position;
        }
    }
    return expanded;
}

const HBA_ADAPTERATTRIBUTES* sBuildAdapterAttributes(HBA_HANDLE handle) {
    TRACE_ENTRY("sBuildAdapterAttributes");
    logPrintf("Going to get Adapter Attributes\n");
    const std::shared_ptr<const HBA_ADAPTERATTRIBUTES> attributes = HA_GetAdapterAttributes(handle);
    if (attributes) {
        logPrintf("Storing Adapter Attributes\n");
        AttributesTable::insert(gAdapterAttributes, handle, attributes);
    }
    TRACE_EXIT("sBuildAdapterAttributes");
    return attributes.get();
}

const PortAttributes& sBuildPortAttributes(HBA_HANDLE handle, const HBA_ADAPTERATTRIBUTES& adapter) {
    TRACE_ENTRY("sBuildPortAttributes");
    logPrintf("Going to get adapter ports\n");
    const std::shared_ptr<const PortAttributes> ports = HA_GetAdapterPorts(handle, adapter);
    logPrintf("Storing Port Attributes\n");
    PortsTable::insert(gPortAttributes, handle, ports);
    TRACE_EXIT("sBuildPortAttributes");
    return *ports;
}

const HBA_FCPTARGETMAPPINGV2& sBuildTargetMappings(HBA_HANDLE handle) {
    TRACE_ENTRY("sBuildTargetMappings");
    BuiltMapping mapping;
    try {
        mapping = buildTargetMappings(handle);
    } catch (const THbaapiEx&) {
        mapping = allocateBuiltMapping(0);
        gUnstoredMappings.push_back(mapping);
    }
    TRACE_EXIT("sBuildTargetMappings");
    return *mapping;
}

void sBuildAdapterTreeAndOutput(HBA_HANDLE handle) {
    TRACE_ENTRY("sBuildAdapterTreeAndOutput");
    const HBA_ADAPTERATTRIBUTES* const attributes = sBuildAdapterAttributes(handle);
    if (attributes != nullptr) {
        const PortAttributes& ports = sBuildPortAttributes(handle, *attributes);
        const HBA_FCPTARGETMAPPINGV2& mapping = sBuildTargetMappings(handle);
        HA_PrintAdapterTree(*attributes, ports, mapping, gLogStream);
    }
    TRACE_EXIT("sBuildAdapterTreeAndOutput");
}

void sBuildAndOutput() {
    TRACE_ENTRY("sBuildAndOutput");
    const timeval start = wallClock();
    const uint32 count = HA_GetNumberOfAdapters();
    if (count == 0) {
        logPrintf("The system does not have any adapters\n");
        TRACE_EXIT("sBuildAndOutput");
        throw THaltEx("There are no adapters on the system\n");
    }
    // No 32-bit program could hold that many names, whatever the library says.
    constexpr uint32 kMostNames = 0x7FFFFFFF / 16;
    if (count > kMostNames) {
        TRACE_EXIT("sBuildAndOutput");
        throw NoMemoryEx("No Memory\n");
    }
    std::vector<ZebString> names(count);
    HA_GetAdapterNames(count, names);
    logPrintf("Number of adapters: %u\n", count);
    for (uint32 index = 0; index < count; ++index) {
        logPrintf("Going to open Adapter #%u - '%s'\n", index, names[index].c_str());
        std::string name = expandAdapterName(names[index].c_str());
        try {
            const HBA_HANDLE handle = HA_OpenAdapter(name.data());
            logPrintf("Storing Adapter Handle\n");
            gAdapterHandles.push_back(handle);
            sBuildAdapterTreeAndOutput(handle);
        } catch (const std::exception&) {
            logPrintf("Exception occured while opening adapter: %s\n", name.c_str());
        }
    }
    const timeval end = wallClock();
    logPrintf("Time taken to build tree: %.2f milliseconds\n", elapsedMilliseconds(start, end));
    TRACE_EXIT("sBuildAndOutput");
}

void sFirstBuildAndOutput() {
    TRACE_ENTRY("sFirstBuildAndOutput");
    const timeval start = wallClock();
    HA_LoadHbaapi();
    const timeval end = wallClock();
    logPrintf("Time taken to load HBAAPI: %.2f milliseconds\n", elapsedMilliseconds(start, end));
    sBuildAndOutput();
    TRACE_EXIT("sFirstBuildAndOutput");
}

void cleanUpFcTree() {
    for (const HBA_HANDLE handle : gAdapterHandles) {
        releaseAdapter(handle);
    }
    gAdapterHandles.clear();
    gAdapterAttributes.clear();
    gPortAttributes.clear();
    gTargetMappings.clear();
    logPrintf("Going to free library\n");
    HA_FreeHbaapi();
}
