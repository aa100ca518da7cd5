// The record of what the program asked of the simulated host; README.md gives its lines.
#pragma once

#include <cstdint>
#include <filesystem>
#include <span>
#include <string>

#include "simhost/file_descriptor.hpp"
#include "simhost/sg_header.hpp"

namespace simhost {

class Record {
public:
    // Records nothing.
    Record() = default;

    // Records to a new file; throws std::system_error. The simulated commands append to the same file, so
    // each line is written at once.
    explicit Record(const std::filesystem::path& path);

    // An SG_IO on a node ("-" for something else).
    void sgIo(const std::string& node, const SgRequest& request, std::span<const std::uint8_t> cdb) const;

private:
    FileDescriptor mFile;
};

} // namespace simhost
