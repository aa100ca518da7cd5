// The logical tree: every block device of /proc/partitions that no earlier tree has claimed.
#pragma once

#include "foundation/integers.hpp"

// Writes the tree's banner and reports the devices. Throws WriteFailedEx.
void BuildLogicalTree_Linux();

// Reports the devices of /proc/partitions. Returns 0, or 7 when anything failed on the way.
uint32 gatherLogicalInfo();
