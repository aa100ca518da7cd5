#include <array>
#include <cerrno>
#include <charconv>
#include <string_view>
#include <utility>

#include "simhost/description_parts.hpp"

namespace simhost {
namespace {

// What drivers and the kernel fail an ioctl with.
constexpr std::array<std::pair<std::string_view, int>, 29> kErrors = {
    {{"EPERM", EPERM},         {"ENOENT", ENOENT},     {"EINTR", EINTR},           {"EIO", EIO},
     {"ENXIO", ENXIO},         {"EAGAIN", EAGAIN},     {"ENOMEM", ENOMEM},         {"EACCES", EACCES},
     {"EFAULT", EFAULT},       {"EBUSY", EBUSY},       {"ENODEV", ENODEV},         {"EINVAL", EINVAL},
     {"ENOTTY", ENOTTY},       {"ENOSPC", ENOSPC},     {"EROFS", EROFS},           {"ENOSYS", ENOSYS},
     {"ENODATA", ENODATA},     {"EPROTO", EPROTO},     {"EBADMSG", EBADMSG},       {"EOVERFLOW", EOVERFLOW},
     {"EILSEQ", EILSEQ},       {"EMSGSIZE", EMSGSIZE}, {"EOPNOTSUPP", EOPNOTSUPP}, {"ESHUTDOWN", ESHUTDOWN},
     {"ETIMEDOUT", ETIMEDOUT}, {"ESTALE", ESTALE},     {"EREMOTEIO", EREMOTEIO},   {"ENOMEDIUM", ENOMEDIUM},
     {"ECANCELED", ECANCELED}}};

int commandOf(std::string_view text, const toml::node& node, const std::string& where) {
    if (text == "standard") {
        return kStandardInquiry;
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
        for (const auto& [known, number] : kErrors) {
            if (*name == known) {
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
        fault.command = commandOf(stringOf(*command, where + ".command"), *command, where);
    }
    const auto nth = keys.number("nth");
    const auto from = keys.number("from");
    if (nth && from) {
        refuse(table, where, R"(has both "nth" and "from")");
    }
    if (nth == 0U || from == 0U) {
        refuse(table, where, "commands count from 1");
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
    fault.delayMilliseconds = static_cast<std::uint32_t>(keys.number("delay_ms", INT32_MAX).value_or(0));
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
    const auto given = keys.number("additional_length", 0xff);
    const std::uint64_t additional = given.value_or(31 + tail.size());
    if (additional > 0xff) {
        throw DescriptionError(keys.where() + ": a tail of more than 224 bytes needs \"additional_length\"");
    }
    Bytes data{type, 0, 5, 2, byteOf(additional), 0, 0, 2};
    data += padded(keys.bytes("vendor").value_or(""), 8);
    data += padded(keys.bytes("product").value_or(""), 16);
    data += padded(keys.bytes("revision").value_or(""), 4);
    return data + tail;
}

Bytes pageOf(char type, std::uint8_t page, const Bytes& body, const std::string& where) {
    if (body.size() > 0xffff) {
        throw DescriptionError(where + ": a page has at most 65535 bytes");
    }
    return Bytes{type, byteOf(page), byteOf(body.size() >> 8U), byteOf(body.size())} + body;
}

Bytes designatorOf(const toml::table& table, const std::string& where) {
    Keys keys(table, where);
    keys.require("type");
    const std::uint64_t type = keys.number("type", 15).value_or(0);
    const std::uint64_t association = keys.number("association", 3).value_or(0);
    const std::uint64_t protocolValid = keys.boolean("piv").value_or(false) ? 1 : 0;
    const std::uint64_t protocol = keys.number("protocol", 15).value_or(0);
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
    return Bytes{byteOf(protocol << 4U | codeSet), byteOf(protocolValid << 7U | association << 4U | type), 0,
                 byteOf(identifier.size())} +
           identifier;
}

void addRawAnswers(Keys& keys, Disk& disk) {
    const toml::table* raw = keys.table("raw");
    if (raw == nullptr) {
        return;
    }
    const std::string where = keys.where() + ".raw";
    for (auto&& [key, value] : *raw) {
        disk.answers[commandOf(key.str(), value, where)] = bytesOfHex(stringOf(value, where), where);
    }
}

// Page 0x00, the list of the pages that the disk answers; a disk without pages has no such list.
void addPageList(char type, Disk& disk, const std::string& where) {
    Bytes pages{0};
    for (const auto& [command, answer] : disk.answers) {
        if (command > 0) {
            pages += byteOf(static_cast<std::uint64_t>(command));
        }
    }
    if (pages.size() > 1) {
        disk.answers.try_emplace(0, pageOf(type, 0, pages, where));
    }
}

std::vector<std::string> nodesOf(Keys& keys) {
    const toml::node& node = keys.require("node");
    std::vector<std::string> nodes;
    if (node.is_string()) {
        nodes.push_back(node.as_string()->get());
    } else if (node.is_array()) {
        for (const auto& element : *node.as_array()) {
            nodes.push_back(stringOf(element, keys.where() + ".node"));
        }
    }
    if (nodes.empty()) {
        refuse(node, keys.where() + ".node", "must be a path or a list of paths");
    }
    for (const auto& path : nodes) {
        if (path.rfind("/dev/", 0) != 0 || !isPlain(path)) {
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
    disk.answers[kStandardInquiry] = standardData(keys, type);
    if (const auto serial = keys.bytes("serial")) {
        disk.answers[0x80] = pageOf(type, 0x80, *serial, where);
    }
    if (keys.find("designators") != nullptr) {
        Bytes list;
        for (const auto& designator : keys.array("designators")) {
            list += designatorOf(tableOf(designator, where + ".designators"), where + ".designators");
        }
        disk.answers[0x83] = pageOf(type, 0x83, list, where);
    }
    addRawAnswers(keys, disk);
    addPageList(type, disk, where);
    disk.ignoresAllocationLength = keys.boolean("ignores_allocation_length").value_or(false);
    for (const auto& fault : keys.array("faults")) {
        disk.faults.push_back(faultOf(tableOf(fault, where + ".faults"), where + ".faults"));
    }
    keys.refuseUnknown();
    return disk;
}

} // namespace

std::vector<Disk> disksOf(Keys& host) {
    std::vector<Disk> disks;
    for (const auto& table : host.tables("disk")) {
        disks.push_back(diskOf(table, "disk " + std::to_string(disks.size())));
    }
    return disks;
}

} // namespace simhost
