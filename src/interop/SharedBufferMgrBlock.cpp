#include "interop/SharedBufferMgrBlock.h"

#include "diagnostics/CLStatusReport.h"
#include "loader/OpenCLLoader.h"

const std::vector<cl_event>& TopenCLSharedBufferMgrImpl::releaseWaitList()
{
    try {
        fReleaseWaitEvents.copyTo(fWaitListScratch);
    } catch (const std::bad_alloc&) {
        fReleaseWaitEvents.forEach(
            [](cl_event event) { reportFailure(ocl.clWaitForEvents(1, &event)); });
    }
    return fWaitListScratch;
}
