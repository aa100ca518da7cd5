#include "foundation/assertion.hpp"

#include <cstdlib>

#include "foundation/exceptions.hpp"
#include "foundation/log.hpp"

void assertionFailed(const char* conditionText) {
    LogText().text("Assertion [ ").string(conditionText).text(" ] failed\n").writeNoThrow();
    try {
        flushLog();
    } catch (const WriteFailedEx&) {
        // the process ends here whether or not the log still takes the line
    }
    std::exit(1);
}
