#include "foundation/trace.hpp"

#include "foundation/log.hpp"

namespace {

constexpr const char* kEntry = "Entered Function %s Line %u\n";
constexpr const char* kExit = "Left Function %s Line %u\n";

} // namespace

void TRACE_ENTRY(const char* name, unsigned line) {
    logLine(kEntry, {name, line});
}

void TRACE_EXIT(const char* name, unsigned line) {
    logLine(kExit, {name, line});
}

FunctionTrace::FunctionTrace(const char* name, unsigned line) : mName(name), mThrows(true) {
    TRACE_ENTRY(name, line);
}

FunctionTrace::FunctionTrace(std::nothrow_t /*tag*/, const char* name, unsigned line) noexcept
    : mName(name), mThrows(false) {
    logLineNoThrow(kEntry, {name, line});
}

void FunctionTrace::log(const char* text) const {
    if (mThrows) {
        logLine("%s", {text});
    } else {
        logLineNoThrow("%s", {text});
    }
}

void FunctionTrace::exit(unsigned line) const {
    if (mThrows) {
        TRACE_EXIT(mName, line);
    } else {
        logLineNoThrow(kExit, {mName, line});
    }
}
