#include "view/kernel/block_devices.hpp"

#include <algorithm>
#include <charconv>
#include <map>
#include <stdexcept>
#include <string_view>
#include <utility>

namespace view {

namespace {

constexpr std::size_t kPageLimit = 4 + 0xffff;        // a VPD page with its header
constexpr std::size_t kStatisticsLimit = 16U << 20U;  // /proc/stat has a number for each interrupt
constexpr std::size_t kUdevLimit = 1U << 20U;         // what udev noted of a device
constexpr std::string_view kMultipathMark = "mpath-"; // of a map's UUID
constexpr std::int64_t kMicrosecondsPerSecond = 1000000;

std::string lastName(const std::string& folder) {
    return folder.substr(folder.rfind('/') + 1);
}

// The whole of `text` as a number.
std::optional<std::uint64_t> wholeNumber(std::string_view text) {
    std::uint64_t number = 0;
    const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), number);
    if (error != std::errc() || end != text.data() + text.size()) {
        return std::nullopt;
    }
    return number;
}

// Whether a name is `prefix` and a number behind it.
bool isNumbered(std::string_view name, std::string_view prefix) {
    return name.starts_with(prefix) && wholeNumber(name.substr(prefix.size())).has_value();
}

// The value of the first line that begins with `key`, a number that ends its line.
std::optional<std::uint64_t> numberBehind(std::string_view text, std::string_view key) {
    for (std::size_t begin = 0; begin < text.size();) {
        const std::size_t end = std::min(text.find('\n', begin), text.size());
        const std::string_view line = text.substr(begin, end - begin);
        if (line.starts_with(key)) {
            return wholeNumber(line.substr(key.size()));
        }
        begin = end + 1;
    }
    return std::nullopt;
}

// The LUN of a SCSI address, host:channel:target:LUN; nothing for any other name.
std::optional<std::uint64_t> lunOf(std::string_view address) {
    std::optional<std::uint64_t> last;
    for (int part = 0; part < 4; ++part) {
        const std::size_t end = part == 3 ? address.size() : address.find(':');
        if (end == std::string_view::npos || !(last = wholeNumber(address.substr(0, end)))) {
            return std::nullopt;
        }
        address.remove_prefix(std::min(end + 1, address.size()));
    }
    return last;
}

// Reads the block devices one after the other. What they share, ports and sessions, is read once.
class DeviceReader {
public:
    DeviceReader(HostTree& tree, std::optional<std::int64_t> bootTime) : mTree(tree), mBootTime(bootTime) {}

    void read(Kernel& kernel, const std::string& entry) {
        const auto block = mTree.folder("sys/block", entry);
        if (!block) {
            return;
        }
        if (const auto dm = mTree.folder(*block, "dm")) {
            addMap(kernel, *block, *dm);
            return;
        }
        const auto device = mTree.folder(*block, "device");
        if (device && !isHidden(entry)) {
            kernel.disks.push_back(disk(entry, *block, *device));
        }
    }

private:
    struct Transport {
        std::string initiatorPort, targetPort, portState;
        std::string targetIqn, sessionState;
        std::vector<std::string> targetAddresses;
    };

    // Whether an entry is one path of an NVMe namespace, "nvme0c1n1", which has no device node: the namespace
    // stands for all of them.
    static bool isHidden(std::string_view entry) {
        const std::size_t controller = entry.find('c');
        return entry.starts_with("nvme") && controller != std::string_view::npos &&
               wholeNumber(entry.substr(4, controller - 4)).has_value();
    }

    // The block devices that a folder of one has links to; nothing else there is one.
    std::vector<std::string> linked(const std::string& block, const std::string& name) {
        std::vector<std::string> names;
        if (const auto folder = mTree.folder(block, name)) {
            for (const std::string& entry : mTree.list(*folder)) {
                if (mTree.folder(*folder, entry)) {
                    names.push_back(entry);
                }
            }
        }
        return names;
    }

    void addMap(Kernel& kernel, const std::string& block, const std::string& dm) {
        const std::string uuid = mTree.line(dm, "uuid");
        if (uuid.starts_with(kMultipathMark)) {
            kernel.maps.push_back({lastName(block), mTree.line(dm, "name"),
                                   uuid.substr(kMultipathMark.size()), linked(block, "slaves")});
        }
    }

    KernelDisk disk(const std::string& entry, const std::string& block, const std::string& device) {
        KernelDisk disk;
        disk.name = entry;
        disk.holders = linked(block, "holders");
        disk.knownSince = knownSince(block);
        disk.lun = lunOf(lastName(device));
        if (disk.lun) {
            disk.scsiAddress = lastName(device);
        }
        disk.vendor = mTree.line(device, "vendor");
        disk.model = mTree.line(device, "model");
        disk.isScsi = disk.lun || (!disk.vendor.empty() && !disk.model.empty());
        disk.state = mTree.line(device, "state");
        if (!disk.isScsi) {
            disk.wwid = mTree.line(block, "wwid");
            addNvmePaths(disk, device);
            return disk;
        }
        disk.wwid = mTree.line(device, "wwid");
        if (const auto page = mTree.read(device, "vpd_pg83", kPageLimit); page && !page->empty()) {
            disk.page83.emplace(page->begin(), page->end());
        }
        const Transport& transport = transportOf(device);
        disk.initiatorPort = transport.initiatorPort;
        disk.targetPort = transport.targetPort;
        disk.portState = transport.portState;
        disk.targetIqn = transport.targetIqn;
        disk.targetAddresses = transport.targetAddresses;
        disk.sessionState = transport.sessionState;
        return disk;
    }

    // udev notes how many microseconds after the boot it had a device ready.
    std::optional<std::int64_t> knownSince(const std::string& block) {
        const std::string number = mTree.line(block, "dev"); // major:minor
        if (!mBootTime || number.empty() || number.find('/') != std::string::npos) {
            return std::nullopt;
        }
        const auto noted = mTree.folder("", "run/udev/data");
        const auto data = noted ? mTree.read(*noted, "b" + number, kUdevLimit) : std::nullopt;
        const auto age = data ? numberBehind(*data, "I:") : std::nullopt;
        if (!age) {
            return std::nullopt;
        }
        return *mBootTime + static_cast<std::int64_t>(*age / kMicrosecondsPerSecond);
    }

    // Below a SCSI device's own folder stand, from the innermost, its target, the remote port or the session,
    // the host adapter.
    const Transport& transportOf(const std::string& device) {
        const std::string target = device.substr(0, device.rfind('/'));
        const auto [place, isNew] = mTransports.try_emplace(target);
        if (isNew) {
            for (std::string folder = target; folder.find('/') != std::string::npos;
                 folder.resize(folder.rfind('/'))) {
                addTransport(place->second, folder);
            }
        }
        return place->second;
    }

    void addTransport(Transport& transport, const std::string& folder) {
        const std::string name = lastName(folder);
        if (name.starts_with("rport-")) {
            if (const auto port = mTree.folder(folder, "fc_remote_ports/" + name)) {
                transport.targetPort = mTree.line(*port, "port_name");
                transport.portState = mTree.line(*port, "port_state");
            }
        } else if (isNumbered(name, "host")) {
            if (const auto host = mTree.folder(folder, "fc_host/" + name)) {
                transport.initiatorPort = mTree.line(*host, "port_name");
            }
        } else if (isNumbered(name, "session")) {
            addSession(transport, folder, name);
        }
    }

    void addSession(Transport& transport, const std::string& folder, const std::string& name) {
        if (const auto session = mTree.folder(folder, "iscsi_session/" + name)) {
            transport.targetIqn = mTree.line(*session, "targetname");
            transport.sessionState = mTree.line(*session, "state");
        }
        for (const std::string& entry : mTree.list(folder)) {
            if (!entry.starts_with("connection")) {
                continue;
            }
            const auto parent = mTree.folder(folder, entry + "/iscsi_connection");
            if (const auto connection = parent ? mTree.folder(*parent, entry) : std::nullopt) {
                for (const char* file : {"address", "persistent_address"}) {
                    if (std::string address = mTree.line(*connection, file); !address.empty()) {
                        transport.targetAddresses.push_back(std::move(address));
                    }
                }
            }
        }
    }

    // `device` is the namespace's controller or, where the kernel joins several, their subsystem.
    void addNvmePaths(KernelDisk& disk, const std::string& device) {
        if (isNumbered(lastName(device), "nvme")) {
            disk.nvmePaths.push_back({lastName(device), std::exchange(disk.state, {})});
            return;
        }
        if (!isNumbered(lastName(device), "nvme-subsys")) {
            return;
        }
        for (const std::string& entry : mTree.list(device)) {
            if (isNumbered(entry, "nvme")) {
                if (const auto controller = mTree.folder(device, entry)) {
                    disk.nvmePaths.push_back({entry, mTree.line(*controller, "state")});
                }
            }
        }
    }

    HostTree& mTree;
    std::optional<std::int64_t> mBootTime;
    std::map<std::string, Transport> mTransports; // by the folder of the target
};

} // namespace

std::string hostNameOf(HostTree& tree) {
    const auto folder = tree.folder("", "proc/sys/kernel");
    return folder ? tree.line(*folder, "hostname") : "";
}

Kernel readKernel(HostTree& tree) {
    const auto block = tree.folder("", "sys/block");
    if (!block) {
        throw std::runtime_error("there is no sys/block in it: neither the root of a host nor a recording");
    }
    Kernel kernel;
    kernel.host = hostNameOf(tree);
    if (const auto folder = tree.folder("", "proc")) {
        if (const auto statistics = tree.read(*folder, "stat", kStatisticsLimit)) {
            if (const auto seconds = numberBehind(*statistics, "btime ")) {
                kernel.bootTime = static_cast<std::int64_t>(*seconds);
            }
        }
    }
    DeviceReader reader(tree, kernel.bootTime);
    for (const std::string& entry : tree.list(*block)) {
        reader.read(kernel, entry);
    }
    return kernel;
}

} // namespace view
