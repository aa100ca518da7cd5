// The file in which simhost hands the described adapters to the simulated vendor library. Both word sizes map
// the same file, so every field has the same place in both: 32-bit numbers and bytes only. In the file stand
// the header, then the adapters, ports, deviations and LUNs, as many of each as the header says.
#pragma once

#include <cstdint>

namespace simhost {

inline constexpr const char* kAdapterFilePath = "/.simhost/adapters";

struct AdapterFileHeader {
    std::uint32_t registerStatus;
    std::uint32_t loadStatus;
    std::uint32_t reportedAdapters;
    std::uint32_t adapters;
    std::uint32_t ports;
    std::uint32_t deviations;
    std::uint32_t luns;
};

// Where a list of one adapter begins among all adapters' lists, and how long it is.
struct AdapterFileRange {
    std::uint32_t first;
    std::uint32_t count;
};

struct AdapterFileAdapter {
    char name[256];
    char manufacturer[64];
    char model[256];
    std::uint8_t nodeWwn[8];
    std::uint32_t nameStatus;
    std::uint32_t opens;
    std::uint32_t attributesStatus;
    std::uint32_t numberOfPorts;
    AdapterFileRange ports;
    AdapterFileRange deviations;
    AdapterFileRange luns;
    std::uint32_t mappingCalls; // counted by the library, in its own copy of the page
};

struct AdapterFilePort {
    std::uint8_t portWwn[8];
    std::uint32_t status;
};

struct AdapterFileDeviation {
    std::uint32_t hasStatus;
    std::uint32_t status;
    std::uint32_t hasEntries;
    std::uint32_t entries;
};

struct AdapterFileLun {
    char device[256];
    std::uint32_t bus;
    std::uint32_t target;
    std::uint32_t lun;
    std::uint32_t fcId;
    std::uint8_t nodeWwn[8];
    std::uint8_t portWwn[8];
    std::uint32_t fcpLunLow;
    std::uint32_t fcpLunHigh;
};

} // namespace simhost
