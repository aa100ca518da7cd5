// Result codes of a run, for diagnostics.
#pragma once

#include "foundation/integers.hpp"

// The name of result code 0 to 3: "Success", "Generic Error", "Hbaapi Error", "Not Implemented". Any larger
// code is "Invalid Status Code\n", "No Tree" (4) included.
const char* getStatusString(uint32 code);
