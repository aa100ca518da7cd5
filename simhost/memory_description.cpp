#include <algorithm>

#include "simhost/description_parts.hpp"

namespace simhost {
namespace {

void refuseUnlessNode(const Host& host, const std::string& node, const toml::node& place,
                      const std::string& where) {
    const auto isOf = [&](const Disk& disk) {
        return std::find(disk.nodes.begin(), disk.nodes.end(), node) != disk.nodes.end();
    };
    if (std::none_of(host.disks.begin(), host.disks.end(), isOf)) {
        refuse(place, where, "no node of a disk: \"" + node + "\"");
    }
}

// A name stands for one file or folder.
std::string plainName(Keys& keys, std::string_view key) {
    std::string name = keys.string(key).value_or("");
    if (name == "." || name == ".." || name.find('/') != std::string::npos) {
        throw DescriptionError(keys.where() + "." + std::string(key) + ": no name of a file: \"" + name +
                               "\"");
    }
    return name;
}

RememberedDisk rememberedDisk(Keys& keys) {
    RememberedDisk disk;
    disk.name = plainName(keys, "name");
    disk.isMissing = keys.flag("missing");
    disk.isScsi = keys.boolean("scsi").value_or(true);
    disk.hasPage = keys.boolean("has_page").value_or(true);
    disk.page = keys.hex("page");
    disk.wwid = keys.string("wwid").value_or("");
    disk.state = keys.string("state").value_or(disk.state);
    disk.portState = keys.string("port_state").value_or(disk.portState);
    disk.since = keys.number("since");
    keys.refuseUnknown();
    return disk;
}

RememberedSession rememberedSession(const toml::table& table) {
    Keys keys(table, "memory.session");
    RememberedSession session;
    keys.require("name");
    session.name = plainName(keys, "name");
    session.target = keys.string("target").value_or("");
    session.address = keys.string("address").value_or("");
    session.state = keys.string("state").value_or("LOGGED_IN");
    keys.refuseUnknown();
    return session;
}

RememberedMap rememberedMap(const toml::table& table, const Host& host) {
    Keys keys(table, "memory.map");
    RememberedMap map;
    map.name = keys.string("name").value_or("");
    map.uuid = keys.string("uuid").value_or("");
    for (const auto& path : keys.array("paths")) {
        map.paths.push_back(stringOf(path, "memory.map.paths"));
        refuseUnlessNode(host, map.paths.back(), path, "memory.map.paths");
    }
    keys.refuseUnknown();
    return map;
}

Memory memoryOf(const toml::table& table, const Host& host) {
    Keys keys(table, "memory");
    Memory memory;
    keys.require("name");
    memory.name = plainName(keys, "name");
    memory.hostName = keys.string("hostname").value_or(host.hostName);
    memory.bootTime = keys.number("boot").value_or(0);
    memory.listed = keys.bytes("multipathd");
    if (const toml::table* ports = keys.table("ports")) {
        for (auto&& [name, port] : *ports) {
            memory.hostPorts[std::string(name.str())] = stringOf(port, "memory.ports");
        }
    }
    for (const auto& disk : keys.tables("disk")) {
        Keys diskKeys(disk, "memory.disk");
        const std::string node = stringOf(diskKeys.require("node"), "memory.disk.node");
        refuseUnlessNode(host, node, disk, "memory.disk.node");
        memory.disks[node] = rememberedDisk(diskKeys);
    }
    for (const auto& session : keys.tables("session")) {
        memory.sessions.push_back(rememberedSession(session));
    }
    for (const auto& map : keys.tables("map")) {
        memory.maps.push_back(rememberedMap(map, host));
    }
    keys.refuseUnknown();
    return memory;
}

} // namespace

std::vector<Memory> memoriesOf(Keys& host, const Host& described) {
    std::vector<Memory> memories;
    for (const auto& table : host.tables("memory")) {
        memories.push_back(memoryOf(table, described));
    }
    if (memories.empty()) {
        memories.emplace_back();
        memories.back().name = "as-it-is";
        memories.back().hostName = described.hostName;
    }
    return memories;
}

} // namespace simhost
