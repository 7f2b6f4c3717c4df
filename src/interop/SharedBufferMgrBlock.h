// The lock and the event lists of the shared-buffer manager. Internal.
#pragma once

#include "interop/ConcurrentEventList.h"

#include <mutex>
#include <vector>

#include <CL/cl.h>

struct TopenCLSharedBufferMgrImpl {
    // Returns the events that the next batch release waits for, as an array that is valid until the
    // next call. If memory for the array runs out, waits for each event and returns an empty array.
    const std::vector<cl_event>& releaseWaitList();

    // The events that the next batch release waits for. Each entry owns a reference.
    ConcurrentEventList fReleaseWaitEvents;
    // A contiguous copy of them for one release.
    std::vector<cl_event> fWaitListScratch;
    // Guards the records, and the batch inside the two destroy operations.
    std::mutex fMutex;
    // Events of unbatched releases that the renderer waits for. Borrowed.
    ConcurrentEventList fGraphicsWaitEvents;
};
