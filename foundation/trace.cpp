#include "foundation/trace.hpp"

#include "foundation/log.hpp"

void TRACE_ENTRY(const char* name, unsigned line) {
    logPrintf("Entered Function %s Line %u\n", name, line);
}

void TRACE_EXIT(const char* name, unsigned line) {
    logPrintf("Left Function %s Line %u\n", name, line);
}

FunctionTrace::FunctionTrace(const char* name, unsigned line) : mName(name), mThrows(true) {
    TRACE_ENTRY(name, line);
}

FunctionTrace::FunctionTrace(std::nothrow_t /*tag*/, const char* name, unsigned line) noexcept
    : mName(name), mThrows(false) {
    logPrintfNoThrow("Entered Function %s Line %u\n", name, line);
}

void FunctionTrace::log(const char* text) const {
    if (mThrows) {
        logPrintf("%s", text);
    } else {
        logPrintfNoThrow("%s", text);
    }
}

void FunctionTrace::exit(unsigned line) const {
    if (mThrows) {
        TRACE_EXIT(mName, line);
    } else {
        logPrintfNoThrow("Left Function %s Line %u\n", mName, line);
    }
}
