// The block behind the shared-buffer manager: its lock and its event lists. Internal.
#pragma once

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <mutex>
#include <thread>
#include <vector>

#include <CL/cl.h>
#include <tbb/concurrent_vector.h>

// The value of an evaluation id while no evaluation is open.
inline constexpr std::uint16_t kNoEvaluation = 0xFFFE;

// Events that several threads append at once, without a lock. All other operations but copyTo need
// the list to themselves.
class ConcurrentEventList {
public:
    ConcurrentEventList() { fEvents.reserve(kReservedEvents); }

    void append(cl_event event)
    {
        fEvents.push_back(event);
        fWritten.fetch_add(1, std::memory_order_release);
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

// Holders have the layout of bare handles, so an array of them serves as an array of handles.
template <typename Holder>
auto bareHandles(const Holder* holders)
{
    using Handle = decltype(holders->get());
    static_assert(sizeof(Holder) == sizeof(Handle));
    return reinterpret_cast<const Handle*>(holders);
}
