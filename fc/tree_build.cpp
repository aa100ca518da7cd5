#include "fc/tree_build.hpp"

#include <algorithm>
#include <cstdlib>
#include <exception>
#include <list>
#include <memory>
#include <utility>
#include <vector>

#include "fc/adapter_report.hpp"
#include "fc/identity/unique_lun_id.hpp"
#include "fc/wwn.hpp"
#include "foundation/clib_memory.hpp"
#include "foundation/exceptions.hpp"
#include "foundation/log.hpp"
#include "foundation/trace.hpp"
#include "main/shared/device_register.hpp"
#include "main/shared/progress.hpp"
#include "main/shared/run_state.hpp"

namespace {

using BuiltMapping = MappingBlock<HBA_FCPTARGETMAPPINGV2>;

// An adapter from its opening to the clean-up, and what has been found of it.
struct OpenAdapter {
    explicit OpenAdapter(HBA_HANDLE opened) : handle(opened) {}

    HBA_HANDLE handle;
    std::unique_ptr<HBA_ADAPTERATTRIBUTES> attributes; // null as well for one that is not supported
    std::unique_ptr<PortAttributes> ports;
    BuiltMapping mapping{nullptr, &std::free};
};

std::list<OpenAdapter> gOpenAdapters; // in the order of opening

// The record of `handle`: of the first adapter, should the library have given several the same handle.
OpenAdapter& openAdapter(HBA_HANDLE handle) {
    const auto found = std::find_if(gOpenAdapters.begin(), gOpenAdapters.end(),
                                    [&](const OpenAdapter& adapter) { return adapter.handle == handle; });
    return found != gOpenAdapters.end() ? *found : gOpenAdapters.emplace_back(handle);
}

// Keeps `found` in its place of a record. Throws ExistsEx when another adapter of the same handle was first.
template <typename Owner>
void store(Owner& place, Owner found) {
    if (place != nullptr) {
        logPrintf("Element already existed in the map\n");
        throw ExistsEx("Element already exists in map.. can't insert\n");
    }
    place = std::move(found);
}

timeval wallClock() {
    timeval now = {};
    gettimeofday(&now, nullptr);
    return now;
}

// A zeroed mapping with room for `capacity` entries, and a count of 0, for the function that `trace` is of.
// Throws NoMemoryEx "No Memory\n".
BuiltMapping allocateBuiltMapping(uint32 capacity, const FunctionTrace& trace) {
    const std::size_t size = mappingBlockSize<HBA_FCPTARGETMAPPINGV2, HBA_FCPSCSIENTRYV2>(capacity);
    void* const block = size != 0 ? std::calloc(1, size) : nullptr;
    if (block == nullptr) {
        trace.fail<NoMemoryEx>("No Memory\n");
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

// The adapter's mapping with every LUN identified. Throws THbaapiEx when the library does not give it.
BuiltMapping buildTargetMappings(HBA_HANDLE handle, const FunctionTrace& trace) {
    logPrintf("Going to get target mappings\n");
    const MappingBlock<HBA_FCPTARGETMAPPING> source = HA_GetTargetMappings(handle);
    BuiltMapping result = allocateBuiltMapping(source->NumberOfEntries, trace);
    const uint32 count = source->NumberOfEntries;
    for (uint32 i = 0; i < count; ++i) {
        showProgress("FC vendors", source->entry[i].ScsiId.OSDeviceName, i + 1, count);
        logVendorData(source->entry[i]);
    }
    for (uint32 i = 0; i < count; ++i) {
        showProgress("FC", source->entry[i].ScsiId.OSDeviceName, i + 1, count);
        // Slots are filled at the source's index and counted apart, so an entry that is left out before the
        // last leaves an empty slot among the counted ones, and the last one out of them.
        if (identify(source->entry[i], result->entry[i])) {
            ++result->NumberOfEntries;
        }
    }
    if (result->NumberOfEntries != 0) {
        logPrintf("Storing Target Mappings %p\n", static_cast<const void*>(result.get()));
    }
    return result;
}

void releaseAdapter(const OpenAdapter& adapter) {
    logPrintf("Finding and deleting adapter attributes...\n");
    logPrintf("Finding and delete port attributes...\n");
    if (adapter.ports != nullptr) {
        logPrintf("Deleting %u port attributes...\n", adapter.ports->count());
    }
    logPrintf("Finding and deleting target mappings...\n");
    if (adapter.mapping != nullptr && adapter.mapping->NumberOfEntries != 0) {
        logPrintf("Deleting %p\n", static_cast<const void*>(adapter.mapping.get()));
    }
    logPrintf("Going to close adapter...\n");
    HA_CloseAdapter(adapter.handle);
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
    const FunctionTrace trace("sBuildAdapterAttributes");
    logPrintf("Going to get Adapter Attributes\n");
    std::unique_ptr<HBA_ADAPTERATTRIBUTES> attributes = HA_GetAdapterAttributes(handle);
    if (attributes == nullptr) {
        trace.exit();
        return nullptr;
    }
    logPrintf("Storing Adapter Attributes\n");
    auto& place = openAdapter(handle).attributes;
    store(place, std::move(attributes));
    trace.exit();
    return place.get();
}

const PortAttributes& sBuildPortAttributes(HBA_HANDLE handle, const HBA_ADAPTERATTRIBUTES& adapter) {
    const FunctionTrace trace("sBuildPortAttributes");
    logPrintf("Going to get adapter ports\n");
    std::unique_ptr<PortAttributes> ports = HA_GetAdapterPorts(handle, adapter);
    logPrintf("Storing Port Attributes\n");
    auto& place = openAdapter(handle).ports;
    store(place, std::move(ports));
    trace.exit();
    return *place;
}

const HBA_FCPTARGETMAPPINGV2& sBuildTargetMappings(HBA_HANDLE handle) {
    const FunctionTrace trace("sBuildTargetMappings");
    BuiltMapping& mapping = openAdapter(handle).mapping;
    try {
        mapping = buildTargetMappings(handle, trace);
    } catch (const THbaapiEx&) {
        mapping = allocateBuiltMapping(0, trace);
    }
    trace.exit();
    return *mapping;
}

void sBuildAdapterTreeAndOutput(HBA_HANDLE handle) {
    const FunctionTrace trace("sBuildAdapterTreeAndOutput");
    const HBA_ADAPTERATTRIBUTES* const attributes = sBuildAdapterAttributes(handle);
    if (attributes != nullptr) {
        const PortAttributes& ports = sBuildPortAttributes(handle, *attributes);
        const HBA_FCPTARGETMAPPINGV2& mapping = sBuildTargetMappings(handle);
        HA_PrintAdapterTree(*attributes, ports, mapping, gLogStream);
    }
    trace.exit();
}

void sBuildAndOutput() {
    const FunctionTrace trace("sBuildAndOutput");
    const timeval start = wallClock();
    const uint32 count = HA_GetNumberOfAdapters();
    if (count == 0) {
        trace.logAndFail<THaltEx>("The system does not have any adapters\n",
                                  "There are no adapters on the system\n");
    }
    // No 32-bit program could hold that many names, whatever the library says.
    constexpr uint32 kMostNames = 0x7FFFFFFF / 16;
    if (count > kMostNames) {
        trace.fail<NoMemoryEx>("No Memory\n");
    }
    std::vector<ZebString> names(count);
    HA_GetAdapterNames(count, names);
    logPrintf("Number of adapters: %u\n", count);
    for (uint32 index = 0; index < count; ++index) {
        logPrintf("Going to open Adapter #%u - '%s'\n", index, names[index].c_str());
        std::string name = expandAdapterName(names[index].c_str());
        try {
            showProgress("FC adapter", name.c_str(), index + 1, count);
            const HBA_HANDLE handle = HA_OpenAdapter(name.data());
            logPrintf("Storing Adapter Handle\n");
            gOpenAdapters.emplace_back(handle);
            sBuildAdapterTreeAndOutput(handle);
        } catch (const std::exception&) {
            logPrintf("Exception occured while opening adapter: %s\n", name.c_str());
        }
    }
    const timeval end = wallClock();
    logPrintf("Time taken to build tree: %.2f milliseconds\n", elapsedMilliseconds(start, end));
    trace.exit();
}

void sFirstBuildAndOutput() {
    const FunctionTrace trace("sFirstBuildAndOutput");
    const timeval start = wallClock();
    showProgress("FC", "HBA library");
    HA_LoadHbaapi();
    const timeval end = wallClock();
    logPrintf("Time taken to load HBAAPI: %.2f milliseconds\n", elapsedMilliseconds(start, end));
    sBuildAndOutput();
    trace.exit();
}

void cleanUpFcTree() {
    for (const OpenAdapter& adapter : gOpenAdapters) {
        releaseAdapter(adapter);
    }
    gOpenAdapters.clear();
    logPrintf("Going to free library\n");
    HA_FreeHbaapi();
}
