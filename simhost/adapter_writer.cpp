#include "simhost/adapter_writer.hpp"

#include <algorithm>
#include <bit>
#include <cstring>

#include "simhost/adapter_file.hpp"

namespace simhost {
namespace {

// A text that fills its field keeps no NUL, as the HBA API's fields may.
template <std::size_t Size>
void fill(char (&field)[Size], const Bytes& text) {
    std::memcpy(field, text.data(), std::min(Size, text.size()));
}

void fill(std::uint8_t (&field)[8], const Wwn& wwn) {
    std::copy(wwn.begin(), wwn.end(), field);
}

template <typename Record>
Bytes bytesOf(const std::vector<Record>& records) {
    Bytes bytes(records.size() * sizeof(Record), '\0');
    if (!records.empty()) {
        std::memcpy(bytes.data(), records.data(), bytes.size());
    }
    return bytes;
}

template <typename Record>
AdapterFileRange rangeFrom(std::size_t first, const std::vector<Record>& records) {
    return {static_cast<std::uint32_t>(first), static_cast<std::uint32_t>(records.size() - first)};
}

AdapterFileLun lunRecord(const MappedLun& lun) {
    AdapterFileLun record{};
    fill(record.device, lun.device);
    record.bus = lun.bus;
    record.target = lun.target;
    record.lun = lun.lun;
    record.fcId = lun.fcId;
    fill(record.nodeWwn, lun.nodeWwn);
    fill(record.portWwn, lun.portWwn);
    record.fcpLunLow = static_cast<std::uint32_t>(lun.fcpLun);
    record.fcpLunHigh = static_cast<std::uint32_t>(lun.fcpLun >> 32U);
    return record;
}

} // namespace

Bytes adapterFile(const VendorLibrary& library, const std::vector<Adapter>& adapters) {
    std::vector<AdapterFileAdapter> adapterRecords;
    std::vector<AdapterFilePort> ports;
    std::vector<AdapterFileDeviation> deviations;
    std::vector<AdapterFileLun> luns;
    for (const Adapter& adapter : adapters) {
        AdapterFileAdapter record{};
        fill(record.name, adapter.name);
        fill(record.manufacturer, adapter.manufacturer);
        fill(record.model, adapter.model);
        fill(record.nodeWwn, adapter.nodeWwn);
        record.nameStatus = adapter.nameStatus;
        record.opens = adapter.opens ? 1 : 0;
        record.attributesStatus = adapter.attributesStatus;
        record.numberOfPorts = adapter.numberOfPorts;

        const std::size_t firstPort = ports.size();
        for (std::size_t i = 0; i < adapter.portStatus.size(); ++i) {
            AdapterFilePort& port = ports.emplace_back();
            fill(port.portWwn, i < adapter.ports.size() ? adapter.ports[i] : Wwn{});
            port.status = adapter.portStatus[i];
        }
        record.ports = rangeFrom(firstPort, ports);

        const std::size_t firstDeviation = deviations.size();
        for (const MappingDeviation& deviation : adapter.mapping) {
            deviations.push_back({deviation.status ? 1U : 0U, deviation.status.value_or(0),
                                  deviation.entries ? 1U : 0U, deviation.entries.value_or(0)});
        }
        record.deviations = rangeFrom(firstDeviation, deviations);

        const std::size_t firstLun = luns.size();
        for (const MappedLun& lun : adapter.luns) {
            luns.push_back(lunRecord(lun));
        }
        record.luns = rangeFrom(firstLun, luns);
        adapterRecords.push_back(record);
    }
    const std::vector<AdapterFileHeader> header = {
        {library.registerStatus, library.loadStatus, library.numberOfAdapters,
         static_cast<std::uint32_t>(adapterRecords.size()), static_cast<std::uint32_t>(ports.size()),
         static_cast<std::uint32_t>(deviations.size()), static_cast<std::uint32_t>(luns.size())}};
    return bytesOf(header) + bytesOf(adapterRecords) + bytesOf(ports) + bytesOf(deviations) + bytesOf(luns);
}

} // namespace simhost
