#include "host/Profiler.h"

#include "standalone/ProfileRecorder.h"
#include "standalone/profiler/ProfileLog.h"

#include <atomic>
#include <chrono>
#include <string>

namespace {

constinit std::atomic<bool> sampling = false;

// The identifier of no event, returned if the profiler does not record.
constexpr profiler::EventId kNoEvent = 0;

} // namespace

namespace profiler {

bool samplingActive()
{
    return sampling.load(std::memory_order_relaxed);
}

EventId eventBegin(std::uint32_t categoryId, Color color, const char* name, const char* description,
                   const void* /*data*/, std::uint32_t /*dataSize*/)
{
    if (!samplingActive()) {
        return kNoEvent;
    }
    vyra::host::ProfileEvent event;
    event.name = TuniqueString(name);
    event.description = TuniqueString(description);
    event.categoryId = categoryId;
    event.color = color;
    event.beginNs = ProfileRecorder::nowNs();
    return vyra::host::ProfileLog::ofThisThread().append(event);
}

void eventEnd(EventId event)
{
    if (event != kNoEvent) {
        vyra::host::ProfileLog::end(event, ProfileRecorder::nowNs());
    }
}

} // namespace profiler

void ProfileRecorder::start()
{
    vyra::host::ProfileLog::clearAll();
    sampling = true;
}

void ProfileRecorder::stop()
{
    sampling = false;
}

std::int64_t ProfileRecorder::nowNs()
{
    const auto now = std::chrono::steady_clock::now().time_since_epoch();
    return std::chrono::duration_cast<std::chrono::nanoseconds>(now).count();
}

void ProfileRecorder::nameThread(std::string_view name)
{
    vyra::host::ProfileLog::ofThisThread().setThreadName(std::string(name));
}

void ProfileRecorder::record(std::string_view track, std::string_view name, std::int64_t beginNs,
                             std::int64_t endNs)
{
    if (!profiler::samplingActive()) {
        return;
    }
    vyra::host::ProfileEvent event;
    event.name = TuniqueString(std::string(name).c_str());
    event.track = TuniqueString(std::string(track).c_str());
    event.beginNs = beginNs;
    event.endNs = endNs;
    vyra::host::ProfileLog::ofThisThread().append(event);
}
