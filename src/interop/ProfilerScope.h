// The batch's events for the host's profiler. Internal.
#pragma once

#include "host/Profiler.h"

// The event types of the batch's acquire and release, built when the library is loaded.
extern const profiler::EventType sfAcquireBatchEventType;
extern const profiler::EventType sfReleaseBatchEventType;

// An event of the host's profiler from construction to destruction, if the profiler records.
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
