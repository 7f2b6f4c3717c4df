#include "standalone/profiler/ProfileLog.h"

#include <cstddef>
#include <utility>

namespace vyra::host {
namespace {

// An identifier consists of, from its lowest bit: the event's index in its log plus 1, the log's
// index, the log's generation.
constexpr unsigned int kPlaceBits = 32;
constexpr unsigned int kLogBits = 20;
constexpr std::uint64_t kPlaceMask = (std::uint64_t{1} << kPlaceBits) - 1;
constexpr std::uint64_t kLogMask = (std::uint64_t{1} << kLogBits) - 1;
constexpr std::uint64_t kGenerationMask = (std::uint64_t{1} << (64 - kPlaceBits - kLogBits)) - 1;

std::size_t logIndex(profiler::EventId id)
{
    return (id >> kPlaceBits) & kLogMask;
}

struct Registry {
    std::mutex mutex;
    std::vector<ProfileLog*> logs;

    std::vector<ProfileLog*> copy()
    {
        const std::scoped_lock lock(mutex);
        return logs;
    }
};

// Never destroyed: threads may still record while the process ends.
Registry& registry()
{
    static auto* const theOne = new Registry;
    return *theOne;
}

} // namespace

ProfileLog::ProfileLog(std::uint32_t index)
    : fProfile{"Thread " + std::to_string(index + 1), {}}, fIndex(index)
{
}

ProfileLog& ProfileLog::ofThisThread()
{
    thread_local ProfileLog* const log = [] {
        const std::scoped_lock lock(registry().mutex);
        auto& logs = registry().logs;
        return logs.emplace_back(new ProfileLog(static_cast<std::uint32_t>(logs.size())));
    }();
    return *log;
}

std::vector<ThreadProfile> ProfileLog::copyAll()
{
    std::vector<ThreadProfile> profiles;
    for (ProfileLog* log : registry().copy()) {
        const std::scoped_lock lock(log->fMutex);
        profiles.push_back(log->fProfile);
    }
    return profiles;
}

void ProfileLog::clearAll()
{
    for (ProfileLog* log : registry().copy()) {
        const std::scoped_lock lock(log->fMutex);
        log->fProfile.events.clear();
        ++log->fGeneration;
    }
}

void ProfileLog::setThreadName(std::string name)
{
    const std::scoped_lock lock(fMutex);
    fProfile.threadName = std::move(name);
}

profiler::EventId ProfileLog::append(ProfileEvent event)
{
    const std::scoped_lock lock(fMutex);
    fProfile.events.push_back(event);
    const std::uint64_t generation = fGeneration & kGenerationMask;
    const std::uint64_t place = fProfile.events.size() & kPlaceMask;
    return generation << (kPlaceBits + kLogBits) | std::uint64_t{fIndex} << kPlaceBits | place;
}

void ProfileLog::end(profiler::EventId id, std::int64_t endNs)
{
    ProfileLog& own = ofThisThread();
    if (own.fIndex == logIndex(id)) {
        own.endHere(id, endNs);
        return;
    }
    const std::vector<ProfileLog*> logs = registry().copy();
    if (logIndex(id) < logs.size()) {
        logs[logIndex(id)]->endHere(id, endNs);
    }
}

void ProfileLog::endHere(profiler::EventId id, std::int64_t endNs)
{
    const std::scoped_lock lock(fMutex);
    const std::uint64_t place = id & kPlaceMask;
    const bool current = id >> (kPlaceBits + kLogBits) == (fGeneration & kGenerationMask);
    if (current && place >= 1 && place <= fProfile.events.size()) {
        fProfile.events[place - 1].endNs = endNs;
    }
}

} // namespace vyra::host
