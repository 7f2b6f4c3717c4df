// The list that several evaluators report their events to, while one more thread may read it.
#include "interop/ConcurrentEventList.h"

#include "PrivateMember.h"

#include <algorithm>
#include <chrono>
#include <cstdint>
#include <thread>

#include <gtest/gtest.h>

struct Size : PrivateMember<std::atomic<std::size_t> ConcurrentEventList::*> {
    friend Type memberOf(Size);
};
template struct Reveal<Size, &ConcurrentEventList::fSize>;

namespace {

constexpr std::uintptr_t kThreads = 4;
constexpr std::uintptr_t kEventsEach = 5000; // far beyond what is reserved

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

void appendFromAllThreads(ConcurrentEventList& list, std::uintptr_t eventsEach)
{
    std::vector<std::jthread> threads;
    for (std::uintptr_t thread = 0; thread < kThreads; ++thread) {
        threads.emplace_back([&list, thread, eventsEach] {
            for (std::uintptr_t number = 0; number < eventsEach; ++number)
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

} // namespace

TEST(ConcurrentEventList, HoldsWhatAllThreadsAppendedAndNothingAfterClear)
{
    ConcurrentEventList list;
    for (int evaluation = 0; evaluation < 3; ++evaluation) {
        appendFromAllThreads(list, kEventsEach);
        std::vector<cl_event> events = contentsOf(list);
        ASSERT_EQ(events.size(), kThreads * kEventsEach);
        // Each thread's events are all there, in the order in which it appended them.
        std::ranges::stable_sort(events, {}, threadOf);
        for (std::uintptr_t i = 0; i < events.size(); ++i)
            ASSERT_EQ(events[i], fakeEvent(i / kEventsEach, i % kEventsEach));
        list.clear();
        EXPECT_TRUE(contentsOf(list).empty());
    }
}

TEST(ConcurrentEventList, ACopyBesideAppendsIsWholeAndABeginningOfWhatFollows)
{
    // Short lists, over and over: an event on its way is then soon met.
    for (int evaluation = 0; evaluation < 200; ++evaluation) {
        ConcurrentEventList list;
        std::atomic<bool> done = false;
        std::vector<std::vector<cl_event>> copies;
        std::thread reader([&] {
            while (!done)
                copies.push_back(contentsOf(list));
        });
        appendFromAllThreads(list, 200);
        done = true;
        reader.join();

        const std::vector<cl_event> all = contentsOf(list);
        for (const std::vector<cl_event>& copy : copies) {
            ASSERT_LE(copy.size(), all.size());
            ASSERT_TRUE(std::equal(copy.begin(), copy.end(), all.begin()));
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
