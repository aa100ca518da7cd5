// The iSCSI paths that a run has found: initiator ports in the order of their discovery, each with its paths.
#pragma once

#include "foundation/counted_pointer.hpp"
#include "foundation/integers.hpp"
#include "foundation/list.hpp"
#include "foundation/zeb_string.hpp"

// One attached disk behind one initiator port.
struct IscsiLunPath {
    static constexpr unsigned kDeviceNameSize = 256;

    ZebString tgt_wwnn{""};                // target IQN
    ZebString tgt_wwpn{""};                // target portal address
    ZebString uniqueLunId{""};             // from HA_GetScsiUniqueLunId, or the text that says it failed
    char deviceName[kDeviceNameSize] = {}; // such as /dev/sdb
    uint32 mUnusedBefore[3] = {};
    int32 sScsiOSLun = 0; // LUN of the session listing
    uint32 mUnusedAfter[3] = {};
};

struct IscsiInitiatorPort {
    ZebString init_wwnn{""}; // initiator IQN
    ZebString init_wwpn{""}; // interface address, else its MAC address, else the initiator IQN and ":0"
    ZebList<ZebCountedPointer<IscsiLunPath>>::List paths;
};

using IscsiPorts = ZebList<ZebCountedPointer<IscsiInitiatorPort>>;

// The ports that the report prints, in this order; the iSCSI tree fills it for the report and empties it.
extern IscsiPorts::List gIscsiPortList;
