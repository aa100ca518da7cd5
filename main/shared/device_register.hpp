// The register of device names that a tree has claimed, which is how a later tree leaves them out.
#pragma once

#include "foundation/integers.hpp"
#include "foundation/map.hpp"
#include "foundation/zeb_string.hpp"

// The trees, one bit each.
enum : uint32 {
    TREE_FC = 1,
    TREE_DAS = 2,
    TREE_ISCSI = 4,
    TREE_LOGICAL = 8 // reported, never registered
};

// EmulexHash of the device name -> device name (such as /dev/sdb) -> code of the tree that claimed it first.
extern ZebTwoLevelMap<uint32>::Map DevMap;

// The 32-bit hash of a NUL-terminated name: MurmurHash2 in structure, with a multiplier and a seed of its
// own.
uint32 EmulexHash(const char* name);

// Registers `name` for tree `type`, unless a tree has it already, and logs the line that says so in either
// case. Throws ZebNotFoundEx "No Memory".
void addDeviceNameMap(uint32 type, const ZebString& name);

// The code of the tree that claimed `name`, or 0.
uint32 getDeviceType(const ZebString& name);
