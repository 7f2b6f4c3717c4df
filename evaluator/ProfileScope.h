// An event of the host's profiler for as long as a scope lasts. Internal.
#pragma once

#include "host/Profiler.h"

#include <optional>

namespace vyra {

class ProfileScope {
public:
    // `name` is borrowed until the trace is written.
    explicit ProfileScope(const char* name)
    {
        if (profiler::samplingActive())
            fEvent = profiler::eventBegin(profiler::categories().main().id(),
                                          profiler::Colors::kColor14, name, "", nullptr, 0);
    }
    ~ProfileScope()
    {
        if (fEvent)
            profiler::eventEnd(*fEvent);
    }
    ProfileScope(const ProfileScope&) = delete;
    ProfileScope& operator=(const ProfileScope&) = delete;

private:
    std::optional<profiler::EventId> fEvent;
};

} // namespace vyra
