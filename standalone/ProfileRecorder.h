// The profiler's recorder: what is profiled while it samples, and its way into a file.
//
// All times are nanoseconds of the steady clock. All operations are safe from any thread. Recording
// takes no lock that threads share: each thread has a log of its own.
#pragma once

#include "host/HostExport.h"

#include <cstdint>
#include <string>
#include <string_view>

class VYRA_HOST_API ProfileRecorder {
public:
    // Drops what was recorded before, and samples.
    static void start();
    // Ends sampling. What was recorded stays until the next start().
    static void stop();

    static std::int64_t nowNs();

    // Names the calling thread in the trace, sampling or not; otherwise it is "Thread N".
    static void nameThread(std::string_view name);

    // Adds an event of another track than the calling thread's, for example a command of a device.
    // Does nothing while not sampling. Events of one track must not overlap save by nesting, or
    // viewers draw them wrongly.
    static void record(std::string_view track, std::string_view name, std::int64_t beginNs,
                       std::int64_t endNs);

    // Writes what was recorded as Chrome trace-event JSON, one row for each thread and track, times
    // in microseconds. An event that has not ended is written as begun. Returns false if the file
    // cannot be written; then there is no part of it, and `reason`, if it is not null, becomes the
    // system's reason.
    static bool writeChromeTrace(const std::string& path, std::string* reason = nullptr);
};
