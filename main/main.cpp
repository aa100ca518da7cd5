// The entry: one linear run, from the log directory to the closing banner.
#include <stdio_ext.h>
#include <unistd.h>

#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <exception>
#include <new>
#include <string>

#include "foundation/clib_error.hpp"
#include "foundation/clib_stream.hpp"
#include "foundation/exceptions.hpp"
#include "foundation/log.hpp"
#include "host/das_tree.hpp"
#include "host/iscsi_tree.hpp"
#include "host/logical_tree.hpp"
#include "main/fc_tree.hpp"
#include "main/log_file.hpp"
#include "main/shared/banner.hpp"
#include "main/shared/progress.hpp"
#include "main/shared/run_state.hpp"

namespace {

void checkMultipath() {
    reportBanner("\t\tCheck for Multipath software");
    logPrintf("Checking the powerpath\n");
    showProgress("multipath", "PowerPath");
    gPowerPath.sense();
    if (gPowerPath.isRunning()) {
        gPowerPath.printData();
    } else {
        reportPrintf("PowerPath is not Running\n");
    }
}

// Runs one tree's builder so that no failure of it stops the trees after it.
void runGuarded(const char* treeName, void (*buildTree)()) {
    try {
        buildTree();
    } catch (const std::exception& exception) {
        reportPrintf("Caught exception while building %s tree: %s\n", treeName, exception.what());
    }
}

void run() {
    gLogStream = openLogFile();
    checkMultipath();

    gHostName = new (std::nothrow) char[kHostNameSize]();
    if (gHostName == nullptr) {
        throw NoMemoryEx("No Memory\n");
    }
    runGuarded("FC", BuildFcTree);
    // Only the trees after FC know the host's name. Linux host names end within 65 bytes.
    static_cast<void>(gethostname(gHostName, kHostNameSize));
    runGuarded("ISCSI", BuildIscsiTree_Linux);
    runGuarded("DAS", BuildDasTree_Linux);
    runGuarded("LOGICAL", BuildLogicalTree_Linux);

    reportBanner("\t\t\t   END ");
    if (gHostName != nullptr) {
        delete[] gHostName;
        gHostName = nullptr;
    }
    clearProgress();
    completeLogFile(gLogStream);
    Clib_printf("Test completed.\n");
    if (std::fflush(stdout) != 0) {
        const std::string reason = std::string("standard output: ") + ErrnoText().text;
        __fpurge(stdout); // exit would try again, and might succeed
        throw WriteFailedEx(reason.c_str());
    }
}

// The log up to a failure is what tells of it.
void keepLog() noexcept {
    try {
        flushLog();
    } catch (const WriteFailedEx&) {
        return; // told by tellFailure
    }
}

// Says in one line of standard error why the run could not go on, without memory of its own. A log that could
// not take something is behind whatever came of it.
void tellFailure(const char* message) noexcept {
    clearProgress();
    keepLog();
    if (logError() != 0) {
        static_cast<void>(std::fprintf(stderr, "morvane: %s: %s\n", kLogFile, ErrnoText(logError()).text));
    } else {
        const int length = static_cast<int>(std::strcspn(message, "\n"));
        static_cast<void>(std::fprintf(stderr, "morvane: %.*s\n", length, message));
    }
}

} // namespace

int main() {
    static_cast<void>(std::atexit(clearProgress)); // for a failed assertion, too
    static_cast<void>(
        std::signal(SIGXFSZ, SIG_IGN)); // a limit of the log's size is a text that it cannot take
    try {
        run();
        return EXIT_SUCCESS;
    } catch (const std::exception& exception) {
        // Nothing stands between this failure and the end of the program.
        tellFailure(exception.what());
    } catch (...) {
        tellFailure("unknown exception");
    }
    return EXIT_FAILURE;
}
