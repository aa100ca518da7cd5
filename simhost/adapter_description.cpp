#include <algorithm>
#include <cstring>

#include "simhost/description_parts.hpp"

namespace simhost {
namespace {

constexpr std::size_t kLongestAdapterName = 255; // libHBAAPI needs the NUL

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
    std::uint32_t place = 0;
    for (const auto& entry : keys.array("luns")) {
        addLun(entry, where + ".luns", lun, luns, place++);
    }
    keys.refuseUnknown();
}

MappingDeviation deviationOf(const toml::table& table, const std::string& where) {
    Keys keys(table, where);
    MappingDeviation deviation;
    if (const auto status = keys.number("status")) {
        deviation.status = static_cast<std::uint32_t>(*status);
    }
    if (const auto entries = keys.number("entries")) {
        deviation.entries = static_cast<std::uint32_t>(*entries);
    }
    keys.refuseUnknown();
    return deviation;
}

Adapter adapterOf(const toml::table& table, std::size_t index) {
    const std::string where = "adapter " + std::to_string(index);
    Keys keys(table, where);
    Adapter adapter;
    adapter.name = keys.bytes("name").value_or("simhba-" + std::to_string(index));
    if (adapter.name.size() > kLongestAdapterName) {
        refuse(table, where, "a name has at most 255 bytes");
    }
    adapter.manufacturer = keys.bytes("manufacturer").value_or("");
    adapter.model = keys.bytes("model").value_or("");
    adapter.nodeWwn = wwnOf(keys, "wwnn", table);
    for (const auto& port : keys.array("ports")) {
        adapter.ports.push_back(wwnOf(stringOf(port, where + ".ports"), port, where + ".ports"));
    }
    adapter.nameStatus = keys.number32("name_status", 0);
    adapter.opens = keys.boolean("open").value_or(true);
    adapter.attributesStatus = keys.number32("attributes_status", 0);
    adapter.numberOfPorts =
        keys.number32("number_of_ports", static_cast<std::uint32_t>(adapter.ports.size()));
    for (const auto& status : keys.array("port_status")) {
        adapter.portStatus.push_back(static_cast<std::uint32_t>(numberOf(status, where + ".port_status")));
    }
    adapter.portStatus.resize(std::max(adapter.portStatus.size(), adapter.ports.size()));
    for (const auto& deviation : keys.array("mapping")) {
        adapter.mapping.push_back(deviationOf(tableOf(deviation, where + ".mapping"), where + ".mapping"));
    }
    for (const auto& target : keys.tables("target")) {
        addTarget(target, where + ".target", adapter.luns);
    }
    keys.refuseUnknown();
    return adapter;
}

} // namespace

std::vector<Adapter> adaptersOf(Keys& host) {
    std::vector<Adapter> adapters;
    for (const auto& table : host.tables("adapter")) {
        adapters.push_back(adapterOf(table, adapters.size()));
    }
    return adapters;
}

std::optional<VendorLibrary> vendorLibraryOf(Keys& host, std::size_t adapters) {
    const toml::table* table = host.table("fc");
    if (table == nullptr && adapters == 0) {
        return std::nullopt;
    }
    VendorLibrary library;
    library.numberOfAdapters = static_cast<std::uint32_t>(adapters);
    if (table == nullptr) {
        return library;
    }
    Keys keys(*table, "fc");
    library.loadStatus = keys.number32("load_status", 0);
    library.registerStatus = keys.number32("register_status", 0);
    library.numberOfAdapters = keys.number32("adapters", library.numberOfAdapters);
    keys.refuseUnknown();
    return library;
}

} // namespace simhost
