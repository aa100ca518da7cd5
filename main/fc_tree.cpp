#include "main/fc_tree.hpp"

#include "fc/tree_build.hpp"
#include "foundation/clib_stream.hpp"
#include "foundation/exceptions.hpp"
#include "foundation/trace.hpp"

void BuildFcTree() {
    TRACE_ENTRY("BuildFcTree");
    Clib_fprintf(gLogStream, "\n================================================\n");
    Clib_fprintf(gLogStream, "============== FC DEVICE DETAILS ===============");
    Clib_fprintf(gLogStream, "\n================================================\n");
    try {
        sFirstBuildAndOutput();
        cleanUpFcTree();
    } catch (const THaltEx&) {
        throw;
    } catch (const THbaapiEx&) {
        logPrintf("Caught an Hbaapi Exception in testing 'BuildFcTree\n'");
    } catch (const TException& exception) {
        logPrintf("Caught Exception (%s) in testing 'BuildFcTree\n'", exception.what());
    }
    TRACE_EXIT("BuildFcTree");
}
