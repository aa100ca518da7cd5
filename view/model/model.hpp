#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

// What a log says. Texts that came from devices or commands are kept byte for byte; escape.hpp makes them fit
// to be shown.
namespace view {

enum class Tree : unsigned char { Run, Multipath, Fc, Iscsi, Direct, Logical };

// The section of the log that reports a tree, as the log's banners call it.
std::string_view section(Tree tree);

enum class Severity : unsigned char {
    Problem, // something is missing from the report that should be there, or is wrong in it
    Note,    // worth knowing, and normal on many hosts
};

enum class ProblemKind : unsigned char {
    LogCut,
    AssertionFailed,
    TreeEnded,
    NoAdapters,
    AdapterFailed,
    AdapterUnsupported,
    MappingFailed,
    LunUnnamed,
    LunDropped,
    LunLeftOut,
    InquiryFailed,
    NotUnderPowerPath,
    PowerPathUncertain,
    IscsiNotConfigured,
    DeviceIgnored,
    SessionWithoutDisks,
    DeviceUnsupported,
    EntryIgnored,
    IdentifierNotUnique,
    NamesDiffer,
    ForeignText,
};
inline constexpr ProblemKind kLastProblemKind = ProblemKind::ForeignText;

struct Problem {
    Severity severity = Severity::Problem;
    ProblemKind kind = ProblemKind::LogCut;
    Tree tree = Tree::Run;
    std::string subject; // the device, adapter or tree it is about
    std::string cause;   // in words
    std::uint64_t line = 0;
};

// Where a LUN identifier came from.
enum class IdentifierKind : unsigned char {
    Unknown, // the log does not tell
    Naa,
    T10,
    Eui64,
    ScsiName,
    Md5,
    StandardInquiry, // vendor, product and revision, or the page's raw bytes: the device has no better one
    HostName,        // the host's name and the device's: no identifier of the device at all
    None,            // could not be read
};

struct Identifier {
    std::string text;
    IdentifierKind kind = IdentifierKind::Unknown;
};

// What a device calls itself, and what PowerPath calls it.
struct DeviceFacts {
    std::string vendor;
    std::string product;
    std::string revision;
    std::string pseudoDevice; // PowerPath's name of the LUN
};

// VPD page 83h (SPC, device identification) as a device answered it, its header included: what the log dumps
// of it, at most as much as the header's length says. The header's four bytes alone when the list of
// designators is empty or could not be read; null when the log has no answer. The paths that repeat one
// answer share it. Of standard INQUIRY data the log dumps nothing; it tells what DeviceFacts hold.
using Page83 = std::shared_ptr<const std::vector<std::uint8_t>>;

// An FC path as the tree lists it: one LUN entry below one initiator port.
struct FcPath {
    std::size_t adapter = 0; // index into FcTree::adapters
    std::string initiator;   // port WWN
    std::string targetNode;
    std::string targetPort;
    std::uint64_t bus = 0;
    std::uint64_t target = 0; // its number on the bus
    std::string device;
    Identifier identifier;
    std::uint64_t lun = 0; // the operating system's number
    std::uint64_t fcId = 0;
    std::string fcpLun; // the low 32 bits, hexadecimal
    DeviceFacts facts;
    Page83 page83;
};

// Both LUN numbers of a path as one text. Either alone may be the same for all LUNs of a target: a library
// may hold the FCP LUN in the upper 32 bits, which the log does not show.
inline std::string lunNumbers(const FcPath& path) {
    return std::to_string(path.lun) + ' ' + path.fcpLun;
}

// A LUN that was found on an adapter and identified, but has no line in its tree.
struct UnlistedLun {
    std::string device;
    Identifier identifier;
    DeviceFacts facts;
    Page83 page83;
};

enum class AdapterState : unsigned char {
    Begun, // the log ends, or goes on with something else, before its tree
    Reported,
    Unsupported,
    Failed,
};

struct Adapter {
    std::optional<std::uint64_t> number;
    std::string name;
    std::string manufacturer;
    std::string model;
    std::string node; // WWN
    AdapterState state = AdapterState::Begun;
    std::string cause;                           // of Failed
    std::optional<std::uint64_t> mappingEntries; // as the HBA library counts them
    std::vector<std::string> initiators;         // port WWNs
    std::vector<UnlistedLun> unlisted;
};

enum class TreeState : unsigned char {
    Absent, // the log has no such section
    Begun,  // the log ends inside it
    Built,
    Ended,         // by an error
    NotConfigured, // the host is not set up for it, or does not let itself be asked
};

struct FcTree {
    TreeState state = TreeState::Absent;
    std::vector<Adapter> adapters;
    std::vector<FcPath> paths;
    std::optional<double> loadMilliseconds;
    std::optional<double> buildMilliseconds;
};

struct IscsiPath {
    std::string initiatorIqn;
    std::string initiatorPort;
    std::string targetIqn;
    std::string targetAddress;
    std::string device;
    std::int64_t lun = 0;
    Identifier identifier;
    Page83 page83;
};

struct IscsiTree {
    TreeState state = TreeState::Absent;
    std::vector<IscsiPath> paths;
};

struct DirectDevice {
    std::string device;
    Identifier identifier;
    Page83 page83;
};

struct DirectTree {
    TreeState state = TreeState::Absent;
    std::vector<DirectDevice> devices;
};

struct LogicalTree {
    TreeState state = TreeState::Absent;
    std::vector<std::string> devices;
};

enum class PowerPathState : unsigned char { Unknown, NotRunning, Running };

struct PseudoDevice {
    std::string ulid;
    std::string name;
};

struct Multipath {
    PowerPathState state = PowerPathState::Unknown;
    std::vector<PseudoDevice> devices;
};

// A place of the model where a LUN is seen.
struct Sighting {
    enum class Place : unsigned char { FcPath, Unlisted, IscsiPath, DirectDevice };
    Place place = Place::FcPath;
    std::size_t index = 0;   // into the tree's paths or devices; for Unlisted, into Adapter::unlisted
    std::size_t adapter = 0; // of Unlisted
};

// The logical unit behind one or more paths.
struct Lun {
    Identifier identifier;
    DeviceFacts facts;
    Page83 page83; // of the first sighting whose answer the log has
    std::vector<Sighting> sightings;
    // The host's device nodes for it, one a path: the FC tree repeats an adapter's LUNs below each of its
    // ports, but the kernel has one node for a path.
    std::vector<std::string> devices;
    std::string notUnique; // why the identifier cannot be relied on; empty when it can
};

// A piece of the log that is none of Morvane's texts.
struct UnknownPiece {
    std::uint64_t line = 0;
    std::string bytes; // its beginning
};

// What the log itself is like.
struct LogFacts {
    std::string name;
    std::uint64_t bytes = 0;
    std::uint64_t lines = 0;
    std::uint64_t knownBytes = 0;   // of known texts, of what they let follow, and of line ends
    std::uint64_t unknownBytes = 0; // of all unknown pieces
    std::uint64_t knownTexts = 0;
    std::uint64_t gluedTexts = 0; // texts that stand on a line behind another one
    std::uint64_t unknownPieces = 0;
    std::vector<UnknownPiece> unknownSamples; // the first few
    std::uint64_t leftoverTexts = 0;          // after the end of the last run: an older run's
    unsigned runs = 0;                        // that begin in the log; the last one is reported
    bool beginsInside = false;                // the log does not begin with the beginning of a run
    bool cutInLine = false;                   // the last line has no end
    bool complete = false; // the closing banner was reached, and nothing is missing behind it
    std::string damage;    // why the packed file that holds it could not be unpacked to its end
};

struct Model {
    LogFacts log;
    std::string host;                 // empty when no tree names it
    std::optional<std::int64_t> time; // of the run, in seconds since the epoch, where its log tells
    Multipath multipath;
    FcTree fc;
    IscsiTree iscsi;
    DirectTree direct;
    LogicalTree logical;
    std::vector<Lun> luns;         // in the order of their first sighting
    std::vector<Problem> problems; // those of severity Problem first
};

// The number of a report's problems, notes left out.
std::size_t problemCount(const Model& model);

} // namespace view
