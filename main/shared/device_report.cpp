#include "main/shared/device_report.hpp"

#include <exception>

#include "fc/identity/unique_lun_id.hpp"
#include "foundation/clib_memory.hpp"
#include "foundation/clib_stream.hpp"
#include "foundation/log.hpp"
#include "foundation/trace.hpp"
#include "main/shared/device_register.hpp"
#include "main/shared/iscsi_model.hpp"
#include "main/shared/progress.hpp"
#include "main/shared/reconfirm_das.hpp"
#include "main/shared/run_state.hpp"

namespace {

// "/dev/" and a kernel name, cut to 63 characters.
struct DevicePath {
    explicit DevicePath(const char* name) { Clib_snprintf(text, sizeof text, "/dev/%s", name); }
    char text[64] = {};
};

ZebString hostNameAnd(const char* separator, const char* devName) {
    ZebString lunId(gHostName);
    lunId += separator;
    lunId += devName;
    return lunId;
}

void printIscsiPath(const IscsiInitiatorPort& port, const IscsiLunPath& path) {
    reportPrintf("|_ Initiator IQN ");
    reportPrintf(" %s\n", port.init_wwnn.c_str());
    reportPrintf("|  |_ Target IQN");
    reportPrintf(" %s\n", path.tgt_wwnn.c_str());
    reportPrintf("|  |  |_ Initiator_IP/MAC <--------> Target_IP\n");
    reportPrintf("         %s <---> %s\n", port.init_wwpn.c_str(), path.tgt_wwpn.c_str());
    reportPrintf("|  |  |  |_ Device_Name: %s sScsiOSLun: %d LunId: %s\n\n", path.deviceName, path.sScsiOSLun,
                 path.uniqueLunId.c_str());
}

void printIscsiTree() {
    for (const ZebCountedPointer<IscsiInitiatorPort>& port : gIscsiPortList) {
        if (port->paths.empty()) {
            logPrintf("No target mappings for port");
            continue;
        }
        reportPrintf("\n");
        for (const ZebCountedPointer<IscsiLunPath>& path : port->paths) {
            printIscsiPath(*port, *path);
        }
    }
}

void printDasDevice(char* name) {
    ZebString lunId("");
    char* const bang = std::strchr(name, '!'); // the kernel's stand-in for the '/' of cciss/c0d0
    if (bang != nullptr) {
        *bang = '/';
    }
    const DevicePath devName(name);
    showProgress("DAS", devName.text);
    if (getDeviceType(devName.text) != 0 || reconfirmDAS(devName.text) == 0) {
        return;
    }
    uint32 requestFlag = TREE_DAS;
    try {
        HA_GetScsiUniqueLunId(devName.text, lunId, requestFlag);
    } catch (const std::exception&) {
        reportPrintf("Exception occured while getting LUN ID for device %s\n", devName.text);
        if (!gDirectAttachedFlag) {
            reportPrintf("\n--------> Device Name: |%s| is not supported\n\n", devName.text);
            return;
        }
    }
    if (gDirectAttachedFlag) {
        lunId = hostNameAnd("::", devName.text);
        gDirectAttachedFlag = false;
    }
    addDeviceNameMap(TREE_DAS, devName.text);
    reportPrintf("\n--------> Device Name: |%s| LunId: |%s|\n\n", devName.text, lunId.c_str());
}

void printLogicalDevice(const char* name) {
    const DevicePath devName(name);
    if (getDeviceType(devName.text) == 0) {
        const ZebString lunId = hostNameAnd(" :: ", devName.text);
        reportPrintf("\n--------> Device Name: |%s| LunId: |%s| \n", devName.text, lunId.c_str());
    }
}

} // namespace

void printDeviceTree(int32 type, char* name) {
    const FunctionTrace trace("printDeviceTree");
    switch (type) {
    case TREE_ISCSI:
        printIscsiTree();
        break;
    case TREE_DAS:
        printDasDevice(name);
        break;
    case TREE_LOGICAL:
        printLogicalDevice(name);
        break;
    default:
        break;
    }
}
