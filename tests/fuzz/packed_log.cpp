// A stream that may hold a packed log, read to its end, which comes whatever it unpacks to.
#include <sstream>
#include <string>

#include "tests/fuzz/input.hpp"
#include "view/read/log_bytes.hpp"
#include "view/read/log_reader.hpp"

extern "C" int LLVMFuzzerTestOneInput(const uint8* data, std::size_t size) {
    Input input(data, size);
    std::istringstream stream{std::string(input.rest())};
    try {
        const view::Model model = view::readLog(stream, "log");
        require(model.log.knownBytes + model.log.unknownBytes == model.log.bytes,
                "bytes neither known nor unknown");
        require(model.log.damage.empty() || !model.log.complete, "a damaged log that is whole");
    } catch (const view::NotALog&) {
        return 0;
    } catch (const view::UnpacksTooFar&) {
        return 0;
    }
    return 0;
}
