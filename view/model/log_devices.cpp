#include "view/model/log_devices.hpp"

#include <algorithm>
#include <cctype>

namespace view {

std::string diskName(const std::string& node) {
    constexpr std::string_view kDevices = "/dev/";
    std::string name = node.substr(0, node.find(';'));
    name.erase(0, name.starts_with(kDevices) ? kDevices.size() : 0);
    std::replace(name.begin(), name.end(), '/', '!');
    return name;
}

std::string nodeName(const std::string& disk) {
    std::string name = "/dev/" + disk;
    std::replace(name.begin(), name.end(), '!', '/');
    return name;
}

std::string wwnDigits(std::string_view wwn) {
    std::string digits;
    for (const char c : wwn.starts_with("0x") ? wwn.substr(2) : wwn) {
        if (c != ':') {
            digits += static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
        }
    }
    return digits;
}

std::string loggedAddress(std::string_view address) {
    const std::string_view open = address.substr(address.starts_with('[') ? 1 : 0);
    return std::string(open.substr(0, open.find(':')));
}

PathOfLun LogDevice::shown() const {
    PathOfLun shown{paths.front(), lunName()};
    for (const PathView& path : paths) {
        if (disk != nullptr && !disk->initiatorPort.empty() &&
            wwnDigits(path.initiator) == wwnDigits(disk->initiatorPort)) {
            shown.path = path;
            break;
        }
    }
    if (disk != nullptr) {
        shown.path.device = nodeName(disk->name);
    }
    return shown;
}

LogDevices::LogDevices(const Model& model) {
    for (std::size_t i = 0; i < model.fc.paths.size(); ++i) {
        const FcPath& path = model.fc.paths[i];
        LogDevice* device = add(path.device, describe(model, {Sighting::Place::FcPath, i, 0}), path.page83,
                                path.identifier, path.facts);
        if (device != nullptr) {
            device->addresses.push_back(
                {true, wwnDigits(path.initiator), wwnDigits(path.targetPort), {}, path.lun});
            device->places.emplace_back(std::to_string(path.adapter) + ' ' + path.targetPort,
                                        lunNumbers(path));
        }
    }
    for (std::size_t i = 0; i < model.fc.adapters.size(); ++i) {
        const Adapter& adapter = model.fc.adapters[i];
        for (std::size_t k = 0; k < adapter.unlisted.size(); ++k) {
            const UnlistedLun& lun = adapter.unlisted[k];
            add(lun.device, describe(model, {Sighting::Place::Unlisted, k, i}), lun.page83, lun.identifier,
                lun.facts);
        }
    }
    for (std::size_t i = 0; i < model.iscsi.paths.size(); ++i) {
        const IscsiPath& path = model.iscsi.paths[i];
        LogDevice* device = add(path.device, describe(model, {Sighting::Place::IscsiPath, i, 0}), path.page83,
                                path.identifier, {});
        if (device != nullptr && path.lun >= 0) {
            device->addresses.push_back({false,
                                         {},
                                         path.targetIqn,
                                         loggedAddress(path.targetAddress),
                                         static_cast<std::uint64_t>(path.lun)});
            device->places.emplace_back(path.initiatorPort + ' ' + path.targetIqn + ' ' + path.targetAddress,
                                        std::to_string(path.lun));
        }
    }
    for (std::size_t i = 0; i < model.direct.devices.size(); ++i) {
        const DirectDevice& direct = model.direct.devices[i];
        add(direct.device, describe(model, {Sighting::Place::DirectDevice, i, 0}), direct.page83,
            direct.identifier, {});
    }
}

// The device of a node; null for what is no disk: a LUN without a node, an sg node.
LogDevice* LogDevices::add(const std::string& node, PathView path, const Page83& page,
                           const Identifier& identifier, const DeviceFacts& facts) {
    if (node.empty() || diskName(node).starts_with("sg")) {
        return nullptr;
    }
    const auto [place, isNew] = mPlaces.try_emplace(node, devices.size());
    if (isNew) {
        LogDevice device;
        device.node = node;
        device.facts = facts;
        device.identifier = identifier.text;
        if (page != nullptr) {
            device.unit = LogicalUnit(*page, facts.vendor, facts.product);
        }
        devices.push_back(std::move(device));
    }
    LogDevice& device = devices[place->second];
    device.paths.push_back(std::move(path));
    return &device;
}

} // namespace view
