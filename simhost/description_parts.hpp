// The parts that a description is read in: each function takes its own keys of the host's table, which are
// known from then on, and throws DescriptionError for what it cannot use.
#pragma once

#include <cstddef>
#include <map>
#include <optional>
#include <string>
#include <vector>

#include "simhost/description.hpp"
#include "simhost/toml_reader.hpp"

namespace simhost {

// The entries of /sys/block, from `sys_block`, in reading order; none = there is no /sys/block.
std::optional<std::vector<BlockEntry>> sysBlockOf(Keys& host);

// The host's files by absolute path, from `partitions` and `files`. /proc/partitions is always among them.
std::map<std::string, File> filesOf(Keys& host);

// What each command answers, by its absolute path and by call, from `commands`. A command that is not among
// them is not there.
std::map<std::string, std::vector<CommandAnswer>> commandsOf(Keys& host);

// The disks, from `disk`, in their order, with every answer composed to bytes.
std::vector<Disk> disksOf(Keys& host);

// The Fibre Channel adapters, from `adapter`, in the library's order.
std::vector<Adapter> adaptersOf(Keys& host);

// The vendor library that reports so many adapters, from `fc`; none when neither it nor an adapter is
// described.
std::optional<VendorLibrary> vendorLibraryOf(Keys& host, std::size_t adapters);

// What the kernel and multipath may remember of `described`, from `memory`; when nothing is said, all as it
// is.
std::vector<Memory> memoriesOf(Keys& host, const Host& described);

} // namespace simhost
