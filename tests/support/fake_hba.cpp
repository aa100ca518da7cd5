#include "tests/support/fake_hba.hpp"

#include <algorithm>
#include <cstdlib>
#include <cstring>

namespace {

FakeHba* gHba = nullptr;

FakeHba& hba() {
    if (gHba == nullptr) {
        std::abort();
    }
    return *gHba;
}

void record(const std::string& call) {
    hba().calls.push_back(call);
}

std::string text(unsigned number) {
    return std::to_string(number);
}

} // namespace

FakeHba::FakeHba() {
    gHba = this;
}

FakeHba::~FakeHba() {
    gHba = nullptr;
}

FakeAdapter& FakeHba::adapter(const std::string& name, HBA_HANDLE handle,
                              std::initializer_list<unsigned char> ports) {
    FakeAdapter& added = adapters.emplace_back();
    added.name = name;
    added.handle = handle;
    std::strcpy(added.attributes.Manufacturer, "Maker");
    std::strcpy(added.attributes.Model, "Model 1");
    added.attributes.NodeWWN = fakeWwn(static_cast<unsigned char>(handle));
    added.attributes.NumberOfPorts = static_cast<HBA_UINT32>(ports.size());
    for (const unsigned char port : ports) {
        added.ports.emplace_back().PortWWN = fakeWwn(port);
    }
    return added;
}

FakeAdapter& FakeHba::byHandle(HBA_HANDLE handle) {
    const auto found = std::find_if(adapters.begin(), adapters.end(),
                                    [&](const FakeAdapter& adapter) { return adapter.handle == handle; });
    if (found == adapters.end()) {
        std::abort();
    }
    return *found;
}

HBA_WWN fakeWwn(unsigned char last) {
    return {{0x50, 0x06, 0x01, 0x60, 0, 0, 0, last}};
}

HBA_FCPSCSIENTRY fakeEntry(const std::string& deviceName, HBA_UINT32 lun, unsigned char target) {
    HBA_FCPSCSIENTRY entry = {};
    std::memcpy(entry.ScsiId.OSDeviceName, deviceName.data(),
                std::min(deviceName.size(), sizeof entry.ScsiId.OSDeviceName));
    entry.ScsiId.ScsiBusNumber = 2;
    entry.ScsiId.ScsiTargetNumber = target;
    entry.ScsiId.ScsiOSLun = lun;
    entry.FcpId.FcId = 0x10000U + target;
    entry.FcpId.NodeWWN = fakeWwn(static_cast<unsigned char>(target + 0x80));
    entry.FcpId.PortWWN = fakeWwn(target);
    entry.FcpId.FcpLun = lun;
    return entry;
}

extern "C" {

HBA_STATUS HBA_LoadLibrary() {
    record("HBA_LoadLibrary");
    return hba().loadStatus;
}

HBA_STATUS HBA_FreeLibrary() {
    record("HBA_FreeLibrary");
    return HBA_STATUS_ERROR;
}

HBA_UINT32 HBA_GetNumberOfAdapters() {
    record("HBA_GetNumberOfAdapters");
    return static_cast<HBA_UINT32>(hba().adapters.size());
}

HBA_STATUS HBA_GetAdapterName(HBA_UINT32 adapterindex, char* adaptername) {
    record("HBA_GetAdapterName " + text(adapterindex));
    const FakeAdapter& adapter = hba().adapters.at(adapterindex);
    // As a library does that fills the field of 256 bytes.
    std::strncpy(adaptername, adapter.name.c_str(), 256);
    return adapter.nameStatus;
}

HBA_HANDLE HBA_OpenAdapter(char* adaptername) {
    record("HBA_OpenAdapter " + std::string(adaptername));
    for (const FakeAdapter& adapter : hba().adapters) {
        if (adapter.name == adaptername) {
            return adapter.handle;
        }
    }
    return 0;
}

void HBA_CloseAdapter(HBA_HANDLE handle) {
    record("HBA_CloseAdapter " + text(handle));
}

HBA_STATUS HBA_GetAdapterAttributes(HBA_HANDLE handle, HBA_ADAPTERATTRIBUTES* hbaattributes) {
    record("HBA_GetAdapterAttributes " + text(handle));
    const FakeAdapter& adapter = hba().byHandle(handle);
    *hbaattributes = adapter.attributes;
    return adapter.attributesStatus;
}

HBA_STATUS HBA_GetAdapterPortAttributes(HBA_HANDLE handle, HBA_UINT32 portindex,
                                        HBA_PORTATTRIBUTES* portattributes) {
    record("HBA_GetAdapterPortAttributes " + text(handle) + " " + text(portindex));
    const FakeAdapter& adapter = hba().byHandle(handle);
    *portattributes = adapter.ports.at(portindex);
    return portindex + 1 == adapter.ports.size() ? adapter.portStatus : HBA_STATUS{HBA_STATUS_OK};
}

HBA_STATUS HBA_GetFcpTargetMapping(HBA_HANDLE handle, HBA_FCPTARGETMAPPING* mapping) {
    const HBA_UINT32 asked = mapping->NumberOfEntries;
    record("HBA_GetFcpTargetMapping " + text(handle) + " " + text(asked));
    auto& answers = hba().byHandle(handle).mappings;
    if (answers.empty()) {
        return HBA_STATUS_ERROR;
    }
    const FakeMapping answer = answers.front();
    answers.pop_front();
    mapping->NumberOfEntries = answer.count;
    std::copy_n(answer.entries.begin(), std::min<std::size_t>(asked, answer.entries.size()), mapping->entry);
    return answer.status;
}
}
