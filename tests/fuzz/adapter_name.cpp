// The name that an HBA library gives an adapter, which is expanded as a printf format without arguments. The
// input is the name, up to its first NUL.
#include "fc/tree_build.hpp"
#include "tests/fuzz/harness.hpp"

extern "C" int LLVMFuzzerTestOneInput(const uint8* data, std::size_t size) {
    Input input(data, size);
    const std::string_view field = input.take(256);
    const std::string name(field.substr(0, field.find('\0')));
    runInput({}, [&] {
        const std::string expanded = expandAdapterName(name.c_str());
        require(expanded.size() <= name.size(), "a name that grows");
        if (name.find('%') == std::string::npos) {
            require(expanded == name, "a plain name that changes");
        }
    });
    return 0;
}
