// The block behind the shared-buffer manager: its lock and its event lists. Internal.
#pragma once

#include "interop/ConcurrentEventList.h"

#include <cstdint>
#include <mutex>
#include <vector>

#include <CL/cl.h>

// The value of an evaluation id while no evaluation is open.
inline constexpr std::uint16_t kNoEvaluation = 0xFFFE;

struct TopenCLSharedBufferMgrImpl {
    // The events that the next batch release waits for, as one array that is valid until the next
    // call. Without memory for the array, waits for each event instead, and the array is empty.
    const std::vector<cl_event>& releaseWaitList();

    // What the next batch release waits for. Each entry owns a reference.
    ConcurrentEventList fReleaseWaitEvents;
    // A contiguous copy of it, made for one release.
    std::vector<cl_event> fWaitListScratch;
    // Guards the records, and the batch inside the two destroy operations.
    std::mutex fMutex;
    // Events of single releases that the renderer waits for. Borrowed.
    ConcurrentEventList fGraphicsWaitEvents;
};

// Holders have the layout of bare handles, so an array of them serves as an array of handles.
template <typename Holder>
auto bareHandles(const Holder* holders)
{
    using Handle = decltype(holders->get());
    static_assert(sizeof(Holder) == sizeof(Handle));
    return reinterpret_cast<const Handle*>(holders);
}
