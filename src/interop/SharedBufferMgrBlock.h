// The block behind the shared-buffer manager: its lock, its event lists, its profiler scopes.
// Internal.
#pragma once

#include "host/Profiler.h"

#include <atomic>
#include <cstddef>
#include <mutex>
#include <thread>
#include <vector>

#include <CL/cl.h>
#include <tbb/concurrent_vector.h>

// The event types of the batch's acquire and release, built when the library is loaded.
extern const profiler::EventType sfAcquireBatchEventType;
extern const profiler::EventType sfReleaseBatchEventType;

// The value of an evaluation id while no evaluation is open.
inline constexpr std::uint16_t kNoEvaluation = 0xFFFE;

// Events that several threads append at once, without a lock. All other operations but copyTo need
// the list to themselves.
class ConcurrentEventList {
public:
    ConcurrentEventList() { fEvents.reserve(kReservedEvents); }

    void append(const cl_event* events, std::size_t count)
    {
        for (std::size_t index = 0; index < count; ++index)
            fEvents.push_back(events[index]);
        fWritten.fetch_add(count, std::memory_order_release);
    }

    // Replaces the contents of `events` by the events appended so far, in order. May run beside
    // append: the list's size counts an entry before it is written, so it waits until all entries
    // are.
    void copyTo(std::vector<cl_event>& events) const
    {
        std::size_t count = fWritten.load(std::memory_order_acquire);
        while (count != fEvents.size()) {
            std::this_thread::yield();
            count = fWritten.load(std::memory_order_acquire);
        }
        events.assign(fEvents.begin(), fEvents.begin() + static_cast<std::ptrdiff_t>(count));
    }

    // Keeps the storage and releases nothing.
    void clear()
    {
        fEvents.clear();
        fWritten = 0;
    }

    bool empty() const { return fEvents.empty(); }
    auto begin() const { return fEvents.begin(); }
    auto end() const { return fEvents.end(); }

private:
    // More than the deformers of most scenes report in one evaluation; a longer list grows.
    static constexpr std::size_t kReservedEvents = 100;

    tbb::concurrent_vector<cl_event> fEvents;
    std::atomic<std::size_t> fWritten = 0;
};

struct TopenCLSharedBufferMgrImpl {
    // What the next batch release waits for. Each entry owns a reference.
    ConcurrentEventList fReleaseWaitEvents;
    // A contiguous copy of it, made for one release.
    std::vector<cl_event> fWaitListScratch;
    // Guards the records, and the batch inside the two destroy operations.
    std::mutex fMutex;
    // Events of single releases that the renderer waits for. Borrowed.
    ConcurrentEventList fGraphicsWaitEvents;
};

// An event of the host's profiler from construction to destruction, when the profiler records.
class ProfilerScope {
public:
    explicit ProfilerScope(const profiler::EventType& type) : fActive(profiler::samplingActive())
    {
        if (fActive)
            fEvent =
                profiler::eventBegin(type.categoryId(), type.color(), type.name(), "", nullptr, 0);
    }
    ~ProfilerScope()
    {
        if (fActive)
            profiler::eventEnd(fEvent);
    }
    ProfilerScope(const ProfilerScope&) = delete;
    ProfilerScope& operator=(const ProfilerScope&) = delete;

private:
    bool fActive;
    profiler::EventId fEvent = 0;
};

// Holders have the layout of bare handles, so an array of them serves as an array of handles.
template <typename Holder>
auto bareHandles(const Holder* holders)
{
    using Handle = decltype(holders->get());
    static_assert(sizeof(Holder) == sizeof(Handle));
    return reinterpret_cast<const Handle*>(holders);
}
