// The trace that every function with logic of its own leaves in the log: its entry, and its exit where the
// log's format has one.
#pragma once

#include <new>

#include "foundation/log.hpp"

// "Entered Function %s Line %u\n" and "Left Function %s Line %u\n". `name` is the bare function name, `line`
// the line of the statement itself. Throw as logPrintf.
void TRACE_ENTRY(const char* name, unsigned line = __builtin_LINE());
void TRACE_EXIT(const char* name, unsigned line = __builtin_LINE());

// One call of a traced function. Made as the function's first statement, which logs the entry; helpers that
// log for the function, or leave it, take the object. There is no exit at the end of its life: some ways out
// of a function leave no line, by the log's format. Members throw as logPrintf, those of a trace that was
// made with std::nothrow do not throw: an exception that leaves a destructor would end the program, so a line
// that the stream refuses is lost there.
class FunctionTrace {
public:
    // `name` outlives the object.
    explicit FunctionTrace(const char* name, unsigned line = __builtin_LINE());
    FunctionTrace(std::nothrow_t tag, const char* name, unsigned line = __builtin_LINE()) noexcept;
    FunctionTrace(const FunctionTrace&) = delete;
    FunctionTrace& operator=(const FunctionTrace&) = delete;
    ~FunctionTrace() = default;

    // Logs `text` as it stands.
    void log(const char* text) const;

    // Before each normal return.
    void exit(unsigned line = __builtin_LINE()) const;

    // Leaves the function: logs the exit and throws.
    template <typename Exception>
    [[noreturn]] void fail(const char* message, unsigned line = __builtin_LINE()) const {
        exit(line);
        throw Exception(message);
    }

    // Leaves the function after a last line of it: logs `text` and the exit, and throws. The exception says
    // the same as the line, or `message`.
    template <typename Exception>
    [[noreturn]] void logAndFail(const char* text, unsigned line = __builtin_LINE()) const {
        log(text);
        fail<Exception>(text, line);
    }
    template <typename Exception>
    [[noreturn]] void logAndFail(const char* text, const char* message,
                                 unsigned line = __builtin_LINE()) const {
        log(text);
        fail<Exception>(message, line);
    }

private:
    void end(LogText text) const;

    const char* mName;
    bool mThrows;
};
