// The pieces that a run is made of: a trace line, a page's designators, a look into the register of devices.
#include <cstdio>
#include <string>

#include <benchmark/benchmark.h>

#include "foundation/log.hpp"
#include "foundation/trace.hpp"
#include "main/shared/device_register.hpp"
#include "scsi/inquiry.hpp"

namespace {

// Into the null device, through a stream's buffer as the log's.
void useNullLog() {
    if (gLogStream == nullptr) {
        gLogStream = std::fopen("/dev/null", "w");
    }
}

void plainFprintf(benchmark::State& state) {
    useNullLog();
    for (auto _ : state) {
        std::fprintf(gLogStream, "Entered Function %s Line %u\n", "doScsiIo", 123U);
    }
}
BENCHMARK(plainFprintf);

void traceLine(benchmark::State& state) {
    useNullLog();
    for (auto _ : state) {
        TRACE_ENTRY("doScsiIo");
    }
}
BENCHMARK(traceLine);

// Two designators, T10 vendor and NAA, with the log's lines.
void walkOfPage83(benchmark::State& state) {
    useNullLog();
    const std::string page("\x00\x83\x00\x24"
                           "\x02\x01\x00\x0c"
                           "DGC     1234"
                           "\x01\x03\x00\x10"
                           "0123456789abcdef",
                           40);
    ZebScsiInquiry inquiry;
    ZebScsiInquiry::Response response;
    response.create(
        new ZebBuffer(reinterpret_cast<const uint8*>(page.data()), static_cast<uint32>(page.size())),
        ZebPST_Individual, ZebPAT_New);
    for (auto _ : state) {
        uint32 offset = 0;
        for (int designator = 0; designator < 2; ++designator) {
            uint32 type = 0;
            uint32 association = 0;
            ZebString text("");
            inquiry.getDiPageIdentifierAscii(response, offset, type, association, text);
            benchmark::DoNotOptimize(text);
        }
    }
}
BENCHMARK(walkOfPage83);

// Among as many names as the argument says.
void lookIntoRegister(benchmark::State& state) {
    useNullLog();
    DevMap.clear();
    for (int64_t i = 0; i < state.range(0); ++i) {
        addDeviceNameMap(TREE_FC, ("/dev/sd" + std::to_string(i)).c_str());
    }
    const ZebString name("/dev/sd7");
    for (auto _ : state) {
        benchmark::DoNotOptimize(getDeviceType(name));
    }
    DevMap.clear();
}
BENCHMARK(lookIntoRegister)->Arg(10)->Arg(100)->Arg(1000)->Arg(10000);

} // namespace

BENCHMARK_MAIN();
