#include "foundation/trace.hpp"

#include "foundation/log.hpp"

namespace {

LogText entryText(const char* name, unsigned line) noexcept {
    return LogText().text("Entered Function ").string(name).text(" Line ").decimal(line).text("\n");
}

LogText exitText(const char* name, unsigned line) noexcept {
    return LogText().text("Left Function ").string(name).text(" Line ").decimal(line).text("\n");
}

} // namespace

void TRACE_ENTRY(const char* name, unsigned line) {
    entryText(name, line).write();
}

void TRACE_EXIT(const char* name, unsigned line) {
    exitText(name, line).write();
}

FunctionTrace::FunctionTrace(const char* name, unsigned line) : mName(name), mThrows(true) {
    TRACE_ENTRY(name, line);
}

FunctionTrace::FunctionTrace(std::nothrow_t /*tag*/, const char* name, unsigned line) noexcept
    : mName(name), mThrows(false) {
    entryText(name, line).writeNoThrow();
}

void FunctionTrace::log(const char* text) const {
    end(LogText().string(text));
}

void FunctionTrace::exit(unsigned line) const {
    end(exitText(mName, line));
}

void FunctionTrace::end(LogText text) const {
    if (mThrows) {
        text.write();
    } else {
        text.writeNoThrow();
    }
}
