// A simulated host as its TOML file describes it. README.md defines the format; this is its content, with
// every default filled in, every repetition unrolled and every answer of a disk composed to bytes.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <filesystem>
#include <map>
#include <optional>
#include <stdexcept>
#include <string>
#include <vector>

namespace simhost {

// Bytes that need not be text; a string because most of them are.
using Bytes = std::string;

// A description that cannot be used. The message names the file, the place in it and what is wrong.
class DescriptionError : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

// An entry of /sys/block.
struct BlockEntry {
    enum class Kind { Link, DirectoryWithDevice, File, Directory, Fifo, Socket };
    std::string name;
    Kind kind = Kind::Link;
    std::string target; // of the link, or of the directory's link "device"
};

// One file of the host.
struct File {
    enum class Kind { Content, OpenError, ReadError, Link, Missing };
    Kind kind = Kind::Content;
    Bytes content; // or the link's target
};

// What one call of a command prints, and how it ends.
struct CommandAnswer {
    Bytes output;
    Bytes error;
    int status = 0;
};

// The command that a disk was sent, as faults and answers tell commands apart: a VPD page by its number.
constexpr int kStandardInquiry = -1;
constexpr int kOtherCommand = -2; // not INQUIRY, or an INQUIRY that no device accepts

// A deviation from what a disk would answer.
struct Fault {
    std::optional<int> command;      // the command that it meets; none = every command
    std::uint32_t first = 1;         // of those, the first that it meets, counted from 1
    std::uint32_t last = UINT32_MAX; // and the last
    int errorNumber = 0;             // the ioctl fails with it, unless 0
    std::uint32_t delayMilliseconds = 0;
    bool failed = false; // a status, driver status, host status or sense is given
    std::uint8_t status = 0;
    std::uint16_t hostStatus = 0;
    std::uint16_t driverStatus = 0;
    Bytes sense;
    std::optional<std::uint8_t> senseLength;
    std::optional<Bytes> data;
    std::optional<std::int32_t> resid;
};

struct Disk {
    enum class Open { Succeeds, NoEntry, NoDevice, LinkLoop };
    std::vector<std::string> nodes; // absolute paths
    Open open = Open::Succeeds;
    std::map<int, Bytes> answers; // by command; a command without one is refused
    bool ignoresAllocationLength = false;
    std::vector<Fault> faults;
};

using Wwn = std::array<std::uint8_t, 8>;

// One entry of an adapter's FCP target mapping.
struct MappedLun {
    Bytes device;
    std::uint32_t bus = 0;
    std::uint32_t target = 0;
    std::uint32_t lun = 0;
    std::uint32_t fcId = 0;
    Wwn nodeWwn{};
    Wwn portWwn{};
    std::uint64_t fcpLun = 0;
};

// What one call of HBA_GetFcpTargetMapping reports other than the truth.
struct MappingDeviation {
    std::optional<std::uint32_t> status;
    std::optional<std::uint32_t> entries;
};

struct Adapter {
    Bytes name;
    Bytes manufacturer;
    Bytes model;
    Wwn nodeWwn{};
    std::vector<Wwn> ports;
    std::uint32_t nameStatus = 0;
    bool opens = true;
    std::uint32_t attributesStatus = 0;
    std::uint32_t numberOfPorts = 0;
    std::vector<std::uint32_t> portStatus; // by port; as long as the longer of the two lists
    std::vector<MappingDeviation> mapping; // by call
    std::vector<MappedLun> luns;
};

// The simulated HBA vendor library as a whole.
struct VendorLibrary {
    std::uint32_t loadStatus = 0;
    std::uint32_t registerStatus = 0;
    std::uint32_t numberOfAdapters = 0;
};

// What the kernel remembers of a device node otherwise than the disk now answers.
struct RememberedDisk {
    std::string name;          // of the node as it is now: "sdc"; empty = the node's own
    bool isMissing = false;    // the kernel has no such device
    bool isScsi = true;        // the driver speaks SCSI, so that the kernel has asked who it is
    bool hasPage = true;       // page 0x83 is kept; not before Linux 3.15
    std::optional<Bytes> page; // in place of the disk's own
    std::string wwid;          // empty = there is none
    std::string state = "running";
    std::string portState = "Online";   // of a Fibre Channel target port
    std::optional<std::uint64_t> since; // seconds after the boot at which udev had it ready
};

// A multipath map.
struct RememberedMap {
    std::string name;
    std::string uuid;
    std::vector<std::string> paths; // device nodes
};

// An iSCSI session, as the folder in which the kernel keeps it.
struct RememberedSession {
    std::string name; // "session1"
    std::string target;
    std::string address;
    std::string state;
};

// What the host's kernel, udev and multipath remember; what is not said is as the host is.
struct Memory {
    std::string name; // that tells it from others of the host
    std::string hostName;
    std::uint64_t bootTime = 0;                   // seconds since the epoch
    std::map<std::string, RememberedDisk> disks;  // by device node
    std::map<std::string, std::string> hostPorts; // port WWN by the host adapter's folder: "host2"
    std::vector<RememberedSession> sessions;
    std::vector<RememberedMap> maps;
    std::optional<Bytes> listed; // what multipathd prints of them, as JSON
};

struct Host {
    std::string about;
    std::string hostName;
    std::optional<std::vector<BlockEntry>> sysBlock;            // none = /sys/block is missing
    std::map<std::string, File> files;                          // by absolute path
    std::map<std::string, std::vector<CommandAnswer>> commands; // by absolute path; by call
    std::vector<Disk> disks;
    std::optional<VendorLibrary> vendorLibrary; // none = no HBA configuration is made
    std::vector<Adapter> adapters;
    std::vector<Memory> memories; // one at least
};

// The commands that a description may answer.
inline constexpr std::array<const char*, 3> kCommandPaths = {"/sbin/iscsiadm", "/usr/bin/pgrep",
                                                             "/sbin/powermt"};

// The vendor library as /etc/hba.conf names it. The loader of each word size puts its own folder for $LIB, so
// that one line serves both word sizes and a message that shows the path is the same in both.
inline constexpr const char* kVendorLibraryName = "/.simhost/$LIB/libsimhba.so";

// Reads a description; throws DescriptionError.
Host readDescription(const std::filesystem::path& path);

} // namespace simhost
