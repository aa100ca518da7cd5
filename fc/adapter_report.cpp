#include "fc/adapter_report.hpp"

#include "fc/wwn.hpp"
#include "foundation/clib_stream.hpp"
#include "foundation/trace.hpp"

namespace {

// A target's line stands above its first LUN, and again when it comes back after another target.
bool beginsTarget(const HBA_FCPSCSIENTRYV2* entries, uint32 index) {
    return index == 0 || !isSameWwn(entries[index].FcpId.PortWWN, entries[index - 1].FcpId.PortWWN) ||
           !isSameWwn(entries[index].FcpId.NodeWWN, entries[index - 1].FcpId.NodeWWN);
}

void printTarget(const HBA_FCPSCSIENTRYV2& entry, std::FILE* stream) {
    Clib_fprintf(stream, "|  |  |_ Target wwnn ");
    Clib_fprintf(stream, "%s", WwnText(entry.FcpId.NodeWWN).text);
    Clib_fprintf(stream, " wwpn ");
    Clib_fprintf(stream, "%s", WwnText(entry.FcpId.PortWWN).text);
    Clib_fprintf(stream, " bus %u target# %u\n", entry.ScsiId.ScsiBusNumber, entry.ScsiId.ScsiTargetNumber);
}

void printLun(const HBA_FCPSCSIENTRYV2& entry, std::FILE* stream) {
    // The low 32 bits of the 64-bit FCP LUN, on either word size.
    const auto fcpLun = static_cast<unsigned long>(static_cast<uint32>(entry.FcpId.FcpLun));
    Clib_fprintf(stream, "|  |  |  |_ lun name %s luid %s oslun %u fcid %u fcplun 0%lx\n",
                 fieldText(entry.ScsiId.OSDeviceName).c_str(), fieldText(entry.LUID.buffer).c_str(),
                 entry.ScsiId.ScsiOSLun, entry.FcpId.FcId, fcpLun);
}

} // namespace

void HA_PrintAdapterTree(const HBA_ADAPTERATTRIBUTES& adapter, const PortAttributes& ports,
                         const HBA_FCPTARGETMAPPINGV2& mapping, std::FILE* stream) {
    const FunctionTrace trace("HA_PrintAdapterTree");
    passLog(); // what is written to the stream itself stands behind it
    Clib_fprintf(stream, "\n");
    Clib_fprintf(stream, "|_ Adapter wwnn ");
    Clib_fprintf(stream, "%s", WwnText(adapter.NodeWWN).text);
    Clib_fprintf(stream, "\n");
    for (uint32 port = 0; port < ports.count(); ++port) {
        Clib_fprintf(stream, "|  |_ Initiator wwpn ");
        Clib_fprintf(stream, "%s", WwnText(ports[port].PortWWN).text);
        Clib_fprintf(stream, "\n");
        for (uint32 index = 0; index < mapping.NumberOfEntries; ++index) {
            if (beginsTarget(mapping.entry, index)) {
                printTarget(mapping.entry[index], stream);
            }
            printLun(mapping.entry[index], stream);
        }
    }
    trace.exit();
}
