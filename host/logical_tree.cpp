#include "host/logical_tree.hpp"

#include <cstring>
#include <exception>

#include "foundation/clib_stream.hpp"
#include "foundation/trace.hpp"
#include "main/device_register.hpp"
#include "main/device_report.hpp"

namespace {

constexpr uint32 kGathered = 0;
constexpr uint32 kGatherFailed = 7;
constexpr int kLineSize = 256;

// Reports the device of one line: the text after its last space. `line` is changed.
void reportLine(char* line) {
    line[std::strcspn(line, "\n")] = '\0';
    char* position = line + std::strlen(line);
    while (position > line && *position != ' ') {
        --position;
    }
    const bool isBlank = line[std::strspn(line, " ")] == '\0';
    if (position == line || isBlank) {
        Clib_fprintf(gLogStream, "Invalid /proc/pratitions entry: %s", line);
        return;
    }
    printDeviceTree(TREE_LOGICAL, position + 1);
}

} // namespace

uint32 gatherLogicalInfo() {
    try {
        TRACE_ENTRY("gatherLogicalInfo");
        std::FILE* const stream = Clib_fopen("/proc/partitions", ClibFM_Read);
        char line[kLineSize] = {};
        while (Clib_fgets(line, sizeof line, stream) != nullptr) {
            if (line[0] == ' ') { // the heading and the empty line after it do not begin so
                reportLine(line);
            }
        }
        Clib_fclose(stream);
        TRACE_EXIT("gatherLogicalInfo");
        return kGathered;
    } catch (const std::exception&) {
        Clib_fprintf(gLogStream, "Could not open /proc/partitions for read!");
        return kGatherFailed;
    }
}

void BuildLogicalTree_Linux() {
    TRACE_ENTRY("BuildLogicalTree_Linux");
    Clib_fprintf(gLogStream, "\n================================================\n");
    Clib_fprintf(gLogStream, "============ LOGICAL DEVICE DETAILS ============");
    Clib_fprintf(gLogStream, "\n================================================\n");
    if (gatherLogicalInfo() != 0) {
        Clib_fprintf(gLogStream,
                     "Error occured while reading Logical devices. Failed to build Logical tree.\n");
    }
    TRACE_EXIT("BuildLogicalTree_Linux");
}
