#include "host/das_tree.hpp"

#include <unistd.h>

#include <cstring>

#include "foundation/clib_memory.hpp"
#include "foundation/clib_stream.hpp"
#include "foundation/directory.hpp"
#include "foundation/log.hpp"
#include "foundation/trace.hpp"
#include "main/shared/banner.hpp"
#include "main/shared/device_register.hpp"
#include "main/shared/device_report.hpp"

namespace {

constexpr uint32 kGathered = 0;
constexpr uint32 kGatherFailed = 5;

// Whether the link at `path` can be read and leads elsewhere than to `virtualPrefix`, where the kernel keeps
// its virtual devices.
template <std::size_t Size>
bool leadsToHardware(const char* path, const char (&virtualPrefix)[Size]) {
    char target[1024] = {};
    const ssize_t length = readlink(path, target, sizeof target - 1);
    return length >= 1 && Clib_strncmp(target, virtualPrefix, Size - 1) != 0;
}

bool isCandidate(const dirent& entry) {
    char path[128] = {};
    switch (entry.d_type) {
    case DT_LNK: // newer kernels: the entry leads to the device
        Clib_snprintf(path, sizeof path, "/sys/block/%s", entry.d_name);
        return leadsToHardware(path, "../devices/virtual/");
    case DT_DIR: // older kernels: a link in the entry does
        if (Clib_strcmp(entry.d_name, ".") == 0 || Clib_strcmp(entry.d_name, "..") == 0) {
            return false;
        }
        Clib_snprintf(path, sizeof path, "/sys/block/%s/device", entry.d_name);
        return leadsToHardware(path, "../../devices/virtual/");
    default:
        reportPrintf("|%s| is of no interest to us. Ignoring", entry.d_name);
        return false;
    }
}

} // namespace

uint32 gatherDasInfo() {
    const FunctionTrace trace("gatherDasInfo");
    const Directory directory("/sys/block/");
    if (!directory.isOpen()) {
        reportPrintf("Failed to open path '/sys/block/' can not get DAS info");
        trace.exit();
        return kGatherFailed;
    }
    while (dirent* const entry = directory.next()) {
        if (isCandidate(*entry)) {
            printDeviceTree(TREE_DAS, entry->d_name);
        }
    }
    trace.exit();
    return kGathered;
}

void BuildDasTree_Linux() {
    const FunctionTrace trace("BuildDasTree_Linux");
    reportBanner("============== DAS DEVICE DETAILS ==============");
    if (gatherDasInfo() != 0) {
        reportPrintf("Error occured while fetching DAS devices. Failed to build DAS tree.\n");
    }
    trace.exit();
}
