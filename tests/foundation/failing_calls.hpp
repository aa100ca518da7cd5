// C-library calls that no argument can make fail on every host: the test program has its own of each name,
// which fails on demand and passes on to the C library's otherwise.
#pragma once

#include <sys/time.h>

#include <optional>

struct FailingCalls {
    // errno of the failure to come, for the call of this name.
    std::optional<int> putenv = std::nullopt;
    std::optional<int> time = std::nullopt;
    std::optional<int> ctime_r = std::nullopt;
    std::optional<int> gmtime_r = std::nullopt;
    std::optional<int> localtime_r = std::nullopt;
    std::optional<int> gettimeofday = std::nullopt;
    std::optional<int> strdup = std::nullopt;

    std::optional<timeval> now = std::nullopt; // what gettimeofday tells

    // How many more non-throwing new expressions succeed.
    std::optional<int> nothrowNews = std::nullopt;
};

// The failures in force. A test sets what it needs and lets ScopedFailures take it back.
extern FailingCalls gFailingCalls;

struct ScopedFailures {
    explicit ScopedFailures(const FailingCalls& failures) { gFailingCalls = failures; }
    ScopedFailures(const ScopedFailures&) = delete;
    ScopedFailures& operator=(const ScopedFailures&) = delete;
    ~ScopedFailures() { gFailingCalls = {}; }
};
