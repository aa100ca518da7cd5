// Whether PowerPath multipathing is active, and which pseudo device stands for each logical unit.
#pragma once

#include "foundation/list.hpp"
#include "foundation/map.hpp"
#include "foundation/zeb_string.hpp"

// Knows what two commands say: the check for the daemon emcpd, and powermt's listing of its devices. Every
// operation is traced.
class ZebSensorLinuxPowerPathHandler {
public:
    using LineList = ZebList<ZebString>;
    using PseudoDeviceMap = ZebStringMap<ZebString>;

    ZebSensorLinuxPowerPathHandler() = default;
    ZebSensorLinuxPowerPathHandler(const ZebSensorLinuxPowerPathHandler&) = delete;
    ZebSensorLinuxPowerPathHandler& operator=(const ZebSensorLinuxPowerPathHandler&) = delete;
    virtual ~ZebSensorLinuxPowerPathHandler() = default;

    // Finds out whether PowerPath runs and, if so, its devices. Throws ReadFailedEx, NoMemoryEx,
    // ClibSleepFailedEx. A listing line without "=" is fatal.
    void sense();

    bool isRunning() const; // what the last sense() found

    // Senses again and, when PowerPath runs, logs its devices in the order of their identifiers. Throws as
    // sense().
    void printData();

    // The pseudo device of logical unit `ulid`, owned by the handler. Throws NotFoundEx "Element not
    // found\n".
    const ZebString& getPseudoDevice(const ZebString& ulid) const;

    // Runs a shell command and appends its complete output lines, without their line feeds. Throws
    // ReadFailedEx, NoMemoryEx.
    static void sExecuteCommand(const char* command, LineList::List& lines);

    // Room for one read of a command's output and its NUL.
    static constexpr unsigned kOutputSize = 4000;

    // Moves the complete lines out of the NUL-terminated `buffer` (kOutputSize bytes, changed) and an
    // incomplete rest to its start. Returns where the next read goes. Throws NoMemoryEx.
    static char* sBreakOutput(char* buffer, LineList::List& lines);

    // Takes the listing's lines two by two: a pseudo device, then its logical unit's identifier.
    // NOLINTNEXTLINE(bugprone-reserved-identifier,cert-dcl37-c,cert-dcl51-cpp): the name that the trace shows
    void __parse(LineList::List& arOutput);

    // Takes the front line; its text behind the first "=" is the value. Fatal when there is none of either.
    static void sParseOutputLine(LineList::List& arOutput, ZebString& valueOut);

private:
    bool mIsRunning = false;
    PseudoDeviceMap::Map mPseudoDevices; // identifier (ULID) -> pseudo device
};
