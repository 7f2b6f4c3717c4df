// The profiler's store: one log of events for each thread.
//
// A log belongs to its thread; its lock is held for the length of one append, and only a reader or
// the end of an event on a foreign thread ever contends for it. Logs live until the process ends,
// so events of threads that have ended can still be read.
#pragma once

#include "host/Profiler.h"
#include "host/TuniqueString.h"

#include <cstdint>
#include <mutex>
#include <string>
#include <vector>

namespace vyra::host {

// The identifier of profiler::categories().main().
inline constexpr std::uint32_t mainCategoryId = 1;

// `endNs` of an event that has not ended.
inline constexpr std::int64_t stillOpen = -1;

struct ProfileEvent {
    TuniqueString name;
    TuniqueString description;
    // The track it belongs to; the empty text for the thread that recorded it.
    TuniqueString track;
    std::uint32_t categoryId = mainCategoryId;
    profiler::Color color = 0;
    std::int64_t beginNs = 0;
    std::int64_t endNs = stillOpen;
};

// What one thread has recorded.
struct ThreadProfile {
    std::string threadName;
    std::vector<ProfileEvent> events;
};

class ProfileLog {
public:
    // The log of the calling thread, made on its first call.
    static ProfileLog& ofThisThread();

    // Copies of all logs, in the order of their threads' first events.
    static std::vector<ThreadProfile> copyAll();
    // Empties all logs; events that are open are forgotten, and their ends are ignored.
    static void clearAll();

    void setThreadName(std::string name);

    // The identifier to end the event with; never 0.
    profiler::EventId append(ProfileEvent event);
    // Ends an event of any thread. Unknown and forgotten events are ignored.
    static void end(profiler::EventId id, std::int64_t endNs);

private:
    explicit ProfileLog(std::uint32_t index);
    void endHere(profiler::EventId id, std::int64_t endNs);

    std::mutex fMutex; // guards all that follows
    ThreadProfile fProfile;
    std::uint32_t fIndex;
    // Counts the clearings, so that an identifier of before one is known to be stale.
    std::uint32_t fGeneration = 0;
};

} // namespace vyra::host
