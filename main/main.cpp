// The entry: one linear run, from the log directory to the closing banner.
#include <sys/stat.h>
#include <unistd.h>

#include <cstdlib>
#include <exception>
#include <new>

#include "foundation/clib_path.hpp"
#include "foundation/clib_stream.hpp"
#include "foundation/exceptions.hpp"
#include "foundation/log.hpp"
#include "host/das_tree.hpp"
#include "host/iscsi_tree.hpp"
#include "host/logical_tree.hpp"
#include "main/fc_tree.hpp"
#include "main/shared/banner.hpp"
#include "main/shared/run_state.hpp"

namespace {

constexpr const char* kLogDirectory = "./MorvaneLogs";
constexpr const char* kLogFile = "./MorvaneLogs/Morvane.log";
constexpr mode_t kLogDirectoryMode = 0777; // less the umask

void makeLogDirectory() {
    struct stat status {};
    try {
        Clib_stat(kLogDirectory, &status);
    } catch (const ClibStatFailedEx&) {
        try {
            Clib_mkdir(kLogDirectory, kLogDirectoryMode);
        } catch (const ClibMkdirFailedEx&) {
            Clib_printf("Failed in creating the directory for keeping the log files\n");
            std::exit(1);
        } catch (const ExistsEx&) {
            return; // another process made it meanwhile
        }
    }
}

void openLog() {
    try {
        gLogStream = Clib_fopen(kLogFile, ClibFM_WriteUpdate);
    } catch (...) {
        Clib_printf("Failed in opening the logfile\n");
        std::exit(1);
    }
}

void checkMultipath() {
    reportBanner("\t\tCheck for Multipath software");
    logPrintf("Checking the powerpath\n");
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
    makeLogDirectory();
    openLog();
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
    Clib_printf("Test completed.\n");
}

} // namespace

int main() {
    try {
        run();
        return EXIT_SUCCESS;
    } catch (const std::exception& exception) {
        // Nothing stands between this failure and the end of the program; exit flushes the log so far.
        static_cast<void>(std::fputs(exception.what(), stderr));
    } catch (...) {
        static_cast<void>(std::fputs("unknown exception\n", stderr));
    }
    return EXIT_FAILURE;
}
