// The simulated HBA vendor library. The HBA API library loads it as it loads a real vendor's, by
// /etc/hba.conf; its adapters come from the file that simhost wrote. It keeps no copy of them: the file is
// mapped, privately writable so that calls can be counted in place.
#include <fcntl.h>
#include <sys/mman.h>
#include <unistd.h>

#include <algorithm>
#include <cstring>
#include <ctime> // hbaapi.h needs it

#include <hbaapi.h>
#include <vendorhbaapi.h>

#include "simhost/adapter_file.hpp"

namespace {

using namespace simhost;

// The mapped file and its parts.
struct Adapters {
    void* mapped = MAP_FAILED;
    std::size_t size = 0;
    AdapterFileHeader header{};
    AdapterFileAdapter* adapters = nullptr;
    const AdapterFilePort* ports = nullptr;
    const AdapterFileDeviation* deviations = nullptr;
    const AdapterFileLun* luns = nullptr;
};

Adapters gAdapters; // one library, one host

bool mapAdapters() {
    if (gAdapters.mapped != MAP_FAILED) {
        return true;
    }
    const int file = ::open(kAdapterFilePath, O_RDONLY | O_CLOEXEC);
    const off_t size = file < 0 ? -1 : ::lseek(file, 0, SEEK_END); // fstat would need a glibc of 2021
    if (size < 0) {
        return false;
    }
    gAdapters.size = static_cast<std::size_t>(size);
    gAdapters.mapped = ::mmap(nullptr, gAdapters.size, PROT_READ | PROT_WRITE, MAP_PRIVATE, file, 0);
    ::close(file);
    if (gAdapters.mapped == MAP_FAILED) {
        return false;
    }
    auto* header = static_cast<AdapterFileHeader*>(gAdapters.mapped);
    gAdapters.header = *header;
    void* next = header + 1;
    gAdapters.adapters = static_cast<AdapterFileAdapter*>(next);
    next = gAdapters.adapters + header->adapters;
    gAdapters.ports = static_cast<AdapterFilePort*>(next);
    next = static_cast<AdapterFilePort*>(next) + header->ports;
    gAdapters.deviations = static_cast<AdapterFileDeviation*>(next);
    next = static_cast<AdapterFileDeviation*>(next) + header->deviations;
    gAdapters.luns = static_cast<AdapterFileLun*>(next);
    return true;
}

HBA_WWN wwnOf(const std::uint8_t (&bytes)[8]) {
    HBA_WWN wwn;
    std::memcpy(wwn.wwn, bytes, sizeof wwn.wwn);
    return wwn;
}

// Handles count from 1, so that 0 stays the invalid one.
AdapterFileAdapter* adapterOf(HBA_HANDLE handle) {
    return handle >= 1 && handle <= gAdapters.header.adapters ? gAdapters.adapters + handle - 1 : nullptr;
}

HBA_UINT32 getVersion() {
    return HBA_LIBVERSION;
}

HBA_STATUS loadLibrary() {
    return mapAdapters() ? gAdapters.header.loadStatus : HBA_STATUS_ERROR;
}

HBA_STATUS freeLibrary() {
    if (gAdapters.mapped != MAP_FAILED) {
        ::munmap(gAdapters.mapped, gAdapters.size);
    }
    gAdapters = Adapters();
    return HBA_STATUS_OK;
}

HBA_UINT32 getNumberOfAdapters() {
    return gAdapters.header.reportedAdapters;
}

HBA_STATUS getAdapterName(HBA_UINT32 index, char* name) {
    if (index >= gAdapters.header.adapters) {
        return HBA_STATUS_ERROR_ILLEGAL_INDEX;
    }
    const AdapterFileAdapter& adapter = gAdapters.adapters[index];
    if (adapter.nameStatus == HBA_STATUS_OK) {
        std::memcpy(name, adapter.name, sizeof adapter.name);
    }
    return adapter.nameStatus;
}

HBA_HANDLE openAdapter(char* name) {
    for (HBA_UINT32 i = 0; i < gAdapters.header.adapters; ++i) {
        if (std::strncmp(name, gAdapters.adapters[i].name, sizeof gAdapters.adapters[i].name) == 0) {
            return gAdapters.adapters[i].opens != 0 ? i + 1 : HBA_HANDLE_INVALID;
        }
    }
    return HBA_HANDLE_INVALID;
}

void closeAdapter(HBA_HANDLE /*handle*/) {}

HBA_STATUS getAdapterAttributes(HBA_HANDLE handle, HBA_ADAPTERATTRIBUTES* attributes) {
    const AdapterFileAdapter* adapter = adapterOf(handle);
    if (adapter == nullptr) {
        return HBA_STATUS_ERROR_INVALID_HANDLE;
    }
    std::memset(attributes, 0, sizeof *attributes);
    std::memcpy(attributes->Manufacturer, adapter->manufacturer, sizeof attributes->Manufacturer);
    std::memcpy(attributes->Model, adapter->model, sizeof attributes->Model);
    attributes->NodeWWN = wwnOf(adapter->nodeWwn);
    attributes->NumberOfPorts = adapter->numberOfPorts;
    return adapter->attributesStatus;
}

HBA_STATUS getAdapterPortAttributes(HBA_HANDLE handle, HBA_UINT32 index, HBA_PORTATTRIBUTES* attributes) {
    const AdapterFileAdapter* adapter = adapterOf(handle);
    if (adapter == nullptr) {
        return HBA_STATUS_ERROR_INVALID_HANDLE;
    }
    if (index >= adapter->ports.count) {
        return HBA_STATUS_ERROR_ILLEGAL_INDEX;
    }
    const AdapterFilePort& port = gAdapters.ports[adapter->ports.first + index];
    std::memset(attributes, 0, sizeof *attributes);
    attributes->NodeWWN = wwnOf(adapter->nodeWwn);
    attributes->PortWWN = wwnOf(port.portWwn);
    return port.status;
}

void putEntry(HBA_FCPSCSIENTRY& entry, const AdapterFileLun& lun) {
    std::memcpy(entry.ScsiId.OSDeviceName, lun.device, sizeof entry.ScsiId.OSDeviceName);
    entry.ScsiId.ScsiBusNumber = lun.bus;
    entry.ScsiId.ScsiTargetNumber = lun.target;
    entry.ScsiId.ScsiOSLun = lun.lun;
    entry.FcpId.FcId = lun.fcId;
    entry.FcpId.NodeWWN = wwnOf(lun.nodeWwn);
    entry.FcpId.PortWWN = wwnOf(lun.portWwn);
    const std::uint64_t fcpLun = (std::uint64_t{lun.fcpLunHigh} << 32U) | lun.fcpLunLow;
    std::memcpy(&entry.FcpId.FcpLun, &fcpLun, sizeof entry.FcpId.FcpLun);
}

HBA_STATUS getFcpTargetMapping(HBA_HANDLE handle, HBA_FCPTARGETMAPPING* mapping) {
    AdapterFileAdapter* adapter = adapterOf(handle);
    if (adapter == nullptr) {
        return HBA_STATUS_ERROR_INVALID_HANDLE;
    }
    const HBA_UINT32 room = mapping->NumberOfEntries;
    const HBA_UINT32 real = adapter->luns.count;
    for (HBA_UINT32 i = 0; i < std::min(room, real); ++i) {
        putEntry(mapping->entry[i], gAdapters.luns[adapter->luns.first + i]);
    }
    mapping->NumberOfEntries = real;
    HBA_STATUS status = real > room ? HBA_STATUS_ERROR_MORE_DATA : HBA_STATUS_OK;
    if (adapter->deviations.count != 0) {
        const HBA_UINT32 call = std::min(adapter->mappingCalls, adapter->deviations.count - 1);
        const AdapterFileDeviation& deviation = gAdapters.deviations[adapter->deviations.first + call];
        if (deviation.hasEntries != 0) {
            mapping->NumberOfEntries = deviation.entries;
        }
        if (deviation.hasStatus != 0) {
            status = deviation.status;
        }
    }
    ++adapter->mappingCalls;
    return status;
}

} // namespace

// The one entry that the HBA API library looks up.
extern "C" __attribute__((visibility("default"))) HBA_STATUS
HBA_RegisterLibrary(HBA_ENTRYPOINTS* functionTable) {
    if (!mapAdapters()) {
        return HBA_STATUS_ERROR;
    }
    if (gAdapters.header.registerStatus != HBA_STATUS_OK) {
        return gAdapters.header.registerStatus;
    }
    functionTable->GetVersionHandler = getVersion;
    functionTable->LoadLibraryHandler = loadLibrary;
    functionTable->FreeLibraryHandler = freeLibrary;
    functionTable->GetNumberOfAdaptersHandler = getNumberOfAdapters;
    functionTable->GetAdapterNameHandler = getAdapterName;
    functionTable->OpenAdapterHandler = openAdapter;
    functionTable->CloseAdapterHandler = closeAdapter;
    functionTable->GetAdapterAttributesHandler = getAdapterAttributes;
    functionTable->GetAdapterPortAttributesHandler = getAdapterPortAttributes;
    functionTable->GetFcpTargetMappingHandler = getFcpTargetMapping;
    return HBA_STATUS_OK;
}
