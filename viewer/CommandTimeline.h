// The commands of an OpenCL queue on the host's timeline.
#pragma once

#include "diagnostics/AutoCLObject.h"
#include "viewer/OpenCLFunctions.h"

#include <cstdint>
#include <string>
#include <vector>

#include <CL/cl.h>

namespace viewer {

// Records when the device ran the commands of one queue, as a track of the host's profiler. The
// queue was made with CL_QUEUE_PROFILING_ENABLE and works in order. One thread at a time uses an
// object.
class CommandTimeline {
public:
    // Borrows the queue.
    CommandTimeline(const OpenCLFunctions& cl, cl_command_queue queue, std::string track);

    // Notes a command of the queue by its event. `name` is borrowed until record().
    void add(const char* name, const AutoCLObject<cl_event>& event);
    // Waits for the commands noted so far and hands them to the profiler.
    void record();

private:
    struct Command {
        const char* name;
        AutoCLObject<cl_event> event;
    };

    std::int64_t time(cl_event event, cl_profiling_info moment) const; // on the device's clock

    const OpenCLFunctions& fCL;
    std::string fTrack;
    std::int64_t fHostMinusDevice = 0; // nanoseconds between the two clocks
    std::vector<Command> fCommands;
};

} // namespace viewer
