#include "foundation/assertion.hpp"

#include <cstdlib>

#include "foundation/log.hpp"

void assertionFailed(const char* conditionText) {
    // The process ends here whether or not the log still takes the line.
    logLineNoThrow("Assertion [ %s ] failed\n", {conditionText});
    std::exit(1);
}
