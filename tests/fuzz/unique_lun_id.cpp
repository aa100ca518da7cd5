// The choice of a LUN's identifier, and the vendor line before it, on a device that answers each command as
// it likes. The input is the request flag's byte (modulo 3: FC, DAS, iSCSI) and the answers, command by
// command, as scripted_device.hpp has them.
#include "fc/identity/unique_lun_id.hpp"

#include "main/shared/run_state.hpp"
#include "tests/fuzz/scripted_device.hpp"

extern "C" int LLVMFuzzerTestOneInput(const uint8* data, std::size_t size) {
    Input input(data, size);
    const uint32 flags[] = {1, 2, 4};
    uint32 requestFlag = flags[input.byte() % 3];
    gDirectAttachedFlag = false;
    gHost.device = [&](sg_io_hdr& header) { return answerFrom(input, header); };
    // A page whose second reading is empty, or has no length any more, breaks the walk's own condition.
    runInput({"0 != lcListLength"}, [&] {
        ZebString identifier("");
        HA_GetScsiUniqueLunId("/dev/sda", identifier, requestFlag);
        require(!gDirectAttachedFlag || requestFlag == 2, "a direct-attached device nobody asked for");
        require(!gDirectAttachedFlag || identifier.empty(), "an identifier besides the direct-attached flag");
        HA_PrintVendorProductId("/dev/sda;1");
    });
    return 0;
}
