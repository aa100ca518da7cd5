#include "simhost/record.hpp"

#include <fcntl.h>

#include <string_view>

namespace simhost {

Record::Record(const std::filesystem::path& path)
    : mFile(check(::open(path.c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_APPEND | O_CLOEXEC, 0644), path)) {}

void Record::sgIo(const std::string& node, const SgRequest& request,
                  std::span<const std::uint8_t> cdb) const {
    if (!mFile) {
        return;
    }
    std::string line = "SG_IO " + node + " cdb=";
    constexpr std::string_view kDigits = "0123456789abcdef";
    for (const std::uint8_t byte : cdb) {
        line += kDigits[byte >> 4U];
        line += kDigits[byte & 0xfU];
    }
    line += " dxfer_len=" + std::to_string(request.transferLength) +
            " dxfer_direction=" + std::to_string(request.direction) +
            " mx_sb_len=" + std::to_string(request.senseRoom) +
            " timeout=" + std::to_string(request.timeout) + "\n";
    check(::write(mFile.get(), line.data(), line.size()), "writing the record");
}

} // namespace simhost
