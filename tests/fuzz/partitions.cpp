// The lines of /proc/partitions. The input is the file.
#include "host/logical_tree.hpp"
#include "main/shared/run_state.hpp"
#include "tests/fuzz/harness.hpp"

extern "C" int LLVMFuzzerTestOneInput(const uint8* data, std::size_t size) {
    static char sHostName[kHostNameSize] = "fuzzhost";
    gHostName = sHostName;
    Input input(data, size);
    gHost.files["/proc/partitions"] = input.rest();
    runInput({}, [] { require(gatherLogicalInfo() == 0, "a file that is there and cannot be read"); });
    return 0;
}
