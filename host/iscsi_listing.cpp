#include "host/iscsi_listing.hpp"

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <exception>
#include <limits>
#include <memory>
#include <new>
#include <utility>

#include "fc/identity/unique_lun_id.hpp"
#include "foundation/clib_memory.hpp"
#include "foundation/clib_stream.hpp"
#include "foundation/line_buffer.hpp"
#include "foundation/log.hpp"
#include "foundation/trace.hpp"
#include "main/shared/device_register.hpp"
#include "main/shared/progress.hpp"
#include "main/shared/run_state.hpp"

namespace {

constexpr const char* kInitiatorNameFile = "/etc/iscsi/initiatorname.iscsi";
constexpr char kInitiatorNameKey[] = "InitiatorName=";
constexpr const char* kEmptyValue = "<empty>"; // what iscsiadm prints for a value that it does not know
constexpr uint32 kInitiatorRead = 0;
constexpr uint32 kNoInitiatorFile = 5;

bool beginsWith(const char* text, const char* prefix) {
    return Clib_strncmp(text, prefix, Clib_strlen(prefix)) == 0;
}

bool isMissing(const ZebString& value) {
    return value.empty() || value == kEmptyValue;
}

// Ends the text at its first colon: drops a port, and all of an IPv6 address but its first group.
char* cutAtColon(char* text) {
    text[std::strcspn(text, ":")] = '\0';
    return text;
}

// The decimal number at the start of `text`, as atoi reads it; one beyond 32 bits is clamped.
int32 parseLun(const char* text) {
    const long long value = std::strtoll(text, nullptr, 10);
    if (value > std::numeric_limits<int32>::max()) {
        return std::numeric_limits<int32>::max();
    }
    if (value < std::numeric_limits<int32>::min()) {
        return std::numeric_limits<int32>::min();
    }
    return static_cast<int32>(value);
}

} // namespace

ZebString IscsiListing::initiatorPort() const {
    const ZebString& port = isMissing(mInitiatorIp) ? mInitiatorMac : mInitiatorIp;
    if (port == "0.0.0.0" || isMissing(port)) {
        ZebString portOfIqn(mInitiatorIqn);
        portOfIqn += ":0";
        return portOfIqn;
    }
    return port;
}

// The record of initiator port `port`, made when it is new.
ZebCountedPointer<IscsiInitiatorPort> IscsiListing::findOrAddPort(const ZebString& port) {
    if (PortsByName::contains(mPortsByName, port)) {
        return PortsByName::lookup(mPortsByName, port);
    }
    ZebCountedPointer<IscsiInitiatorPort> added;
    added.create(new (std::nothrow) IscsiInitiatorPort, ZebPST_Individual, ZebPAT_New);
    added->init_wwnn = mInitiatorIqn;
    added->init_wwpn = port;
    IscsiPorts::push_back(mPorts, added);
    PortsByName::insert(mPortsByName, port, added);
    return added;
}

void IscsiListing::addPath(const ZebString& port, const ZebString& lunId, const ZebString& devName) {
    ZebCountedPointer<IscsiInitiatorPort> portRecord = findOrAddPort(port);
    ZebCountedPointer<IscsiLunPath> path;
    path.create(new (std::nothrow) IscsiLunPath, ZebPST_Individual, ZebPAT_New);
    path->tgt_wwnn = mTargetIqn;
    path->tgt_wwpn = mTargetIp;
    path->uniqueLunId = lunId;
    Clib_strncpy(path->deviceName, devName.c_str(), sizeof path->deviceName - 1);
    path->sScsiOSLun = mCurrentLun;
    ZebList<ZebCountedPointer<IscsiLunPath>>::push_back(portRecord->paths, path);
}

char* skipBlanks(char* position) {
    return position + std::strspn(position, " \t");
}

char* cutToken(char* position) {
    position[std::strcspn(position, " \t\r\n")] = '\0';
    return position;
}

void IscsiListing::addIscsiPath(const ZebString& devName) {
    const FunctionTrace trace("addIscsiPath");
    showProgress("iSCSI", devName.c_str());
    const ZebString port = initiatorPort();
    ZebString lunId("");
    addDeviceNameMap(TREE_ISCSI, devName);
    uint32 requestFlag = TREE_ISCSI;
    try {
        HA_GetScsiUniqueLunId(devName, lunId, requestFlag);
    } catch (const std::exception&) {
        lunId = ":-( SCSI_Inquiry_Failed";
    }
    reportPrintf("Register new iSCSI path: init_wwnn=%s, init_wwpn=%s, tgt_wwnn=%s, tgt_wwpn=%s, lun=%d\n",
                 mInitiatorIqn.c_str(), port.c_str(), mTargetIqn.c_str(), mTargetIp.c_str(), mCurrentLun);
    if (isMissing(mInitiatorIqn) || isMissing(port) || isMissing(mTargetIqn) || isMissing(mTargetIp) ||
        mCurrentLun < 0) {
        reportPrintf("Ignoring device %s, some param missing!\n", devName.c_str());
    } else {
        addPath(port, lunId, devName);
    }
    trace.exit();
}

void IscsiListing::processCmdOutput(char* line) {
    const FunctionTrace trace("processCmdOutput");
    char* const p = skipBlanks(line);
    const char* const colon = std::strchr(p, ':');
    const std::size_t keyLen = colon != nullptr ? static_cast<std::size_t>(colon - p) + 1 : 0;
    const auto isKey = [&](const char* key) { return keyLen == Clib_strlen(key) && beginsWith(p, key); };
    const auto valueAfter = [&](const char* key) { return cutToken(skipBlanks(p + Clib_strlen(key))); };

    switch (p[0]) {
    case 'T':
        if (isKey("Target:")) {
            mTargetIqn = valueAfter("Target:");
            mTargetIp = "";
            mInitiatorIp = "";
            mInitiatorMac = "";
            mCurrentLun = kNoLun;
            logPrintf("Target IQN '%s'\n", mTargetIqn.c_str());
        }
        break;
    case 'C':
        if (isKey("Current Portal:")) {
            mTargetIp = cutAtColon(valueAfter("Current Portal:"));
            mInDeviceList = false;
            mInitiatorIp = "";
            mInitiatorMac = "";
            mCurrentLun = kNoLun;
            logPrintf("Target IP '%s'\n", mTargetIp.c_str());
        }
        break;
    case 'I':
        if (isKey("Iface HWaddress:")) {
            mInitiatorMac = valueAfter("Iface HWaddress:");
            logPrintf("Initiator MAC '%s'\n", mInitiatorMac.c_str());
        } else if (isKey("Iface IPaddress:")) {
            mInitiatorIp = cutAtColon(valueAfter("Iface IPaddress:"));
            logPrintf("Initiator IP '%s'\n", mInitiatorIp.c_str());
        }
        break;
    case 'A':
        if (!mInDeviceList && isKey("Attached SCSI devices:")) {
            mInDeviceList = true;
            logPrintf("Got device list start\n");
        } else if (mInDeviceList && beginsWith(p, "Attached scsi disk")) {
            char devName[128] = {};
            Clib_snprintf(devName, sizeof devName, "/dev/%s", valueAfter("Attached scsi disk"));
            addIscsiPath(devName);
            mCurrentLun = kNoLun; // the next disk's own line names its LUN
            logPrintf("Disk name '%s'\n", devName);
        }
        break;
    case 's':
        if (char* const lun = mInDeviceList ? std::strstr(p, "Lun:") : nullptr) {
            const char* const value = cutToken(skipBlanks(lun + sizeof "Lun:" - 1));
            mCurrentLun = parseLun(value);
            logPrintf("LUN '%s'\n", value);
        }
        break;
    default:
        break;
    }
    trace.exit();
}

uint32 IscsiListing::readInitiatorIQN() {
    const FunctionTrace trace("readInitiatorIQN");
    flushLog();
    const std::unique_ptr<std::FILE, decltype(&std::fclose)> file(std::fopen(kInitiatorNameFile, "r"),
                                                                  &std::fclose);
    if (!file) {
        reportPrintf("Failed to open /etc/iscsi/initiatorname.iscsi!\n");
        mInitiatorIqn = gHostName;
        return kNoInitiatorFile;
    }
    LineBuffer lines;
    while (char* const line = lines.next(file.get())) {
        char* const key = skipBlanks(line);
        if (beginsWith(key, kInitiatorNameKey)) {
            const char* const value = cutToken(key + sizeof kInitiatorNameKey - 1);
            reportPrintf("InitiatorIQN %s\n", value);
            mInitiatorIqn = value;
            break;
        }
    }
    if (mInitiatorIqn.empty()) {
        logPrintf("Failed to find the Initiator IQN, using hostname!\n");
        mInitiatorIqn = gHostName;
    }
    trace.exit();
    return kInitiatorRead;
}

IscsiPorts::List IscsiListing::takePorts() {
    mPortsByName.clear();
    return std::move(mPorts);
}
