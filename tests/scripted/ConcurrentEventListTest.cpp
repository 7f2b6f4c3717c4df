// The list to which several threads report events while another one reads it.
#include "interop/ConcurrentEventList.h"

#include "PrivateMember.h"

#include <algorithm>
#include <chrono>
#include <cstdint>
#include <thread>
#include <utility>

#include <gtest/gtest.h>

struct Size : PrivateMember<std::atomic<std::size_t> ConcurrentEventList::*> {
    friend Type memberOf(Size);
};
template struct Reveal<Size, &ConcurrentEventList::fSize>;

namespace {

constexpr std::uintptr_t kThreads = 4;
constexpr std::uintptr_t kEventsEach = 300; // beyond what is reserved

// Never dereferenced.
cl_event fakeEvent(std::uintptr_t thread, std::uintptr_t number)
{
    // NOLINTNEXTLINE(performance-no-int-to-ptr): nobody looks behind it.
    return reinterpret_cast<cl_event>(thread * kEventsEach + number + 1);
}

std::uintptr_t threadOf(cl_event event)
{
    return (reinterpret_cast<std::uintptr_t>(event) - 1) / kEventsEach;
}

void appendFromAllThreads(ConcurrentEventList& list)
{
    std::vector<std::jthread> threads;
    for (std::uintptr_t thread = 0; thread < kThreads; ++thread) {
        threads.emplace_back([&list, thread] {
            for (std::uintptr_t number = 0; number < kEventsEach; ++number)
                list.append(fakeEvent(thread, number));
        });
    }
}

std::vector<cl_event> contentsOf(const ConcurrentEventList& list)
{
    std::vector<cl_event> events;
    list.copyTo(events);
    return events;
}

bool beginsWith(const std::vector<cl_event>& whole, const std::vector<cl_event>& beginning)
{
    return beginning.size() <= whole.size() &&
           std::equal(beginning.begin(), beginning.end(), whole.begin());
}

} // namespace

TEST(ConcurrentEventList, CopiesDuringAppendsGrowToWhatAllThreadsAppended)
{
    for (int evaluation = 0; evaluation < 100; ++evaluation) {
        ConcurrentEventList list;
        for (int round = 0; round < 2; ++round) {
            std::atomic<bool> done = false;
            std::vector<cl_event> copy;
            bool grows = true;
            std::thread reader([&] {
                while (!done) {
                    const std::vector<cl_event> former = std::exchange(copy, contentsOf(list));
                    grows = grows && beginsWith(copy, former);
                }
            });
            appendFromAllThreads(list);
            done = true;
            reader.join();
            std::vector<cl_event> events = contentsOf(list);
            ASSERT_TRUE(grows && beginsWith(events, copy));
            ASSERT_EQ(events.size(), kThreads * kEventsEach);
            // Each thread's events are all there, in the order in which it appended them.
            std::ranges::stable_sort(events, {}, threadOf);
            for (std::uintptr_t i = 0; i < events.size(); ++i)
                ASSERT_EQ(events[i], fakeEvent(i / kEventsEach, i % kEventsEach));
            list.clear();
            EXPECT_TRUE(contentsOf(list).empty());
        }
    }
}

TEST(ConcurrentEventList, AReaderWaitsForATakenSlotThatWasWrittenBeforeClear)
{
    ConcurrentEventList list;
    list.append(fakeEvent(0, 0));
    list.append(fakeEvent(0, 1));
    list.clear();
    list.append(fakeEvent(1, 0));
    std::atomic<std::size_t>& size = list.*memberOf(Size());
    size = 2; // another append has taken a slot and not written it yet
    std::vector<cl_event> seen;
    std::atomic<bool> reading = false;
    std::thread reader([&] {
        list.forEach([&](cl_event event) {
            seen.push_back(event);
            reading = true;
        });
    });
    while (!reading)
        std::this_thread::yield();
    std::this_thread::sleep_for(std::chrono::milliseconds(50)); // to meet the slot unwritten
    size = 1;
    list.append(fakeEvent(1, 1));
    reader.join();
    EXPECT_EQ(seen, (std::vector{fakeEvent(1, 0), fakeEvent(1, 1)}));
}
