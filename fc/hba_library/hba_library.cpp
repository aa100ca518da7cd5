// The HBA API library for a build that does not link it, so that the program starts on a host without one.
// These are the functions that the Fibre Channel tree calls, under the library's own names; each hands its
// call on to libHBAAPI.so.2, which HBA_LoadLibrary loads. The others may be called once HBA_LoadLibrary has
// returned HBA_STATUS_OK.
#include <dlfcn.h>
#include <sys/prctl.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <csignal>
#include <cstdio>
#include <cstring>

#include "fc/hba_api.hpp"

namespace {

constexpr const char* kLibrary = "libHBAAPI.so.2";

struct HbaFunctions {
    decltype(&HBA_LoadLibrary) loadLibrary;
    decltype(&HBA_FreeLibrary) freeLibrary;
    decltype(&HBA_GetNumberOfAdapters) getNumberOfAdapters;
    decltype(&HBA_GetAdapterName) getAdapterName;
    decltype(&HBA_OpenAdapter) openAdapter;
    decltype(&HBA_CloseAdapter) closeAdapter;
    decltype(&HBA_GetAdapterAttributes) getAdapterAttributes;
    decltype(&HBA_GetAdapterPortAttributes) getAdapterPortAttributes;
    decltype(&HBA_GetFcpTargetMapping) getFcpTargetMapping;
};

HbaFunctions gHba; // null until the library is loaded

template <typename Function>
bool find(void* library, const char* name, Function*& function) {
    function = reinterpret_cast<Function*>(dlsym(library, name));
    return function != nullptr;
}

// The functions by their names. False when the library lacks one.
bool findAll(void* library) {
    return find(library, "HBA_LoadLibrary", gHba.loadLibrary) &&
           find(library, "HBA_FreeLibrary", gHba.freeLibrary) &&
           find(library, "HBA_GetNumberOfAdapters", gHba.getNumberOfAdapters) &&
           find(library, "HBA_GetAdapterName", gHba.getAdapterName) &&
           find(library, "HBA_OpenAdapter", gHba.openAdapter) &&
           find(library, "HBA_CloseAdapter", gHba.closeAdapter) &&
           find(library, "HBA_GetAdapterAttributes", gHba.getAdapterAttributes) &&
           find(library, "HBA_GetAdapterPortAttributes", gHba.getAdapterPortAttributes) &&
           find(library, "HBA_GetFcpTargetMapping", gHba.getFcpTargetMapping);
}

// One line on standard error: what is missing, or wrong with the library. Needs no memory.
void complain(const char* what, const char* reason = "") noexcept {
    static_cast<void>(std::fprintf(stderr, "morvane: no Fibre Channel report: %s%s\n", what, reason));
}

// Loads the library for good, its symbols there for the vendors' libraries as if it were linked. False, with
// a complaint, when it cannot be loaded or lacks a function.
bool load() noexcept {
    void* const library = dlopen(kLibrary, RTLD_NOW | RTLD_GLOBAL);
    if (library != nullptr && findAll(library)) {
        return true;
    }
    const char* const reason = dlerror(); // none for a function that is there and leads nowhere
    complain(reason != nullptr ? reason : "libHBAAPI.so.2 lacks a function");
    if (library != nullptr) {
        dlclose(library);
    }
    return false;
}

// Whether the library loads in a process of its own. A file that was cut off lacks pages that its headers
// promise, and whoever touches one is ended by a signal: not the run. False, with a complaint, when it does
// not load.
bool loadsElsewhere() {
    // Whoever started the program may have had its children's ends ignored; then there would be none to wait
    // for.
    struct sigaction before {};
    struct sigaction usual {};
    usual.sa_handler = SIG_DFL;
    sigaction(SIGCHLD, &usual, &before);
    const pid_t child = fork();
    if (child == 0) {
        prctl(PR_SET_PDEATHSIG, SIGKILL); // holds nothing of the run's beyond its end
        prctl(PR_SET_DUMPABLE, 0);        // leaves no core file
        _exit(load() ? 0 : 1);            // without a second flush of the log
    }
    int status = 0;
    const bool isOver = child > 0 && TEMP_FAILURE_RETRY(waitpid(child, &status, 0)) == child;
    const int error = errno;
    sigaction(SIGCHLD, &before, nullptr);
    if (!isOver) {
        complain(std::strerror(error));
        return false;
    }
    if (WIFSIGNALED(status)) {
        complain("libHBAAPI.so.2 is damaged: ", strsignal(WTERMSIG(status)));
        return false;
    }
    return status == 0;
}

} // namespace

HBA_STATUS HBA_LoadLibrary() {
    return loadsElsewhere() && load() ? gHba.loadLibrary() : HBA_STATUS_ERROR;
}

HBA_STATUS HBA_FreeLibrary() {
    return gHba.freeLibrary();
}

HBA_UINT32 HBA_GetNumberOfAdapters() {
    return gHba.getNumberOfAdapters();
}

HBA_STATUS HBA_GetAdapterName(HBA_UINT32 index, char* name) {
    return gHba.getAdapterName(index, name);
}

HBA_HANDLE HBA_OpenAdapter(char* name) {
    return gHba.openAdapter(name);
}

void HBA_CloseAdapter(HBA_HANDLE handle) {
    gHba.closeAdapter(handle);
}

HBA_STATUS HBA_GetAdapterAttributes(HBA_HANDLE handle, HBA_ADAPTERATTRIBUTES* attributes) {
    return gHba.getAdapterAttributes(handle, attributes);
}

HBA_STATUS HBA_GetAdapterPortAttributes(HBA_HANDLE handle, HBA_UINT32 index, HBA_PORTATTRIBUTES* attributes) {
    return gHba.getAdapterPortAttributes(handle, index, attributes);
}

HBA_STATUS HBA_GetFcpTargetMapping(HBA_HANDLE handle, HBA_FCPTARGETMAPPING* mapping) {
    return gHba.getFcpTargetMapping(handle, mapping);
}
