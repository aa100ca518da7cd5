// Walks the adapters that the HBA API library offers and prints what it is told.
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <ctime> // hbaapi.h needs it
#include <memory>

#include <hbaapi.h>

namespace {

void printWwn(const HBA_WWN& wwn) {
    for (const HBA_UINT8 byte : wwn.wwn) {
        std::printf("%02x", unsigned{byte});
    }
}

constexpr HBA_UINT32 kRoom = 8; // entries that the mapping buffer holds

void printMapping(HBA_HANDLE handle, HBA_UINT32 asked) {
    const std::unique_ptr<void, decltype(&std::free)> buffer(
        std::calloc(1, sizeof(HBA_FCPTARGETMAPPING) + kRoom * sizeof(HBA_FCPSCSIENTRY)), std::free);
    auto* mapping = static_cast<HBA_FCPTARGETMAPPING*>(buffer.get());
    mapping->NumberOfEntries = asked;
    const HBA_STATUS status = HBA_GetFcpTargetMapping(handle, mapping);
    std::printf("  mapping of %u: status %u, %u entries\n", asked, status, mapping->NumberOfEntries);
    for (HBA_UINT32 i = 0; i < kRoom; ++i) {
        const HBA_FCPSCSIENTRY& entry = mapping->entry[i];
        if (entry.ScsiId.OSDeviceName[0] == '\0') {
            continue;
        }
        std::printf("    %s bus %u target %u lun %u fcid %x fcplun %llx ", entry.ScsiId.OSDeviceName,
                    entry.ScsiId.ScsiBusNumber, entry.ScsiId.ScsiTargetNumber, entry.ScsiId.ScsiOSLun,
                    entry.FcpId.FcId, entry.FcpId.FcpLun);
        printWwn(entry.FcpId.NodeWWN);
        std::printf(" ");
        printWwn(entry.FcpId.PortWWN);
        std::printf("\n");
    }
}

void printAdapter(HBA_UINT32 index) {
    char name[512] = {};
    const HBA_STATUS nameStatus = HBA_GetAdapterName(index, name);
    std::printf("adapter %u: status %u <%s>\n", index, nameStatus, name);
    const HBA_HANDLE handle = nameStatus == HBA_STATUS_OK ? HBA_OpenAdapter(name) : HBA_HANDLE_INVALID;
    if (handle == HBA_HANDLE_INVALID) {
        std::printf("  not opened\n");
        return;
    }
    HBA_ADAPTERATTRIBUTES attributes{};
    const HBA_STATUS status = HBA_GetAdapterAttributes(handle, &attributes);
    std::printf("  attributes: status %u <%.64s> <%.256s> %u ports ", status, attributes.Manufacturer,
                attributes.Model, attributes.NumberOfPorts);
    printWwn(attributes.NodeWWN);
    std::printf("\n");
    for (HBA_UINT32 i = 0; i < attributes.NumberOfPorts; ++i) {
        HBA_PORTATTRIBUTES port{};
        std::printf("  port %u: status %u ", i, HBA_GetAdapterPortAttributes(handle, i, &port));
        printWwn(port.PortWWN);
        std::printf("\n");
    }
    printMapping(handle, 1);
    printMapping(handle, kRoom);
    HBA_CloseAdapter(handle);
}

} // namespace

int main() {
    std::printf("load: status %u\n", HBA_LoadLibrary());
    const HBA_UINT32 count = HBA_GetNumberOfAdapters();
    for (HBA_UINT32 i = 0; i < count; ++i) {
        printAdapter(i);
    }
    std::printf("free: status %u\n", HBA_FreeLibrary());
}
