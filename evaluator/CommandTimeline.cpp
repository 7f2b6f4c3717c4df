#include "evaluator/CommandTimeline.h"

#include <limits>
#include <new>
#include <utility>

namespace vyra {
namespace {

// Readings of both clocks. The first call on a queue can take milliseconds, later ones do not.
constexpr int kClockComparisons = 16;

} // namespace

CommandTimeline::CommandTimeline(const OpenCLFunctions& cl, cl_command_queue queue,
                                 std::string track, const EvaluatorSettings& settings)
    : fCL(cl), fTrack(std::move(track)), fSettings(settings)
{
    // The device records when a marker is queued, between two readings of the host's clock. The
    // closest pair of readings is used.
    std::int64_t closest = std::numeric_limits<std::int64_t>::max();
    for (int comparison = 0; comparison < kClockComparisons; ++comparison) {
        AutoCLObject<cl_event> marker;
        const std::int64_t before = fSettings.traceClock();
        fCL.clEnqueueMarkerWithWaitList(queue, 0, nullptr, marker.receive());
        const std::int64_t after = fSettings.traceClock();
        const cl_event event = marker.get();
        if (!event || fCL.clWaitForEvents(1, &event) != CL_SUCCESS || after - before >= closest)
            continue;
        closest = after - before;
        fHostMinusDevice = before + closest / 2 - time(event, CL_PROFILING_COMMAND_QUEUED);
    }
}

void CommandTimeline::add(const char* name, const AutoCLObject<cl_event>& event)
{
    if (!event.get())
        return;
    try {
        fCommands.push_back({name, event});
    } catch (const std::bad_alloc&) {
        // The trace lacks a command; the evaluation continues.
    }
}

void CommandTimeline::record()
{
    for (const Command& command : fCommands) {
        const cl_event event = command.event.get();
        if (fCL.clWaitForEvents(1, &event) == CL_SUCCESS)
            fSettings.traceCommand(fTrack, command.name,
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

} // namespace vyra
