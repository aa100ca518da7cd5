// The last word on whether a disk is directly attached, for the report of the disks.
#pragma once

#include "foundation/integers.hpp"
#include "foundation/zeb_string.hpp"

// 1 when the disk at the device path `devName` (such as /dev/sdb) is to be treated as directly attached, 0
// when it has an FC transport. Throws NoMemoryEx "No Memory\n", WriteFailedEx.
uint32 reconfirmDAS(const ZebString& devName);
