// The session listing of iscsiadm, taken in line by line, and the initiator ports and paths that it tells of.
#pragma once

#include "foundation/integers.hpp"
#include "foundation/map.hpp"
#include "foundation/zeb_string.hpp"
#include "main/shared/iscsi_model.hpp"

// What the host's initiator name and the listing say. A value of a session outlives it unless a line of the
// next one replaces or empties it. Every operation but take is traced.
class IscsiListing {
public:
    // Reads the initiator's name, for which the host's name stands in. Returns 0, or 5 when its file cannot
    // be opened. Throws NoMemoryEx, WriteFailedEx.
    uint32 readInitiatorIQN();

    // Takes in one line of the listing, which it changes. Throws what addIscsiPath throws.
    void processCmdOutput(char* line);

    // Claims the disk at the device path `devName` and adds it as a path of the current session, unless the
    // session lacks a name or address or the disk its LUN. Throws NoMemoryEx, ZebNotFoundEx, WriteFailedEx.
    void addIscsiPath(const ZebString& devName);

    // Hands over the ports, in the order of their discovery, each with its paths; the listing has none then.
    IscsiPorts::List takePorts();

private:
    static constexpr int32 kNoLun = -1;
    using PortsByName = ZebStringMap<ZebCountedPointer<IscsiInitiatorPort>>;

    ZebString initiatorPort() const;
    ZebCountedPointer<IscsiInitiatorPort> findOrAddPort(const ZebString& port);
    void addPath(const ZebString& port, const ZebString& lunId, const ZebString& devName);

    ZebString mTargetIqn{""};
    ZebString mTargetIp{""}; // the portal's address, without port
    ZebString mInitiatorIqn{""};
    ZebString mInitiatorIp{""};
    ZebString mInitiatorMac{""};
    bool mInDeviceList = false;
    int32 mCurrentLun = kNoLun;

    IscsiPorts::List mPorts;
    PortsByName::Map mPortsByName; // the same ports
};

// The first position at or behind `position` that holds neither a blank nor a tab.
char* skipBlanks(char* position);
// Ends the text at the first blank, tab, carriage return or line feed at or behind `position`, and returns
// `position`.
char* cutToken(char* position);
