#include "host/logical_tree.hpp"

#include <cstring>
#include <exception>
#include <memory>

#include "foundation/clib_stream.hpp"
#include "foundation/log.hpp"
#include "foundation/trace.hpp"
#include "main/shared/banner.hpp"
#include "main/shared/device_register.hpp"
#include "main/shared/device_report.hpp"

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
        reportPrintf("Invalid /proc/pratitions entry: %s", line);
        return;
    }
    printDeviceTree(TREE_LOGICAL, position + 1);
}

} // namespace

uint32 gatherLogicalInfo() {
    try {
        const FunctionTrace trace("gatherLogicalInfo");
        flushLog();
        std::unique_ptr<std::FILE, decltype(&std::fclose)> stream(Clib_fopen("/proc/partitions", ClibFM_Read),
                                                                  &std::fclose);
        char line[kLineSize] = {};
        while (Clib_fgets(line, sizeof line, stream.get()) != nullptr) {
            if (line[0] == ' ') { // the heading and the empty line after it do not begin so
                reportLine(line);
            }
        }
        Clib_fclose(stream.release());
        trace.exit();
        return kGathered;
    } catch (const std::exception&) {
        reportPrintf("Could not open /proc/partitions for read!");
        return kGatherFailed;
    }
}

void BuildLogicalTree_Linux() {
    const FunctionTrace trace("BuildLogicalTree_Linux");
    reportBanner("============ LOGICAL DEVICE DETAILS ============");
    if (gatherLogicalInfo() != 0) {
        reportPrintf("Error occured while reading Logical devices. Failed to build Logical tree.\n");
    }
    trace.exit();
}
