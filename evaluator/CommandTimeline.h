// The times at which the device ran the commands of a queue. Internal.
#pragma once

#include "evaluator/Evaluator.h"
#include "evaluator/OpenCLFunctions.h"

#include "diagnostics/AutoCLObject.h"

#include <cstdint>
#include <string>
#include <vector>

#include <CL/cl.h>

namespace vyra {

// A record of one queue's commands, whose times it passes to EvaluatorSettings::traceCommand. The
// queue is in order and has CL_QUEUE_PROFILING_ENABLE. One object is used by one thread at a time.
class CommandTimeline {
public:
    // Borrows the queue and the settings, both of whose trace functions are set.
    CommandTimeline(const OpenCLFunctions& cl, cl_command_queue queue, std::string track,
                    const EvaluatorSettings& settings);

    // Adds a command; out of memory, the command is left out. `name` is borrowed until record().
    void add(const char* name, const AutoCLObject<cl_event>& event);
    // Waits for the commands that were added, and passes their times to the settings' function.
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
