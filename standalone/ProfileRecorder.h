// Controls the profiler and writes its events to a file.
//
// All times are nanoseconds of the steady clock. All functions are safe from any thread. Recording
// takes no lock that threads share: each thread has a log of its own.
#pragma once

#include "host/HostExport.h"

#include <cstdint>
#include <string>
#include <string_view>

class VYRA_HOST_API ProfileRecorder {
public:
    // Removes all recorded events and starts sampling.
    static void start();
    // Ends sampling. The recorded events are kept until the next start().
    static void stop();

    static std::int64_t nowNs();

    // Sets the calling thread's name in the trace, sampling or not. The default is "Thread N".
    static void nameThread(std::string_view name);

    // Adds an event to a track that is not a thread, for example a command of a device. Does
    // nothing unless sampling. Events of one track must not overlap unless they nest, or viewers
    // draw them wrongly.
    static void record(std::string_view track, std::string_view name, std::int64_t beginNs,
                       std::int64_t endNs);

    // Writes the recorded events as Chrome trace-event JSON, one row per thread and track, times in
    // microseconds. An event that has not ended is written as begun. Returns false if the file
    // cannot be written: it is then removed, and `reason`, unless null, receives the system's
    // message.
    [[nodiscard]] static bool writeChromeTrace(const std::string& path,
                                               std::string* reason = nullptr);
};
