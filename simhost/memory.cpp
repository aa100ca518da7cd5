#include "simhost/memory.hpp"

#include <algorithm>
#include <cerrno>
#include <fstream>
#include <map>
#include <system_error>
#include <utility>

namespace simhost {
namespace {

namespace fs = std::filesystem;

constexpr int kPage83 = 0x83;
constexpr int kFirstMap = 10; // the number of the first map's device; below are those of logical volumes
constexpr std::uint64_t kMicrosecondsPerSecond = 1000000;

void writeFile(const fs::path& path, const Bytes& content) {
    fs::create_directories(path.parent_path());
    errno = 0;
    std::ofstream file(path, std::ios::binary);
    file << content;
    file.close();
    if (!file) {
        throw std::system_error(errno, std::generic_category(), "writing " + path.string());
    }
}

// A link to a folder of the same root, made where it stands.
void link(const fs::path& root, const fs::path& from, const fs::path& to) {
    fs::create_directories((root / from).parent_path());
    fs::create_directories(root / to);
    fs::create_directory_symlink(to.lexically_relative(from.parent_path()), root / from);
}

// The name in /sys/block of a device node.
std::string kernelName(const std::string& node) {
    std::string name = node.substr(std::string("/dev/").size());
    std::replace(name.begin(), name.end(), '/', '!');
    return name;
}

std::string hexWwn(const Wwn& wwn) {
    constexpr const char* kDigits = "0123456789abcdef";
    std::string text = "0x";
    for (const std::uint8_t byte : wwn) {
        text += kDigits[byte >> 4U];
        text += kDigits[byte & 0xfU];
    }
    return text;
}

Bytes fieldOf(const Disk& disk, std::size_t offset, std::size_t length) {
    const Bytes& standard = disk.answers.at(kStandardInquiry);
    return standard.size() < offset + length ? Bytes(length, ' ') : standard.substr(offset, length);
}

// The page that the kernel keeps: as long as its header says, and only if it is one.
Bytes pageOf(const Disk& disk) {
    const auto answer = disk.answers.find(kPage83);
    if (answer == disk.answers.end() || answer->second.size() < 4 || answer->second[1] != '\x83') {
        return {};
    }
    const Bytes& page = answer->second;
    const std::size_t length = static_cast<std::size_t>(static_cast<unsigned char>(page[2])) * 256 +
                               static_cast<unsigned char>(page[3]);
    return page.substr(0, 4 + length);
}

class Writer {
public:
    Writer(const Host& host, const Memory& memory, fs::path root)
        : mHost(host), mMemory(memory), mRoot(std::move(root)) {
        for (const Adapter& adapter : host.adapters) {
            for (const MappedLun& lun : adapter.luns) {
                mLuns.try_emplace(lun.device, &lun);
            }
        }
    }

    void write() {
        fs::create_directories(mRoot / "sys/block");
        writeFile(mRoot / "proc/sys/kernel/hostname", mMemory.hostName + "\n");
        writeFile(mRoot / "proc/stat", "cpu  0 0 0 0\nbtime " + std::to_string(mMemory.bootTime) + "\n");
        for (const Disk& disk : mHost.disks) {
            for (const std::string& node : disk.nodes) {
                addDisk(disk, node);
            }
        }
        int number = kFirstMap;
        for (const RememberedMap& map : mMemory.maps) {
            addMap(map, "dm-" + std::to_string(number++));
        }
        if (mMemory.listed) {
            writeFile(mRoot / "MorvaneLogs/maps.json", *mMemory.listed);
        }
    }

private:
    RememberedDisk rememberedOf(const std::string& node) const {
        const auto found = mMemory.disks.find(node);
        RememberedDisk remembered = found == mMemory.disks.end() ? RememberedDisk() : found->second;
        if (remembered.name.empty()) {
            remembered.name = kernelName(node);
        }
        return remembered;
    }

    // The folder of a node's device, ending in its SCSI address if it has one: where /sys/block has it or, if
    // it is not there, below the ports of its mapping.
    fs::path deviceOf(const std::string& node) {
        if (mHost.sysBlock) {
            for (const BlockEntry& entry : *mHost.sysBlock) {
                if (entry.name == kernelName(node) && entry.kind == BlockEntry::Kind::Link) {
                    const fs::path block = (fs::path("sys/block") / entry.target).lexically_normal();
                    if (block.parent_path().filename() == "block" && block.begin()->string() == "sys") {
                        return block.parent_path().parent_path();
                    }
                }
            }
        }
        const auto mapped = mLuns.find(node);
        if (mapped == mLuns.end()) {
            const std::string number = std::to_string(mUnplaced++);
            return "sys/devices/simhost/host0/target0:0:" + number + "/0:0:" + number + ":0";
        }
        // Each node has a port of its own, so that LUNs of a number can be told apart.
        const MappedLun& lun = *mapped->second;
        const std::string port = "1:0-" + std::to_string(mUnplaced);
        const std::string target = "1:0:" + std::to_string(mUnplaced++);
        return fs::path("sys/devices/simhost/host1") / ("rport-" + port) / ("target" + target) /
               (target + ":" + std::to_string(lun.lun));
    }

    void addDisk(const Disk& disk, const std::string& node) {
        const RememberedDisk remembered = rememberedOf(node);
        const fs::path device = deviceOf(node);
        if (remembered.isMissing) {
            return;
        }
        const fs::path block = device / "block" / remembered.name;
        link(mRoot, fs::path("sys/block") / remembered.name, block);
        link(mRoot, block / "device", device);
        fs::create_directories(mRoot / block / "holders");
        mBlocks[node] = block;
        if (remembered.isScsi) {
            addScsi(disk, device, remembered);
        }
        if (remembered.since) {
            const std::string number = "8:" + std::to_string(mBlocks.size());
            writeFile(mRoot / block / "dev", number + "\n");
            writeFile(mRoot / "run/udev/data" / ("b" + number),
                      "I:" + std::to_string(*remembered.since * kMicrosecondsPerSecond) + "\n");
        }
        for (fs::path folder = device; !folder.empty(); folder = folder.parent_path()) {
            addTransport(folder, node, remembered);
        }
    }

    void addScsi(const Disk& disk, const fs::path& device, const RememberedDisk& remembered) {
        writeFile(mRoot / device / "vendor", fieldOf(disk, 8, 8) + "\n");
        writeFile(mRoot / device / "model", fieldOf(disk, 16, 16) + "\n");
        writeFile(mRoot / device / "state", remembered.state + "\n");
        const Bytes page = remembered.page.value_or(pageOf(disk));
        if (remembered.hasPage && !page.empty()) {
            writeFile(mRoot / device / "vpd_pg83", page);
        }
        if (!remembered.wwid.empty()) {
            writeFile(mRoot / device / "wwid", remembered.wwid + "\n");
        }
    }

    void addTransport(const fs::path& folder, const std::string& node, const RememberedDisk& remembered) {
        const std::string name = folder.filename();
        const auto mapped = mLuns.find(node);
        if (name.rfind("rport-", 0) == 0 && mapped != mLuns.end()) {
            const fs::path port = mRoot / folder / "fc_remote_ports" / name;
            writeFile(port / "port_name", hexWwn(mapped->second->portWwn) + "\n");
            writeFile(port / "port_state", remembered.portState + "\n");
        }
        if (const auto port = mMemory.hostPorts.find(name); port != mMemory.hostPorts.end()) {
            writeFile(mRoot / folder / "fc_host" / name / "port_name", port->second + "\n");
        }
        for (const RememberedSession& session : mMemory.sessions) {
            if (name == session.name) {
                const fs::path place = mRoot / folder / "iscsi_session" / name;
                writeFile(place / "targetname", session.target + "\n");
                writeFile(place / "state", session.state + "\n");
                const std::string connection =
                    "connection" + name.substr(name.find_first_of("0123456789")) + ":0";
                writeFile(mRoot / folder / connection / "iscsi_connection" / connection / "address",
                          session.address + "\n");
            }
        }
    }

    void addMap(const RememberedMap& map, const std::string& device) {
        const fs::path block = fs::path("sys/devices/virtual/block") / device;
        link(mRoot, fs::path("sys/block") / device, block);
        writeFile(mRoot / block / "dm/name", map.name + "\n");
        writeFile(mRoot / block / "dm/uuid", map.uuid + "\n");
        fs::create_directories(mRoot / block / "slaves");
        for (const std::string& node : map.paths) {
            if (const auto path = mBlocks.find(node); path != mBlocks.end()) {
                link(mRoot, block / "slaves" / path->second.filename(), path->second);
                link(mRoot, path->second / "holders" / device, block);
            }
        }
    }

    const Host& mHost;
    const Memory& mMemory;
    fs::path mRoot;
    std::map<std::string, const MappedLun*> mLuns; // by device node
    std::map<std::string, fs::path> mBlocks;       // by device node
    unsigned mUnplaced = 0;
};

} // namespace

void writeMemories(const Host& host, const fs::path& folder) {
    if (fs::exists(folder) && !fs::is_empty(folder)) {
        throw std::system_error(ENOTEMPTY, std::generic_category(), folder.string());
    }
    for (const Memory& memory : host.memories) {
        Writer(host, memory, folder / memory.name).write();
    }
}

} // namespace simhost
