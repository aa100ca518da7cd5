#include "main/status.hpp"

const char* getStatusString(uint32 code) {
    constexpr uint32 kLastNamedCode = 3;
    static const char* const kNames[] = {"Success", "Generic Error", "Hbaapi Error", "Not Implemented",
                                         "No Tree"};
    return code > kLastNamedCode ? "Invalid Status Code\n" : kNames[code];
}
