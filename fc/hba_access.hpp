// The SNIA HBA API, call by call: each function writes a trace of its steps, turns a bad status into an
// exception and owns the records that it hands back until it returns them. All throw WriteFailedEx besides.
#pragma once

#include <cstddef>
#include <cstdlib>
#include <cstring>
#include <memory>
#include <string>
#include <vector>

#include "fc/hba_api.hpp"
#include "foundation/integers.hpp"
#include "foundation/zeb_string.hpp"

// The attributes of an adapter's ports, one separately allocated record a port.
class PortAttributes {
public:
    // Room for `count` records, none of them there yet; null inside when there is no memory.
    explicit PortAttributes(uint32 count);
    PortAttributes(const PortAttributes&) = delete;
    PortAttributes& operator=(const PortAttributes&) = delete;
    ~PortAttributes();

    uint32 count() const { return mCount; }
    bool hasRoom() const { return mRecords != nullptr; }
    // Makes every record. False when there is no memory.
    bool allocateRecords();
    HBA_PORTATTRIBUTES& operator[](uint32 index) { return *mRecords[index]; }
    const HBA_PORTATTRIBUTES& operator[](uint32 index) const { return *mRecords[index]; }

private:
    uint32 mCount;
    uint32 mMade = 0; // records that exist
    // Set up to the last record that exists: a count that a library made up costs no memory.
    HBA_PORTATTRIBUTES** mRecords = nullptr;
};

// A target mapping of either layout: one zeroed malloc block, an entry count and then the entries.
template <typename Mapping>
using MappingBlock = std::unique_ptr<Mapping, decltype(&std::free)>;

// Throws THbaapiEx "HBA_LoadLibrary failed".
void HA_LoadHbaapi();
void HA_FreeHbaapi();

uint32 HA_GetNumberOfAdapters();

// Fills `names`, which holds `count` strings. Throws THbaapiEx; names stored by then stay.
void HA_GetAdapterNames(uint32 count, std::vector<ZebString>& names);

// Opens the adapter of that name. The handle is the caller's to close. Throws THbaapiEx.
HBA_HANDLE HA_OpenAdapter(char* name);
void HA_CloseAdapter(HBA_HANDLE handle);

// An adapter's attributes, or null for an adapter that the library does not support. Throws THbaapiEx, and
// THaltEx when there is no memory or the adapter has no ports.
std::unique_ptr<HBA_ADAPTERATTRIBUTES> HA_GetAdapterAttributes(HBA_HANDLE handle);

// The attributes of all ports of `adapter`. Throws THbaapiEx, and THaltEx when there is no memory.
std::unique_ptr<PortAttributes> HA_GetAdapterPorts(HBA_HANDLE handle, const HBA_ADAPTERATTRIBUTES& adapter);

// An adapter's FCP target mapping; its count never exceeds what the block holds. Throws THbaapiEx, and
// THaltEx when there is no memory.
MappingBlock<HBA_FCPTARGETMAPPING> HA_GetTargetMappings(HBA_HANDLE handle);

// The size in bytes of a mapping block with room for `count` entries of type `Entry`, or 0 when no 32-bit
// program could have such a block. Both builds draw the line there, so that a count that a library made up
// gives the same log on both.
template <typename Mapping, typename Entry>
std::size_t mappingBlockSize(uint32 count) {
    constexpr uint64 kLargestBlock = 0x7FFFFFFF;
    const uint64 size = offsetof(Mapping, entry) + uint64{count} * sizeof(Entry);
    return size <= kLargestBlock ? static_cast<std::size_t>(size) : 0;
}

// A field of the library's records as text: up to its NUL, or all of it.
template <std::size_t Size>
std::string fieldText(const char (&field)[Size]) {
    return {field, strnlen(field, Size)};
}
