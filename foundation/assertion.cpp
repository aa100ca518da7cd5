#include "foundation/assertion.hpp"

#include <cstdio>
#include <cstdlib>

#include "foundation/exceptions.hpp"
#include "foundation/log.hpp"

void assertionFailed(const char* conditionText) {
    LogText().text("Assertion [ ").string(conditionText).text(" ] failed\n").writeNoThrow();
    try {
        flushLog();
    } catch (const WriteFailedEx&) {
        // The process ends here whether or not the log still takes the line.
        static_cast<void>(std::fprintf(stderr, "Assertion [ %s ] failed\n", conditionText));
    }
    std::exit(1);
}
