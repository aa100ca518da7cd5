// The file system of a simulated host: the real machine's, with what the description speaks of replaced.
#pragma once

#include <filesystem>
#include <string>

#include "simhost/description.hpp"

namespace simhost {

// The helper programs that stand beside simhost's own file.
struct Helpers {
    std::filesystem::path command;         // answers for iscsiadm, pgrep and powermt
    std::filesystem::path vendorLibrary64; // the simulated HBA vendor library
    std::filesystem::path vendorLibrary32;
};

// Makes the calling process's root the simulated host's. The process must be the first of its PID namespace
// and have mount and UTS namespaces of its own: nothing outside of them changes. The working directory stays.
// An empty `record` or `keep` is no record and no copy. Throws std::system_error or
// std::filesystem::filesystem_error.
void enterWorld(const Host& host, const Helpers& helpers, const std::filesystem::path& record,
                const std::filesystem::path& keep);

} // namespace simhost
