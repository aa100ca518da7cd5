#include <algorithm>

#include "simhost/description_parts.hpp"

namespace simhost {
namespace {

std::string lastComponent(const std::string& path) {
    return path.substr(path.rfind('/') + 1);
}

// A name leads nowhere else.
void refuseUnlessEntryName(const std::string& name, const toml::node& node, const std::string& where) {
    if (name.empty() || name == "." || name == ".." || name.find('/') != std::string::npos) {
        refuse(node, where, "no name of an entry: \"" + name + "\"");
    }
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
    if (!name && !link) {
        refuse(table, where, "has no \"name\"");
    }
    refuseUnlessEntryName(entry.name, table, where);
    keys.refuseUnknown();
    return entry;
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
    const toml::array& list = keys.array("partitions");
    for (std::size_t i = 0; i < list.size(); ++i) {
        const std::string where = "partitions " + std::to_string(i);
        const toml::node& entry = list[i];
        if (entry.is_string()) {
            names.push_back(entry.as_string()->get());
        } else if (entry.is_table()) {
            for (const auto& copy : unrolled(*entry.as_table(), where)) {
                Keys copyKeys(copy, where);
                names.push_back(stringOf(copyKeys.require("name"), where + ".name"));
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
    const bool missing = keys.flag("missing");
    keys.refuseUnknown();
    if (int{error.has_value()} + int{link.has_value()} + int{missing} != 1) {
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

constexpr const char* kPgrepPath = "/usr/bin/pgrep";
constexpr int kPgrepFoundNothing = 1; // its exit status

bool isMissing(const toml::node& node, const std::string& where) {
    const auto* table = node.as_table();
    return table != nullptr && table->size() == 1 && Keys(*table, where).flag("missing");
}

} // namespace

std::optional<std::vector<BlockEntry>> sysBlockOf(Keys& host) {
    const toml::node* node = host.find("sys_block");
    if (node != nullptr && node->is_boolean() && !node->as_boolean()->get()) {
        return std::nullopt;
    }
    std::vector<BlockEntry> entries;
    const toml::array& list = host.array("sys_block");
    for (std::size_t i = 0; i < list.size(); ++i) {
        const std::string where = "sys_block " + std::to_string(i);
        const toml::node& entry = list[i];
        if (entry.is_string()) {
            const std::string target = entry.as_string()->get();
            refuseUnlessEntryName(lastComponent(target), entry, where);
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

std::map<std::string, File> filesOf(Keys& host) {
    std::map<std::string, File> result;
    const bool described = host.find("partitions") != nullptr;
    result["/proc/partitions"] = {File::Kind::Content, partitionsText(partitionNames(host))};
    const toml::table* table = host.table("files");
    if (table == nullptr) {
        return result;
    }
    for (auto&& [key, value] : *table) {
        const std::string path(key.str());
        if (!isPlain(path)) {
            refuse(value, path, R"(a path has no empty, "." or ".." part)");
        }
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

std::map<std::string, std::vector<CommandAnswer>> commandsOf(Keys& host) {
    std::map<std::string, std::vector<CommandAnswer>> result;
    result[kPgrepPath] = {{{}, {}, kPgrepFoundNothing}}; // part of every system
    const toml::table* table = host.table("commands");
    if (table == nullptr) {
        return result;
    }
    for (auto&& [key, value] : *table) {
        const std::string path(key.str());
        if (std::find(kCommandPaths.begin(), kCommandPaths.end(), path) == kCommandPaths.end()) {
            refuse(value, path, "commands are /sbin/iscsiadm, /usr/bin/pgrep and /sbin/powermt");
        }
        auto& answers = result[path];
        answers.clear();
        if (path == kPgrepPath && isMissing(value, path)) {
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

} // namespace simhost
