// What all trees of one run share besides the log stream. One instance each, alive until exit.
#pragma once

#include "multipath/powerpath.hpp"

// The host's name: 256 zeroed bytes from the entry's start to its end, empty until the FC tree is done.
extern char* gHostName;
constexpr unsigned kHostNameSize = 256;

// Knows whether PowerPath runs, and its pseudo device of each logical unit.
extern ZebSensorLinuxPowerPathHandler gPowerPath;
