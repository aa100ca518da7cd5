#include "host/das_tree.hpp"

#include <unistd.h>

#include <cstring>

#include "foundation/clib_memory.hpp"
#include "foundation/clib_stream.hpp"
#include "foundation/trace.hpp"
#include "host/directory.hpp"
#include "main/device_register.hpp"
#include "main/device_report.hpp"

namespace {

constexpr uint32 kGathered = 0;
constexpr uint32 kGatherFailed = 5;

// Whether the link that `pathFormat` names for `entryName` can be read and leads elsewhere than to
// `virtualPrefix`, where the kernel keeps its virtual devices.
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
        Clib_fprintf(gLogStream, "|%s| is of no interest to us. Ignoring", entry.d_name);
        return false;
    }
}

} // namespace

uint32 gatherDasInfo() {
    TRACE_ENTRY("gatherDasInfo");
    const Directory directory("/sys/block/");
    if (!directory.isOpen()) {
        Clib_fprintf(gLogStream, "Failed to open path '/sys/block/' can not get DAS info");
        TRACE_EXIT("gatherDasInfo");
        return kGatherFailed;
    }
    while (dirent* const entry = directory.next()) {
        if (isCandidate(*entry)) {
            printDeviceTree(TREE_DAS, entry->d_name);
        }
    }
    TRACE_EXIT("gatherDasInfo");
    return kGathered;
}

void BuildDasTree_Linux() {
    TRACE_ENTRY("BuildDasTree_Linux");
    Clib_fprintf(gLogStream, "\n================================================\n");
    Clib_fprintf(gLogStream, "============== DAS DEVICE DETAILS ==============");
    Clib_fprintf(gLogStream, "\n================================================\n");
    if (gatherDasInfo() != 0) {
        Clib_fprintf(gLogStream, "Error occured while fetching DAS devices. Failed to build DAS tree.\n");
    }
    TRACE_EXIT("BuildDasTree_Linux");
}
