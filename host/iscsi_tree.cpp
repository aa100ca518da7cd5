#include "host/iscsi_tree.hpp"

#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <exception>
#include <limits>
#include <new>

#include "fc/unique_lun_id.hpp"
#include "foundation/clib_memory.hpp"
#include "foundation/clib_stream.hpp"
#include "foundation/trace.hpp"
#include "main/device_register.hpp"
#include "main/device_report.hpp"
#include "main/iscsi_model.hpp"
#include "main/run_state.hpp"

namespace {

constexpr const char* kSessionCommand = "/sbin/iscsiadm -m session --print=3 2>/dev/null";
constexpr const char* kInitiatorNameFile = "/etc/iscsi/initiatorname.iscsi";
constexpr char kInitiatorNameKey[] = "InitiatorName=";
constexpr const char* kEmptyValue = "<empty>"; // what iscsiadm prints for a value that it does not know
constexpr uint32 kInitiatorRead = 0;
constexpr uint32 kNoInitiatorFile = 5;
constexpr int32 kNoLun = -1;

// What the listing has said so far of the current session; values outlive the session unless a line of the
// next one replaces or empties them.
struct SessionState {
    ZebString gTargetIqn{""};
    ZebString gTargetIp{""}; // the portal's address, without port
    ZebString gInitiatorIqn{""};
    ZebString gInitiatorIp{""};
    ZebString gInitiatorMac{""};
    bool gInDeviceList = false;
    int32 gCurrentLun = kNoLun;
};

// The run's one state, made at its first use: memory that runs out ends the tree there, not the program
// before its start.
SessionState& session() {
    static SessionState sState;
    return sState;
}

// Lines of any length, one at a time, in memory that grows with the longest.
class LineBuffer {
public:
    LineBuffer()
        : mpLine(static_cast<char*>(std::malloc(kFirstSize))), mSize(mpLine != nullptr ? kFirstSize : 0) {}
    LineBuffer(const LineBuffer&) = delete;
    LineBuffer& operator=(const LineBuffer&) = delete;
    ~LineBuffer() { std::free(mpLine); }

    // The next line with its line feed, owned by the buffer and good until the next call; null at the end of
    // the stream, on a read error and when memory runs out.
    char* next(std::FILE* stream) { return getline(&mpLine, &mSize, stream) >= 0 ? mpLine : nullptr; }

private:
    static constexpr std::size_t kFirstSize = 1024;
    char* mpLine;
    std::size_t mSize;
};

LineBuffer gLineBuffer;

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

ZebString initiatorPort() {
    const ZebString& port =
        isMissing(session().gInitiatorIp) ? session().gInitiatorMac : session().gInitiatorIp;
    if (port == "0.0.0.0" || isMissing(port)) {
        ZebString portOfIqn(session().gInitiatorIqn);
        portOfIqn += ":0";
        return portOfIqn;
    }
    return port;
}

// The record of initiator port `port`, made when it is new.
ZebCountedPointer<IscsiInitiatorPort> findOrAddPort(const ZebString& port) {
    using PortMap = ZebStringMap<ZebCountedPointer<IscsiInitiatorPort>>;
    if (PortMap::contains(gIscsiPortMap, port)) {
        return PortMap::lookup(gIscsiPortMap, port);
    }
    ZebCountedPointer<IscsiInitiatorPort> added;
    added.create(new (std::nothrow) IscsiInitiatorPort, ZebPST_Individual, ZebPAT_New);
    added->init_wwnn = session().gInitiatorIqn;
    added->init_wwpn = port;
    ZebList<ZebCountedPointer<IscsiInitiatorPort>>::push_back(gIscsiPortList, added);
    PortMap::insert(gIscsiPortMap, port, added);
    return added;
}

void addPath(const ZebString& port, const ZebString& lunId, const ZebString& devName) {
    ZebCountedPointer<IscsiInitiatorPort> portRecord = findOrAddPort(port);
    ZebCountedPointer<IscsiLunPath> path;
    path.create(new (std::nothrow) IscsiLunPath, ZebPST_Individual, ZebPAT_New);
    path->tgt_wwnn = session().gTargetIqn;
    path->tgt_wwpn = session().gTargetIp;
    path->uniqueLunId = lunId;
    Clib_strncpy(path->deviceName, devName.c_str(), sizeof path->deviceName - 1);
    path->sScsiOSLun = session().gCurrentLun;
    ZebList<ZebCountedPointer<IscsiLunPath>>::push_back(portRecord->paths, path);
}

} // namespace

char* skipBlanks(char* position) {
    return position + std::strspn(position, " \t");
}

char* cutToken(char* position) {
    position[std::strcspn(position, " \t\r\n")] = '\0';
    return position;
}

void addIscsiPath(const ZebString& devName) {
    TRACE_ENTRY("addIscsiPath");
    const ZebString port = initiatorPort();
    ZebString lunId("");
    addDeviceNameMap(TREE_ISCSI, devName);
    uint32 requestFlag = TREE_ISCSI;
    try {
        HA_GetScsiUniqueLunId(devName, lunId, requestFlag);
    } catch (const std::exception&) {
        lunId = ":-( SCSI_Inquiry_Failed";
    }
    Clib_fprintf(gLogStream,
                 "Register new iSCSI path: init_wwnn=%s, init_wwpn=%s, tgt_wwnn=%s, tgt_wwpn=%s, lun=%d\n",
                 session().gInitiatorIqn.c_str(), port.c_str(), session().gTargetIqn.c_str(),
                 session().gTargetIp.c_str(), session().gCurrentLun);
    if (isMissing(session().gInitiatorIqn) || isMissing(port) || isMissing(session().gTargetIqn) ||
        isMissing(session().gTargetIp) || session().gCurrentLun < 0) {
        Clib_fprintf(gLogStream, "Ignoring device %s, some param missing!\n", devName.c_str());
    } else {
        addPath(port, lunId, devName);
    }
    TRACE_EXIT("addIscsiPath");
}

void processCmdOutput(char* line) {
    TRACE_ENTRY("processCmdOutput");
    char* const p = skipBlanks(line);
    const char* const colon = std::strchr(p, ':');
    const std::size_t keyLen = colon != nullptr ? static_cast<std::size_t>(colon - p) + 1 : 0;
    const auto isKey = [&](const char* key) { return keyLen == Clib_strlen(key) && beginsWith(p, key); };
    const auto valueAfter = [&](const char* key) { return cutToken(skipBlanks(p + Clib_strlen(key))); };

    switch (p[0]) {
    case 'T':
        if (isKey("Target:")) {
            session().gTargetIqn = valueAfter("Target:");
            session().gTargetIp = "";
            session().gInitiatorIp = "";
            session().gInitiatorMac = "";
            session().gCurrentLun = kNoLun;
            logPrintf("Target IQN '%s'\n", session().gTargetIqn.c_str());
        }
        break;
    case 'C':
        if (isKey("Current Portal:")) {
            session().gTargetIp = cutAtColon(valueAfter("Current Portal:"));
            session().gInDeviceList = false;
            session().gInitiatorIp = "";
            session().gInitiatorMac = "";
            session().gCurrentLun = kNoLun;
            logPrintf("Target IP '%s'\n", session().gTargetIp.c_str());
        }
        break;
    case 'I':
        if (isKey("Iface HWaddress:")) {
            session().gInitiatorMac = valueAfter("Iface HWaddress:");
            logPrintf("Initiator MAC '%s'\n", session().gInitiatorMac.c_str());
        } else if (isKey("Iface IPaddress:")) {
            session().gInitiatorIp = cutAtColon(valueAfter("Iface IPaddress:"));
            logPrintf("Initiator IP '%s'\n", session().gInitiatorIp.c_str());
        }
        break;
    case 'A':
        if (!session().gInDeviceList && isKey("Attached SCSI devices:")) {
            session().gInDeviceList = true;
            logPrintf("Got device list start\n");
        } else if (session().gInDeviceList && beginsWith(p, "Attached scsi disk")) {
            char devName[128] = {};
            Clib_snprintf(devName, sizeof devName, "/dev/%s", valueAfter("Attached scsi disk"));
            addIscsiPath(devName);
            session().gCurrentLun = kNoLun; // the next disk's own line names its LUN
            logPrintf("Disk name '%s'\n", devName);
        }
        break;
    case 's':
        if (char* const lun = session().gInDeviceList ? std::strstr(p, "Lun:") : nullptr) {
            const char* const value = cutToken(skipBlanks(lun + sizeof "Lun:" - 1));
            session().gCurrentLun = parseLun(value);
            logPrintf("LUN '%s'\n", value);
        }
        break;
    default:
        break;
    }
    TRACE_EXIT("processCmdOutput");
}

uint32 readInitiatorIQN() {
    TRACE_ENTRY("readInitiatorIQN");
    std::FILE* const file = std::fopen(kInitiatorNameFile, "r");
    if (file == nullptr) {
        Clib_fprintf(gLogStream, "Failed to open /etc/iscsi/initiatorname.iscsi!\n");
        session().gInitiatorIqn = gHostName;
        return kNoInitiatorFile;
    }
    while (char* const line = gLineBuffer.next(file)) {
        char* const key = skipBlanks(line);
        if (beginsWith(key, kInitiatorNameKey)) {
            const char* const value = cutToken(key + sizeof kInitiatorNameKey - 1);
            Clib_fprintf(gLogStream, "InitiatorIQN %s\n", value);
            session().gInitiatorIqn = value;
            break;
        }
    }
    static_cast<void>(std::fclose(file)); // only read
    if (session().gInitiatorIqn.empty()) {
        logPrintf("Failed to find the Initiator IQN, using hostname!\n");
        session().gInitiatorIqn = gHostName;
    }
    TRACE_EXIT("readInitiatorIQN");
    return kInitiatorRead;
}

void BuildIscsiTree_Linux() {
    TRACE_ENTRY("BuildIscsiTree_Linux");
    Clib_fprintf(gLogStream, "\n================================================\n");
    Clib_fprintf(gLogStream, "============= ISCSI DEVICE DETAILS =============");
    Clib_fprintf(gLogStream, "\n================================================\n");
    // NOLINTNEXTLINE(cert-env33-c): the command is fixed
    std::FILE* const listing = popen(kSessionCommand, "r");
    if (listing == nullptr) {
        Clib_fprintf(gLogStream, "Failed to open pipe for /sbin/iscsiadm!\n\n");
        Clib_fprintf(gLogStream, "Cannot proceed with building ISCSI tree\n");
        TRACE_EXIT("BuildIscsiTree_Linux");
        return;
    }
    gIscsiPortList.clear();
    if (readInitiatorIQN() != 0) {
        // The listing stays open, and its command is not waited for: without an initiator its sessions are
        // nobody's.
        Clib_fprintf(gLogStream, "Failed to read Initiator IQN \n\n");
        Clib_fprintf(gLogStream, "Cannot proceed with building ISCSI tree\n");
        TRACE_EXIT("BuildIscsiTree_Linux");
        return;
    }
    while (char* const line = gLineBuffer.next(listing)) {
        processCmdOutput(line);
    }
    static_cast<void>(pclose(listing));
    gIscsiPortMap.clear();
    char ignoredName[] = "FAKEDEV";
    printDeviceTree(TREE_ISCSI, ignoredName);
    gIscsiPortList.clear();
    TRACE_EXIT("BuildIscsiTree_Linux");
}
