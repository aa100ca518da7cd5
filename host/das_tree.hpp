// The DAS tree: every disk of /sys/block that is not virtual and that no earlier tree has claimed.
#pragma once

#include "foundation/integers.hpp"

// Writes the tree's banner and reports the disks. Throws WriteFailedEx and what the report throws.
void BuildDasTree_Linux();

// Reports the disks of /sys/block in directory order. Returns 0, or 5 when it cannot be opened.
uint32 gatherDasInfo();
