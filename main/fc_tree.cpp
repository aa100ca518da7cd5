#include "main/fc_tree.hpp"

#include "fc/tree_build.hpp"
#include "foundation/exceptions.hpp"
#include "foundation/log.hpp"
#include "foundation/trace.hpp"
#include "main/shared/banner.hpp"

void BuildFcTree() {
    const FunctionTrace trace("BuildFcTree");
    reportBanner("============== FC DEVICE DETAILS ===============");
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
    trace.exit();
}
