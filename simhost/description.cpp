#include "simhost/description.hpp"

#include <algorithm>
#include <charconv>
#include <cstring>

#include "simhost/toml_reader.hpp"

namespace simhost {
namespace {

// ---- /sys/block, /proc/partitions, files and commands ----

std::string lastComponent(const std::string& path) {
    return path.substr(path.rfind('/') + 1);
}

BlockEntry blockEntry(const toml::table& table, const std::string& where) {
    Keys keys(table, where);
    BlockEntry entry;
    const auto link = keys.string("link");
    const auto device = keys.string("device");
    const auto type = keys.string("type");
    if (int{link.has_value()} + int{device.has_value()} + int{type.has_value()} != 1) {
        refuse(table, where, R"(needs one of "link", "device" and "type")");
    }
    if (link) {
        entry.kind = BlockEntry::Kind::Link;
        entry.target = *link;
    } else if (device) {
        entry.kind = BlockEntry::Kind::DirectoryWithDevice;
        entry.target = *device;
    } else if (*type == "file") {
        entry.kind = BlockEntry::Kind::File;
    } else if (*type == "directory") {
        entry.kind = BlockEntry::Kind::Directory;
    } else if (*type == "fifo") {
        entry.kind = BlockEntry::Kind::Fifo;
    } else if (*type == "socket") {
        entry.kind = BlockEntry::Kind::Socket;
    } else {
        refuse(table, where, R"(type must be "file", "directory", "fifo" or "socket")");
    }
    const auto name = keys.string("name");
    entry.name = name ? *name : lastComponent(entry.target);
    if (entry.name.empty() || (!name && !link)) {
        refuse(table, where, "has no \"name\"");
    }
    keys.refuseUnknown();
    return entry;
}

std::optional<std::vector<BlockEntry>> sysBlock(Keys& keys) {
    const toml::node* node = keys.find("sys_block");
    if (node != nullptr && node->is_boolean() && !node->as_boolean()->get()) {
        return std::nullopt;
    }
    std::vector<BlockEntry> entries;
    const toml::array* list = keys.array("sys_block");
    for (std::size_t i = 0; list != nullptr && i < list->size(); ++i) {
        const std::string where = "sys_block " + std::to_string(i);
        const toml::node& entry = *list->get(i);
        if (entry.is_string()) {
            const std::string target = entry.as_string()->get();
            entries.push_back({lastComponent(target), BlockEntry::Kind::Link, target});
        } else if (entry.is_table()) {
            for (const auto& copy : unrolled(*entry.as_table(), where)) {
                entries.push_back(blockEntry(copy, where));
            }
        } else {
            refuse(entry, where, "must be a string or a table");
        }
    }
    return entries;
}

// The text that the kernel gives for these names; the numbers and sizes are of no meaning.
Bytes partitionsText(const std::vector<std::string>& names) {
    Bytes text = "major minor  #blocks  name\n\n";
    for (std::size_t i = 0; i < names.size(); ++i) {
        std::array<char, 64> numbers{};
        const int length =
            std::snprintf(numbers.data(), numbers.size(), "%4u  %7zu %10llu ", 8U, i, 10485760ULL);
        text.append(numbers.data(), static_cast<std::size_t>(length)).append(names[i]).append("\n");
    }
    return text;
}

std::vector<std::string> partitionNames(Keys& keys) {
    std::vector<std::string> names;
    const toml::array* list = keys.array("partitions");
    for (std::size_t i = 0; list != nullptr && i < list->size(); ++i) {
        const std::string where = "partitions " + std::to_string(i);
        const toml::node& entry = *list->get(i);
        if (entry.is_string()) {
            names.push_back(entry.as_string()->get());
        } else if (entry.is_table()) {
            for (const auto& copy : unrolled(*entry.as_table(), where)) {
                Keys copyKeys(copy, where);
                names.push_back(copyKeys.require("name").value_or(std::string()));
                copyKeys.refuseUnknown();
            }
        } else {
            refuse(entry, where, "must be a string or a table");
        }
    }
    return names;
}

File fileOf(const toml::node& node, const std::string& path) {
    const auto* table = node.as_table();
    if (table == nullptr || table->contains("hex")) {
        return {File::Kind::Content, bytesOf(node, path)};
    }
    Keys keys(*table, path);
    const auto error = keys.string("error");
    const auto link = keys.string("link");
    const auto missing = keys.boolean("missing");
    keys.refuseUnknown();
    if (int{error.has_value()} + int{link.has_value()} + int{missing.has_value()} != 1) {
        refuse(node, path, R"(needs one of "hex", "error", "link" and "missing")");
    }
    if (link) {
        return {File::Kind::Link, *link};
    }
    if (missing) {
        return {File::Kind::Missing, {}};
    }
    if (*error != "open" && *error != "read") {
        refuse(node, path, R"(error must be "open" or "read")");
    }
    return {*error == "open" ? File::Kind::OpenError : File::Kind::ReadError, {}};
}

std::map<std::string, File> files(Keys& hostKeys) {
    std::map<std::string, File> result;
    const bool described = hostKeys.find("partitions") != nullptr;
    result["/proc/partitions"] = {File::Kind::Content, partitionsText(partitionNames(hostKeys))};
    const toml::node* node = hostKeys.find("files");
    if (node == nullptr) {
        return result;
    }
    if (!node->is_table()) {
        refuse(*node, "files", "must be a table");
    }
    for (auto&& [key, value] : *node->as_table()) {
        const std::string path(key.str());
        const bool inEtc = path.rfind("/etc/", 0) == 0;
        const bool inRoot = path.size() > 1 && path[0] == '/' && path.find('/', 1) == std::string::npos;
        if (!inEtc && !inRoot && path != "/proc/partitions") {
            refuse(value, path, "files stand under /etc or directly under /, or are /proc/partitions");
        }
        if (path == "/proc/partitions" && described) {
            refuse(value, path, "is described by \"partitions\" already");
        }
        File file = fileOf(value, path);
        if (path == "/proc/partitions" &&
            (file.kind == File::Kind::Link || file.kind == File::Kind::Missing)) {
            refuse(value, path, "can only have other bytes or an error");
        }
        result[path] = std::move(file);
    }
    return result;
}

CommandAnswer commandAnswer(const toml::node& node, const std::string& where) {
    const auto* table = node.as_table();
    if (table == nullptr || table->contains("hex")) {
        return {bytesOf(node, where), {}, 0};
    }
    Keys keys(*table, where);
    CommandAnswer answer;
    answer.output = keys.bytes("output").value_or("");
    answer.error = keys.bytes("error").value_or("");
    answer.status = static_cast<int>(keys.number("status", 255).value_or(0));
    keys.refuseUnknown();
    return answer;
}

constexpr const char* pgrepPath = "/usr/bin/pgrep";
constexpr int pgrepFoundNothing = 1; // its exit status

bool isMissing(const toml::node& node) {
    const auto* table = node.as_table();
    return table != nullptr && table->size() == 1 && (*table)["missing"].value_or(false);
}

std::map<std::string, std::vector<CommandAnswer>> commands(Keys& hostKeys) {
    std::map<std::string, std::vector<CommandAnswer>> result;
    result[pgrepPath] = {{{}, {}, pgrepFoundNothing}}; // part of every system
    const toml::node* node = hostKeys.find("commands");
    if (node == nullptr) {
        return result;
    }
    if (!node->is_table()) {
        refuse(*node, "commands", "must be a table");
    }
    for (auto&& [key, value] : *node->as_table()) {
        const std::string path(key.str());
        if (std::find(commandPaths.begin(), commandPaths.end(), path) == commandPaths.end()) {
            refuse(value, path, "commands are /sbin/iscsiadm, /usr/bin/pgrep and /sbin/powermt");
        }
        auto& answers = result[path];
        answers.clear();
        if (path == pgrepPath && isMissing(value)) {
            result.erase(path);
            continue;
        }
        if (const auto* list = value.as_array()) {
            for (const auto& answer : *list) {
                answers.push_back(commandAnswer(answer, path));
            }
            if (answers.empty()) {
                refuse(value, path, "needs an answer");
            }
        } else {
            answers.push_back(commandAnswer(value, path));
        }
    }
    return result;
}

// ---- Disks ----

int commandOf(std::string_view text, const toml::node& node, const std::string& where) {
    if (text == "standard") {
        return standardInquiry;
    }
    unsigned page = 0;
    if (text.size() > 2 && text.substr(0, 2) == "0x") {
        const auto [end, error] = std::from_chars(text.data() + 2, text.data() + text.size(), page, 16);
        if (error == std::errc() && end == text.data() + text.size() && page <= 0xff) {
            return static_cast<int>(page);
        }
    }
    refuse(node, where,
           R"(a command is "standard" or a page such as "0x83", not ")" + std::string(text) + "\"");
}

int errorNumberOf(const toml::node& node, const std::string& where) {
    if (const auto number = node.value_exact<std::int64_t>(); number && *number > 0 && *number < 4096) {
        return static_cast<int>(*number);
    }
    if (const auto name = node.value_exact<std::string>()) {
        for (int number = 1; number < 200; ++number) {
            if (const char* known = strerrorname_np(number); known != nullptr && *name == known) {
                return number;
            }
        }
    }
    refuse(node, where, "must be the name or number of a system error");
}

Fault faultOf(const toml::table& table, const std::string& where) {
    Keys keys(table, where);
    Fault fault;
    if (const toml::node* command = keys.find("command")) {
        fault.command = commandOf(command->value_or(std::string_view()), *command, where);
    }
    const auto nth = keys.number("nth");
    const auto from = keys.number("from");
    if (nth && from) {
        refuse(table, where, R"(has both "nth" and "from")");
    }
    if (nth) {
        fault.first = fault.last = static_cast<std::uint32_t>(*nth);
    }
    if (from) {
        fault.first = static_cast<std::uint32_t>(*from);
    }
    if (const toml::node* error = keys.find("errno")) {
        fault.errorNumber = errorNumberOf(*error, where);
    }
    fault.delayMilliseconds = keys.number32("delay_ms", 0);
    const auto status = keys.number("status", 0xff);
    const auto hostStatus = keys.number("host_status", 0xffff);
    const auto driverStatus = keys.number("driver_status", 0xffff);
    const auto sense = keys.hex("sense");
    fault.failed = status || hostStatus || driverStatus || sense;
    fault.status = static_cast<std::uint8_t>(status.value_or(0));
    fault.hostStatus = static_cast<std::uint16_t>(hostStatus.value_or(0));
    fault.driverStatus = static_cast<std::uint16_t>(driverStatus.value_or(0));
    fault.sense = sense.value_or("");
    if (const auto length = keys.number("sense_length", 0xff)) {
        fault.senseLength = static_cast<std::uint8_t>(*length);
    }
    fault.data = keys.hex("data");
    if (const toml::node* resid = keys.find("resid")) {
        const auto value = resid->value_exact<std::int64_t>();
        if (!value || *value < INT32_MIN || *value > INT32_MAX) {
            refuse(*resid, where + ".resid", "must be a 32-bit number");
        }
        fault.resid = static_cast<std::int32_t>(*value);
    }
    keys.refuseUnknown();
    return fault;
}

// A field of a fixed width, blank-padded and cut as SPC's left-aligned ASCII fields are.
Bytes padded(const Bytes& text, std::size_t width) {
    Bytes field = text.substr(0, width);
    field.resize(width, ' ');
    return field;
}

char byteOf(std::uint64_t value) {
    return static_cast<char>(static_cast<unsigned char>(value & 0xffU));
}

Bytes standardData(Keys& keys, char type) {
    const Bytes tail = keys.hex("tail").value_or("");
    const std::uint64_t additional = keys.number("additional_length", 0xff).value_or(31 + tail.size());
    Bytes data{type, 0, 5, 2, byteOf(additional), 0, 0, 2};
    data += padded(keys.bytes("vendor").value_or(""), 8);
    data += padded(keys.bytes("product").value_or(""), 16);
    data += padded(keys.bytes("revision").value_or(""), 4);
    return data + tail;
}

Bytes pageOf(char type, std::uint8_t page, const Bytes& body) {
    return Bytes{type, byteOf(page), byteOf(body.size() >> 8U), byteOf(body.size())} + body;
}

Bytes designatorOf(const toml::table& table, const std::string& where) {
    Keys keys(table, where);
    keys.require("type");
    const std::uint64_t type = keys.number("type", 15).value_or(0);
    const std::uint64_t association = keys.number("association", 3).value_or(0);
    const auto text = keys.string("text");
    const auto hex = keys.hex("hex");
    if (text.has_value() == hex.has_value()) {
        refuse(table, where, R"(needs either "text" or "hex")");
    }
    const std::uint64_t codeSet = keys.number("code_set", 15).value_or(text ? 2 : 1);
    keys.refuseUnknown();
    const Bytes& identifier = text ? *text : *hex;
    if (identifier.size() > 0xff) {
        refuse(table, where, "a designator has at most 255 bytes");
    }
    return Bytes{byteOf(codeSet), byteOf(association << 4U | type), 0, byteOf(identifier.size())} +
           identifier;
}

void addRawAnswers(Keys& keys, Disk& disk) {
    const toml::node* raw = keys.find("raw");
    if (raw == nullptr) {
        return;
    }
    const std::string where = keys.where() + ".raw";
    if (!raw->is_table()) {
        refuse(*raw, where, "must be a table");
    }
    for (auto&& [key, value] : *raw->as_table()) {
        disk.answers[commandOf(key.str(), value, where)] =
            bytesOfHex(value.value_or(std::string_view("not a string")), where);
    }
}

std::vector<std::string> nodesOf(Keys& keys) {
    const toml::node& node = keys.require("node");
    std::vector<std::string> nodes;
    if (node.is_string()) {
        nodes.push_back(node.as_string()->get());
    } else if (node.is_array()) {
        for (const auto& element : *node.as_array()) {
            nodes.push_back(element.value_or(std::string()));
        }
    }
    if (nodes.empty()) {
        refuse(node, keys.where() + ".node", "must be a path or a list of paths");
    }
    for (const auto& path : nodes) {
        if (path.rfind("/dev/", 0) != 0 || path.size() == 5) {
            refuse(node, keys.where() + ".node", "must stand under /dev: \"" + path + "\"");
        }
    }
    return nodes;
}

Disk diskOf(const toml::table& table, const std::string& where) {
    Keys keys(table, where);
    Disk disk;
    disk.nodes = nodesOf(keys);
    if (const auto error = keys.string("open_error")) {
        if (*error == "ENOENT") {
            disk.open = Disk::Open::NoEntry;
        } else if (*error == "ENXIO") {
            disk.open = Disk::Open::NoDevice;
        } else if (*error == "ELOOP") {
            disk.open = Disk::Open::LinkLoop;
        } else {
            refuse(table, where, R"(open_error must be "ENOENT", "ENXIO" or "ELOOP")");
        }
    }
    const char type = byteOf(keys.number("type", 0xff).value_or(0));
    disk.answers[standardInquiry] = standardData(keys, type);
    if (const auto serial = keys.bytes("serial")) {
        disk.answers[0x80] = pageOf(type, 0x80, *serial);
    }
    if (const toml::array* designators = keys.array("designators")) {
        Bytes list;
        for (const auto& designator : *designators) {
            if (!designator.is_table()) {
                refuse(designator, where + ".designators", "must hold tables");
            }
            list += designatorOf(*designator.as_table(), where + ".designators");
        }
        disk.answers[0x83] = pageOf(type, 0x83, list);
    }
    addRawAnswers(keys, disk);
    disk.ignoresAllocationLength = keys.boolean("ignores_allocation_length").value_or(false);
    if (const toml::array* faults = keys.array("faults")) {
        for (const auto& fault : *faults) {
            if (!fault.is_table()) {
                refuse(fault, where + ".faults", "must hold tables");
            }
            disk.faults.push_back(faultOf(*fault.as_table(), where + ".faults"));
        }
    }
    keys.refuseUnknown();
    return disk;
}

// ---- Fibre Channel ----

constexpr std::size_t longestAdapterName = 255; // libHBAAPI needs the NUL

Wwn wwnOf(std::string text, const toml::node& node, const std::string& where) {
    std::replace(text.begin(), text.end(), ':', ' ');
    const Bytes bytes = bytesOfHex(text, where);
    Wwn wwn{};
    if (bytes.size() != wwn.size()) {
        refuse(node, where, "a WWN has 8 bytes");
    }
    std::memcpy(wwn.data(), bytes.data(), wwn.size());
    return wwn;
}

Wwn wwnOf(Keys& keys, std::string_view key, const toml::node& node) {
    const auto text = keys.string(key);
    return text ? wwnOf(*text, node, keys.where() + "." + std::string(key)) : Wwn{};
}

void addLun(const toml::node& node, const std::string& where, MappedLun lun, std::vector<MappedLun>& luns,
            std::uint32_t place) {
    if (node.is_string()) {
        lun.device = node.as_string()->get();
        lun.lun = place;
        lun.fcpLun = place;
        luns.push_back(lun);
        return;
    }
    if (!node.is_table()) {
        refuse(node, where, "must be a string or a table");
    }
    std::uint32_t copyNumber = 0;
    for (const auto& copy : unrolled(*node.as_table(), where)) {
        Keys keys(copy, where);
        lun.device = keys.bytes("device").value_or("");
        const std::uint32_t number = keys.number32("lun", place);
        lun.lun = number + copyNumber;
        lun.fcpLun = keys.number("fcp_lun", INT64_MAX).value_or(number) + copyNumber;
        keys.refuseUnknown();
        luns.push_back(lun);
        ++copyNumber;
    }
}

void addTarget(const toml::table& table, const std::string& where, std::vector<MappedLun>& luns) {
    Keys keys(table, where);
    MappedLun lun;
    lun.nodeWwn = wwnOf(keys, "wwnn", table);
    lun.portWwn = wwnOf(keys, "wwpn", table);
    lun.bus = keys.number32("bus", 0);
    lun.target = keys.number32("id", 0);
    lun.fcId = keys.number32("fcid", 0);
    if (const toml::array* list = keys.array("luns")) {
        for (std::size_t i = 0; i < list->size(); ++i) {
            addLun(*list->get(i), where + ".luns", lun, luns, static_cast<std::uint32_t>(i));
        }
    }
    keys.refuseUnknown();
}

Adapter adapterOf(const toml::table& table, std::size_t index) {
    const std::string where = "adapter " + std::to_string(index);
    Keys keys(table, where);
    Adapter adapter;
    adapter.name = keys.bytes("name").value_or("simhba-" + std::to_string(index));
    if (adapter.name.size() > longestAdapterName) {
        refuse(table, where, "a name has at most 255 bytes");
    }
    adapter.manufacturer = keys.bytes("manufacturer").value_or("");
    adapter.model = keys.bytes("model").value_or("");
    adapter.nodeWwn = wwnOf(keys, "wwnn", table);
    if (const toml::array* ports = keys.array("ports")) {
        for (const auto& port : *ports) {
            adapter.ports.push_back(wwnOf(port.value_or(std::string()), port, where + ".ports"));
        }
    }
    adapter.nameStatus = keys.number32("name_status", 0);
    adapter.opens = keys.boolean("open").value_or(true);
    adapter.attributesStatus = keys.number32("attributes_status", 0);
    adapter.numberOfPorts =
        keys.number32("number_of_ports", static_cast<std::uint32_t>(adapter.ports.size()));
    if (const toml::array* statuses = keys.array("port_status")) {
        for (const auto& status : *statuses) {
            adapter.portStatus.push_back(status.value_or(std::uint32_t{0}));
        }
    }
    adapter.portStatus.resize(std::max(adapter.portStatus.size(), adapter.ports.size()));
    if (const toml::array* deviations = keys.array("mapping")) {
        for (const auto& deviation : *deviations) {
            if (!deviation.is_table()) {
                refuse(deviation, where + ".mapping", "must hold tables");
            }
            Keys deviationKeys(*deviation.as_table(), where + ".mapping");
            MappingDeviation& added = adapter.mapping.emplace_back();
            if (const auto status = deviationKeys.number("status")) {
                added.status = static_cast<std::uint32_t>(*status);
            }
            if (const auto entries = deviationKeys.number("entries")) {
                added.entries = static_cast<std::uint32_t>(*entries);
            }
            deviationKeys.refuseUnknown();
        }
    }
    for (const auto& target : keys.tables("target")) {
        addTarget(target, where + ".target", adapter.luns);
    }
    keys.refuseUnknown();
    return adapter;
}

void addFibreChannel(Keys& keys, Host& host) {
    for (const auto& table : keys.tables("adapter")) {
        host.adapters.push_back(adapterOf(table, host.adapters.size()));
    }
    const toml::node* library = keys.find("fc");
    if (library == nullptr && host.adapters.empty()) {
        return;
    }
    const auto described = static_cast<std::uint32_t>(host.adapters.size());
    VendorLibrary& fc = host.vendorLibrary.emplace();
    fc.numberOfAdapters = described;
    if (library == nullptr) {
        return;
    }
    if (!library->is_table()) {
        refuse(*library, "fc", "must be a table");
    }
    Keys fcKeys(*library->as_table(), "fc");
    fc.loadStatus = fcKeys.number32("load_status", 0);
    fc.registerStatus = fcKeys.number32("register_status", 0);
    fc.numberOfAdapters = fcKeys.number32("adapters", described);
    fcKeys.refuseUnknown();
}

Host hostOf(const toml::table& document) {
    Keys keys(document, "host");
    Host host;
    host.about = keys.string("about").value_or("");
    host.hostName = keys.string("hostname").value_or("simhost");
    host.sysBlock = sysBlock(keys);
    host.files = files(keys);
    host.commands = commands(keys);
    for (const auto& table : keys.tables("disk")) {
        host.disks.push_back(diskOf(table, "disk " + std::to_string(host.disks.size())));
    }
    addFibreChannel(keys, host);
    if (host.vendorLibrary) {
        host.files.try_emplace("/etc/hba.conf", File{File::Kind::Content, std::string("org.simhost.hba ") +
                                                                              vendorLibraryName + "\n"});
    }
    keys.refuseUnknown();
    return host;
}

} // namespace

Host readDescription(const std::filesystem::path& path) {
    try {
        return hostOf(toml::parse_file(path.string()));
    } catch (const toml::parse_error& error) {
        throw DescriptionError(path.string() + ": line " + std::to_string(error.source().begin.line) + ": " +
                               std::string(error.description()));
    } catch (const DescriptionError& error) {
        throw DescriptionError(path.string() + ": " + error.what());
    }
}

} // namespace simhost
