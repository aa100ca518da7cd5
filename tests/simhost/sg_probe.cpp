// Sends SCSI commands to the named nodes and prints, a line each, what came back. Built for both word sizes.
// Usage: sg_probe NODE CDB [NODE CDB ...], each CDB in hex.
#include <fcntl.h>
#include <scsi/sg.h>
#include <sys/ioctl.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>

namespace {

constexpr unsigned char kUntouched = 0xee; // what the buffers hold before the command

std::string hexOf(const unsigned char* bytes, std::size_t count) {
    std::string text;
    constexpr char kDigits[] = "0123456789abcdef";
    for (std::size_t i = 0; i < count; ++i) {
        text += kDigits[bytes[i] >> 4U];
        text += kDigits[bytes[i] & 0xfU];
    }
    return text;
}

// How many bytes from the start were written.
std::size_t writtenOf(const unsigned char* bytes, std::size_t size) {
    while (size > 0 && bytes[size - 1] == kUntouched) {
        --size;
    }
    return size;
}

void send(const char* node, const std::string& cdbText) {
    const int file = ::open(node, O_RDONLY | O_NONBLOCK);
    if (file < 0) {
        std::printf("%s: open: %s\n", node, std::strerror(errno));
        return;
    }
    unsigned char cdb[32] = {};
    const std::size_t length = cdbText.size() / 2;
    for (std::size_t i = 0; i < length; ++i) {
        cdb[i] = static_cast<unsigned char>(std::strtoul(cdbText.substr(2 * i, 2).c_str(), nullptr, 16));
    }
    unsigned char data[64];
    unsigned char sense[32];
    std::memset(data, kUntouched, sizeof data);
    std::memset(sense, kUntouched, sizeof sense);
    sg_io_hdr header{};
    header.interface_id = 'S';
    header.dxfer_direction = SG_DXFER_FROM_DEV;
    header.cmd_len = static_cast<unsigned char>(length);
    header.mx_sb_len = sizeof sense;
    header.dxfer_len = sizeof data;
    header.dxferp = data;
    header.cmdp = cdb;
    header.sbp = sense;
    header.timeout = 1500;
    if (::ioctl(file, SG_IO, &header) < 0) {
        std::printf("%s: ioctl: %s\n", node, std::strerror(errno));
    } else {
        std::printf("%s: status %d host %d driver %d resid %d sense %d:%s data %s\n", node, header.status,
                    header.host_status, header.driver_status, header.resid, header.sb_len_wr,
                    hexOf(sense, writtenOf(sense, sizeof sense)).c_str(),
                    hexOf(data, writtenOf(data, sizeof data)).c_str());
    }
    ::close(file);
}

} // namespace

int main(int argumentCount, char** arguments) {
    for (int i = 1; i + 1 < argumentCount; i += 2) {
        send(arguments[i], arguments[i + 1]);
    }
}
