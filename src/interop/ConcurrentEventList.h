// A list of events to which several threads append. Internal.
#pragma once

#include <algorithm>
#include <atomic>
#include <cstddef>
#include <mutex>
#include <new>
#include <thread>
#include <vector>

#include <CL/cl.h>
#include <tbb/concurrent_vector.h>

// A list to which any number of threads append at the same time. An append needs no lock unless the
// list becomes longer than ever before. Borrows the events.
//
// append and copyTo may run at the same time; no other function may overlap with another.
class ConcurrentEventList {
public:
    ConcurrentEventList() { grow(0); }

    // Appends an event, which may be null. Throws std::bad_alloc, and appends nothing, when memory
    // runs out.
    void append(cl_event event)
    {
        std::size_t index = fSize.load(std::memory_order_relaxed);
        do {
            if (index >= fSlotCount.load(std::memory_order_acquire))
                grow(index);
        } while (!fSize.compare_exchange_weak(index, index + 1, std::memory_order_release,
                                              std::memory_order_relaxed));
        Slot& slot = fSlots[index];
        slot.event = event;
        slot.isWritten.store(true, std::memory_order_release);
    }

    // Calls `use` with each event, in order.
    template <typename Use>
    void forEach(const Use& use) const
    {
        forFirst(fSize.load(std::memory_order_acquire), use);
    }

    // Replaces the contents of `events` by the events appended so far, in order. Throws
    // std::bad_alloc, and leaves `events` empty, when memory runs out.
    void copyTo(std::vector<cl_event>& events) const
    {
        const std::size_t size = fSize.load(std::memory_order_acquire);
        events.clear();
        events.reserve(size);
        forFirst(size, [&](cl_event event) { events.push_back(event); });
    }

    // Removes all events without releasing them. Keeps the storage.
    void clear()
    {
        const std::size_t size = fSize.exchange(0);
        for (std::size_t index = 0; index < size; ++index)
            fSlots[index].isWritten.store(false, std::memory_order_relaxed);
        if (!canGrow()) {
            tbb::concurrent_vector<Slot>().swap(fSlots);
            fSlotCount = 0;
        }
    }

private:
    struct Slot {
        cl_event event = nullptr;
        std::atomic<bool> isWritten = false;
    };

    // Most scenes report fewer events in one evaluation.
    static constexpr std::size_t kReservedEvents = 100;

    template <typename Use>
    void forFirst(std::size_t count, const Use& use) const
    {
        for (std::size_t index = 0; index < count; ++index)
            use(written(index));
    }

    // Growth that runs out of memory leaves a vector that cannot grow any more; clear replaces it.
    bool canGrow() const noexcept { return fSlots.size() == fSlotCount; }

    // Creates the slot at `index`, and as many again, unless another thread has done so.
    void grow(std::size_t index)
    {
        const std::scoped_lock lock(fGrowth);
        if (index < fSlotCount)
            return;
        if (!canGrow())
            throw std::bad_alloc();
        fSlots.grow_to_at_least(std::max(2 * index, kReservedEvents));
        fSlotCount.store(fSlots.size(), std::memory_order_release);
    }

    // Waits until the slot at `index`, which is taken, is written, and returns its event.
    cl_event written(std::size_t index) const
    {
        const Slot& slot = fSlots[index];
        while (!slot.isWritten.load(std::memory_order_acquire))
            std::this_thread::yield();
        return slot.event;
    }

    tbb::concurrent_vector<Slot> fSlots;
    std::atomic<std::size_t> fSlotCount = 0; // of slots that are ready to be written
    std::atomic<std::size_t> fSize = 0;      // of slots taken
    std::mutex fGrowth;
};
