// When the device ran the commands of a queue. Internal.
#pragma once

#include "evaluator/Evaluator.h"
#include "evaluator/OpenCLFunctions.h"

#include "diagnostics/AutoCLObject.h"

#include <cstdint>
#include <string>
#include <vector>

#include <CL/cl.h>

namespace vyra {

// Passes the times of one queue's commands to EvaluatorSettings::traceCommand. The queue was
// created with CL_QUEUE_PROFILING_ENABLE and is in order. One thread at a time uses an object.
class CommandTimeline {
public:
    // Borrows the queue and the settings, which have both functions.
    CommandTimeline(const OpenCLFunctions& cl, cl_command_queue queue, std::string track,
                    const EvaluatorSettings& settings);

    // Adds a command, unless there is no memory for it. `name` is borrowed until record().
    void add(const char* name, const AutoCLObject<cl_event>& event);
    // Waits for the commands that were added, and passes on their times.
    void record();

private:
    struct Command {
        const char* name;
        AutoCLObject<cl_event> event;
    };

    std::int64_t time(cl_event event, cl_profiling_info moment) const; // of the device's clock

    const OpenCLFunctions& fCL;
    std::string fTrack;
    const EvaluatorSettings& fSettings;
    std::int64_t fHostMinusDevice = 0; // nanoseconds between the two clocks
    std::vector<Command> fCommands;
};

} // namespace vyra
