// The profiler's storage: one log of events per thread.
//
// Only the log's thread appends. Its lock is contended only by a reader, or by another thread that
// ends an event. Logs exist until the process ends, so that events of threads that have ended can
// still be read.
#pragma once

#include "host/Profiler.h"
#include "host/TuniqueString.h"

#include <cstdint>
#include <mutex>
#include <string>
#include <vector>

namespace vyra::host {

// The identifier of profiler::categories().main().
inline constexpr std::uint32_t kMainCategoryId = 1;

// `endNs` of an event that has not ended.
inline constexpr std::int64_t kStillOpen = -1;

struct ProfileEvent {
    TuniqueString name;
    TuniqueString description;
    // The track of the event; empty for the thread that recorded it.
    TuniqueString track;
    std::uint32_t categoryId = kMainCategoryId;
    profiler::Color color = 0;
    std::int64_t beginNs = 0;
    std::int64_t endNs = kStillOpen;
};

// The events that one thread has recorded.
struct ThreadProfile {
    std::string threadName;
    std::vector<ProfileEvent> events;
};

class ProfileLog {
public:
    // Returns the log of the calling thread, created by its first call.
    static ProfileLog& ofThisThread();

    // Returns copies of all logs, in the order of their creation.
    [[nodiscard]] static std::vector<ThreadProfile> copyAll();
    // Empties all logs. The ends of events that are open are ignored.
    static void clearAll();

    void setThreadName(std::string name);

    // Appends an event and returns the identifier with which to end it; never 0.
    profiler::EventId append(ProfileEvent event);
    // Ends an event of any thread. Ignores unknown identifiers and those from before clearAll.
    static void end(profiler::EventId id, std::int64_t endNs);

private:
    explicit ProfileLog(std::uint32_t index);
    void endHere(profiler::EventId id, std::int64_t endNs);

    std::mutex fMutex; // guards all that follows
    ThreadProfile fProfile;
    std::uint32_t fIndex;
    // The number of clearings, part of the identifiers: those from before a clearing are invalid.
    std::uint32_t fGeneration = 0;
};

} // namespace vyra::host
