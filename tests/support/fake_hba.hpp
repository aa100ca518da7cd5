// The HBA API library, scripted by the test. Its functions stand in front of the real library's.
#pragma once

#include <deque>
#include <initializer_list>
#include <string>
#include <vector>

#include "fc/hba_api.hpp"

// An answer to HBA_GetFcpTargetMapping: the status, the count that it reports, and the entries, of which it
// writes no more than it is asked for.
struct FakeMapping {
    HBA_STATUS status = HBA_STATUS_OK;
    HBA_UINT32 count = 0;
    std::vector<HBA_FCPSCSIENTRY> entries;
};

struct FakeAdapter {
    std::string name;
    HBA_STATUS nameStatus = HBA_STATUS_OK;
    HBA_HANDLE handle = 0; // 0: it cannot be opened
    HBA_STATUS attributesStatus = HBA_STATUS_OK;
    HBA_ADAPTERATTRIBUTES attributes = {};
    std::vector<HBA_PORTATTRIBUTES> ports;
    HBA_STATUS portStatus = HBA_STATUS_OK; // of the last port; the others are HBA_STATUS_OK
    std::deque<FakeMapping> mappings;      // answers, in order; none: HBA_STATUS_ERROR
};

// While it lives, the library knows these adapters.
class FakeHba {
public:
    FakeHba();
    FakeHba(const FakeHba&) = delete;
    FakeHba& operator=(const FakeHba&) = delete;
    ~FakeHba();

    // Adds an adapter of that name, whose ports have these last bytes in their WWPNs.
    FakeAdapter& adapter(const std::string& name, HBA_HANDLE handle,
                         std::initializer_list<unsigned char> ports);

    FakeAdapter& byHandle(HBA_HANDLE handle);

    HBA_STATUS loadStatus = HBA_STATUS_OK;
    std::deque<FakeAdapter> adapters;
    std::vector<std::string> calls; // those that the library got, with their arguments
};

// 50:06:01:60:00:00:00:`last`
HBA_WWN fakeWwn(unsigned char last);

// The mapping of one LUN: OS device name, LUN, and the last bytes of the target's WWPN. Its WWNN ends in
// the same byte plus 0x80.
HBA_FCPSCSIENTRY fakeEntry(const std::string& deviceName, HBA_UINT32 lun, unsigned char target);
