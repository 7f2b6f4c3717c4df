#include "viewer/CommandTimeline.h"

#include "standalone/ProfileRecorder.h"

#include <utility>

namespace viewer {

CommandTimeline::CommandTimeline(const OpenCLFunctions& cl, cl_command_queue queue,
                                 std::string track)
    : fCL(cl), fTrack(std::move(track))
{
    // The device notes when a command is queued, which is between these two moments.
    AutoCLObject<cl_event> marker;
    const std::int64_t before = ProfileRecorder::nowNs();
    fCL.clEnqueueMarkerWithWaitList(queue, 0, nullptr, marker.receive());
    const std::int64_t after = ProfileRecorder::nowNs();
    if (!marker.get())
        return;
    const cl_event event = marker.get();
    fCL.clWaitForEvents(1, &event);
    fHostMinusDevice = before + (after - before) / 2 - time(event, CL_PROFILING_COMMAND_QUEUED);
}

void CommandTimeline::add(const char* name, const AutoCLObject<cl_event>& event)
{
    if (event.get())
        fCommands.push_back({name, event});
}

void CommandTimeline::record()
{
    for (const Command& command : fCommands) {
        const cl_event event = command.event.get();
        if (fCL.clWaitForEvents(1, &event) == CL_SUCCESS)
            ProfileRecorder::record(fTrack, command.name,
                                    time(event, CL_PROFILING_COMMAND_START) + fHostMinusDevice,
                                    time(event, CL_PROFILING_COMMAND_END) + fHostMinusDevice);
    }
    fCommands.clear();
}

std::int64_t CommandTimeline::time(cl_event event, cl_profiling_info moment) const
{
    cl_ulong nanoseconds = 0;
    fCL.clGetEventProfilingInfo(event, moment, sizeof(nanoseconds), &nanoseconds, nullptr);
    return static_cast<std::int64_t>(nanoseconds);
}

} // namespace viewer
