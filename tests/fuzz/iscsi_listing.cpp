// The session listing of iscsiadm: the whole tree, from the listing to its report. The input is the listing.
#include "host/iscsi_tree.hpp"
#include "main/shared/device_register.hpp"
#include "main/shared/iscsi_model.hpp"
#include "main/shared/run_state.hpp"
#include "tests/fuzz/harness.hpp"

namespace {

// Takes back what the listing before this one has left.
void forgetDisks() {
    DevMap.clear();
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8* data, std::size_t size) {
    static char sHostName[kHostNameSize] = "fuzzhost";
    gHostName = sHostName;
    Input input(data, size);
    const std::string listing(input.rest());
    runInput({}, forgetDisks);
    gHost.files["/etc/iscsi/initiatorname.iscsi"] = "InitiatorName=iqn.2004-10.org.example:host\n";
    gHost.command = [&](const std::string& /*command*/) { return &listing; };
    gHost.device = [](sg_io_hdr& /*header*/) { return ENOTTY; }; // every disk is there, and none answers
    runInput({}, [] {
        BuildIscsiTree_Linux();
        require(gIscsiPortList.empty(), "a tree that leaves its ports behind");
    });
    return 0;
}
