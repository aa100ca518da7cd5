// Loads the HBA API library as a portable build does, calls every function and prints what each returned.
#include <cstdio>

#include "fc/hba_api.hpp"

int main() {
    const HBA_STATUS loaded = HBA_LoadLibrary();
    std::printf("load %u\n", loaded);
    if (loaded != HBA_STATUS_OK) {
        return 0;
    }
    std::printf("adapters %u\n", HBA_GetNumberOfAdapters());
    char name[256] = {};
    const HBA_STATUS named = HBA_GetAdapterName(1, name);
    std::printf("name %u: %s\n", named, name);
    const HBA_HANDLE handle = HBA_OpenAdapter(name);
    std::printf("open %u\n", handle);
    HBA_ADAPTERATTRIBUTES adapter{};
    const HBA_STATUS described = HBA_GetAdapterAttributes(handle, &adapter);
    std::printf("attributes %u: %u ports\n", described, adapter.NumberOfPorts);
    HBA_PORTATTRIBUTES port{};
    const HBA_STATUS portDescribed = HBA_GetAdapterPortAttributes(handle, 5, &port);
    std::printf("port %u: %u\n", portDescribed, port.PortFcId);
    HBA_FCPTARGETMAPPING mapping{};
    mapping.NumberOfEntries = 1;
    const HBA_STATUS mapped = HBA_GetFcpTargetMapping(handle, &mapping);
    std::printf("mapping %u: %u entries\n", mapped, mapping.NumberOfEntries);
    HBA_CloseAdapter(handle);
    std::printf("free %u\n", HBA_FreeLibrary());
    return 0;
}
