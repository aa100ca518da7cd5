// open-iscsi's initiator-name file. The input is the file.
#include "host/iscsi_listing.hpp"
#include "main/shared/run_state.hpp"
#include "tests/fuzz/harness.hpp"

extern "C" int LLVMFuzzerTestOneInput(const uint8* data, std::size_t size) {
    static char sHostName[kHostNameSize] = "fuzzhost";
    gHostName = sHostName;
    Input input(data, size);
    gHost.files["/etc/iscsi/initiatorname.iscsi"] = input.rest();
    runInput({}, [] {
        IscsiListing listing;
        require(listing.readInitiatorIQN() == 0, "a file that is there and cannot be opened");
    });
    return 0;
}
