// An HBA API library that answers every call in a way of its own. Built with LACKS_A_FUNCTION, it lacks the
// last of them; with LEADS_NOWHERE, that one's address is null.
#include <cstdio>
#include <cstring>

#include "fc/hba_api.hpp"

HBA_STATUS HBA_LoadLibrary() {
    return HBA_STATUS_OK;
}

HBA_STATUS HBA_FreeLibrary() {
    return HBA_STATUS_ERROR_BUSY;
}

HBA_UINT32 HBA_GetNumberOfAdapters() {
    return 2;
}

HBA_STATUS HBA_GetAdapterName(HBA_UINT32 index, char* name) {
    std::sprintf(name, "adapter %u", index);
    return HBA_STATUS_ERROR_ARG;
}

HBA_HANDLE HBA_OpenAdapter(char* name) {
    return static_cast<HBA_HANDLE>(std::strlen(name));
}

void HBA_CloseAdapter(HBA_HANDLE handle) {
    std::printf("closed %u\n", handle);
}

HBA_STATUS HBA_GetAdapterAttributes(HBA_HANDLE handle, HBA_ADAPTERATTRIBUTES* attributes) {
    attributes->NumberOfPorts = handle + 1;
    return HBA_STATUS_ERROR_STALE_DATA;
}

HBA_STATUS HBA_GetAdapterPortAttributes(HBA_HANDLE handle, HBA_UINT32 index, HBA_PORTATTRIBUTES* attributes) {
    attributes->PortFcId = handle * 100 + index;
    return HBA_STATUS_ERROR_ILLEGAL_INDEX;
}

#ifdef LEADS_NOWHERE
__asm__(".globl HBA_GetFcpTargetMapping\n.set HBA_GetFcpTargetMapping, 0");
#elif !defined LACKS_A_FUNCTION
HBA_STATUS HBA_GetFcpTargetMapping(HBA_HANDLE handle, HBA_FCPTARGETMAPPING* mapping) {
    mapping->NumberOfEntries += handle;
    return HBA_STATUS_ERROR_MORE_DATA;
}
#endif
