// What all trees of one run share besides the log stream. One instance each, alive until exit.
#pragma once

#include "multipath/powerpath.hpp"

// The host's name: 256 zeroed bytes from the entry's start to its end, empty until the FC tree is done.
extern char* gHostName;
constexpr unsigned kHostNameSize = 256;

// Set by HA_GetScsiUniqueLunId when it accepts a device of request flag 2 without an identifier; read and
// cleared by the report of that device.
extern bool gDirectAttachedFlag;

// Knows whether PowerPath runs, and its pseudo device of each logical unit.
extern ZebSensorLinuxPowerPathHandler gPowerPath;
