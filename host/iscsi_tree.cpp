#include "host/iscsi_tree.hpp"

#include "foundation/command_output.hpp"
#include "foundation/line_buffer.hpp"
#include "foundation/log.hpp"
#include "foundation/trace.hpp"
#include "host/iscsi_listing.hpp"
#include "main/shared/banner.hpp"
#include "main/shared/device_register.hpp"
#include "main/shared/device_report.hpp"
#include "main/shared/progress.hpp"

namespace {

constexpr const char* kSessionCommand = "/sbin/iscsiadm -m session --print=3 2>/dev/null";

} // namespace

void BuildIscsiTree_Linux() {
    const FunctionTrace trace("BuildIscsiTree_Linux");
    reportBanner("============= ISCSI DEVICE DETAILS =============");
    showProgress("iSCSI", "iscsiadm");
    CommandOutput output(kSessionCommand);
    if (!output.isOpen()) {
        reportPrintf("Failed to open pipe for /sbin/iscsiadm!\n\n");
        reportPrintf("Cannot proceed with building ISCSI tree\n");
        trace.exit();
        return;
    }
    gIscsiPortList.clear();
    IscsiListing listing;
    if (listing.readInitiatorIQN() != 0) {
        // The listing stays open, and its command is not waited for: without an initiator its sessions are
        // nobody's.
        output.leaveRunning();
        reportPrintf("Failed to read Initiator IQN \n\n");
        reportPrintf("Cannot proceed with building ISCSI tree\n");
        trace.exit();
        return;
    }
    LineBuffer lines;
    for (;;) {
        flushLog();
        char* const line = lines.next(output.stream());
        if (line == nullptr) {
            break;
        }
        listing.processCmdOutput(line);
    }
    output.close();
    gIscsiPortList = listing.takePorts();
    char ignoredName[] = "FAKEDEV";
    printDeviceTree(TREE_ISCSI, ignoredName);
    gIscsiPortList.clear();
    trace.exit();
}
