// The report of the iSCSI, DAS and logical trees.
#pragma once

#include "foundation/integers.hpp"

// Writes to the log, by tree:
//  - TREE_ISCSI: every path of gIscsiPortList; `name` is not looked at;
//  - TREE_DAS: the line of one disk, unless it is claimed already or has no identifier; `name` is its entry
//  of
//    /sys/block, whose first '!' becomes '/' in place; claims the disk;
//  - TREE_LOGICAL: the line of one block device, unless it is claimed already; `name` as in /proc/partitions.
// Any other type does nothing. Throws WriteFailedEx "File write failed" and what the register throws.
void printDeviceTree(int32 type, char* name);
