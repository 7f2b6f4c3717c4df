#include "interop/SharedBufferMgrBlock.h"

#include "diagnostics/CLStatusReport.h"

const std::vector<cl_event>& TopenCLSharedBufferMgrImpl::releaseWaitList()
{
    try {
        fReleaseWaitEvents.copyTo(fWaitListScratch);
    } catch (const std::bad_alloc&) {
        fReleaseWaitEvents.forEach([](cl_event event) { waitForEvent(event); });
    }
    return fWaitListScratch;
}
