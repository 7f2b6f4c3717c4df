// Entry points of memory objects and events.
#include "fake/Entry.h"

using namespace scripted;

namespace {

void requireRange(Entry& call, cl_mem mem, std::size_t offset, std::size_t size)
{
    if (const Object* object = call.usableMem(mem))
        call.require(offset + size <= object->size, CL_INVALID_VALUE, "beyond the end");
}

cl_int transfer(const char* function, cl_command_queue queue, cl_mem mem, cl_bool blocking,
                std::size_t offset, std::size_t size, const void* data, const WaitList& list,
                cl_event* event)
{
    Entry call(function, queue, mem, blocking, offset, size, data, list);
    requireRange(call, mem, offset, size);
    return call.command(queue, list, event, call.ok() ? Mems{mem} : Mems{}, blocking != CL_FALSE);
}

// The address of a mapping: a unique number that is never dereferenced.
void* mappedAddress(cl_mem mem)
{
    return reinterpret_cast<char*>(mem) + 8;
}

} // namespace

extern "C" {

cl_mem clCreateBuffer(cl_context context, cl_mem_flags flags, std::size_t size, void* hostPtr,
                      cl_int* error)
{
    Entry call("clCreateBuffer", context, flags, size, hostPtr);
    call.object(Kind::kContext, context);
    call.require(size > 0, CL_INVALID_BUFFER_SIZE, "of no bytes");
    call.require((hostPtr != nullptr) == ((flags & CL_MEM_COPY_HOST_PTR) != 0), CL_INVALID_HOST_PTR,
                 "host pointer and flags disagree");
    const auto mem = call.create<cl_mem>(Kind::kMem);
    if (mem)
        call.object(Kind::kMem, mem)->size = size;
    return call.result(mem, error);
}

cl_int clEnqueueWriteBuffer(cl_command_queue queue, cl_mem mem, cl_bool blocking,
                            std::size_t offset, std::size_t size, const void* data,
                            cl_uint waitCount, const cl_event* waitList, cl_event* event)
{
    return transfer("clEnqueueWriteBuffer", queue, mem, blocking, offset, size, data,
                    {waitCount, waitList}, event);
}

cl_int clEnqueueReadBuffer(cl_command_queue queue, cl_mem mem, cl_bool blocking, std::size_t offset,
                           std::size_t size, void* data, cl_uint waitCount,
                           const cl_event* waitList, cl_event* event)
{
    return transfer("clEnqueueReadBuffer", queue, mem, blocking, offset, size, data,
                    {waitCount, waitList}, event);
}

void* clEnqueueMapBuffer(cl_command_queue queue, cl_mem mem, cl_bool blocking, cl_map_flags flags,
                         std::size_t offset, std::size_t size, cl_uint waitCount,
                         const cl_event* waitList, cl_event* event, cl_int* error)
{
    const WaitList list{waitCount, waitList};
    Entry call("clEnqueueMapBuffer", queue, mem, blocking, flags, offset, size, list);
    Object* object = call.usableMem(mem);
    call.command(queue, list, event, {}, blocking != CL_FALSE);
    const bool mapped = object && (call.ok() || call.withHandle());
    if (mapped)
        object->mapped = true;
    return call.result(mapped ? mappedAddress(mem) : nullptr, error);
}

cl_int clEnqueueUnmapMemObject(cl_command_queue queue, cl_mem mem, void* mapping, cl_uint waitCount,
                               const cl_event* waitList, cl_event* event)
{
    const WaitList list{waitCount, waitList};
    Entry call("clEnqueueUnmapMemObject", queue, mem, list);
    Object* object = call.object(Kind::kMem, mem);
    call.require(object && object->mapped && mapping == mappedAddress(mem), CL_INVALID_VALUE,
                 "not the mapping");
    call.command(queue, list, event);
    if (object && call.ok())
        object->mapped = false;
    return call.status();
}

cl_int clEnqueueCopyBuffer(cl_command_queue queue, cl_mem source, cl_mem target,
                           std::size_t sourceOffset, std::size_t targetOffset, std::size_t size,
                           cl_uint waitCount, const cl_event* waitList, cl_event* event)
{
    const WaitList list{waitCount, waitList};
    Entry call("clEnqueueCopyBuffer", queue, source, target, sourceOffset, targetOffset, size,
               list);
    requireRange(call, source, sourceOffset, size);
    requireRange(call, target, targetOffset, size);
    return call.command(queue, list, event, call.ok() ? Mems{source, target} : Mems{});
}

cl_int clEnqueueMarkerWithWaitList(cl_command_queue queue, cl_uint waitCount,
                                   const cl_event* waitList, cl_event* event)
{
    const WaitList list{waitCount, waitList};
    return Entry("clEnqueueMarkerWithWaitList", queue, list).command(queue, list, event);
}

cl_int clGetMemObjectInfo(cl_mem mem, cl_mem_info query, std::size_t capacity, void* value,
                          std::size_t* size)
{
    Entry call("clGetMemObjectInfo", mem, query);
    const Object* object = call.object(Kind::kMem, mem);
    call.require(query == CL_MEM_SIZE, CL_INVALID_VALUE, "unknown query");
    const std::size_t bytes = object ? object->size : 0;
    return call.answer(query, &bytes, sizeof bytes, capacity, value, size);
}

cl_int clWaitForEvents(cl_uint count, const cl_event* events)
{
    const WaitList list{count, events};
    Entry call("clWaitForEvents", list);
    call.require(count > 0, CL_INVALID_VALUE, "for no event");
    call.requireWaitList(list);
    for (cl_uint i = 0; call.ok() && i < count; ++i) {
        Object& event = *call.object(Kind::kEvent, events[i]);
        event.statuses = {CL_COMPLETE};
        call.waitFor(event);
    }
    return call.status();
}

cl_int clGetEventInfo(cl_event event, cl_event_info query, std::size_t capacity, void* value,
                      std::size_t* size)
{
    Entry call("clGetEventInfo", event, query);
    Object* object = call.object(Kind::kEvent, event);
    call.require(query == CL_EVENT_COMMAND_EXECUTION_STATUS, CL_INVALID_VALUE, "unknown query");
    if (!call.ok())
        return call.status();
    const bool pending = call.isPending(*object);
    const cl_int status = pending ? CL_RUNNING : object->statuses.front();
    if (!pending && object->statuses.size() > 1)
        object->statuses.pop_front();
    if (status == CL_COMPLETE)
        call.waitFor(*object);
    return call.answer(query, &status, sizeof status, capacity, value, size);
}

cl_int clGetEventProfilingInfo(cl_event event, cl_profiling_info query, std::size_t capacity,
                               void* value, std::size_t* size)
{
    Entry call("clGetEventProfilingInfo", event, query);
    const Object* object = call.object(Kind::kEvent, event);
    if (object)
        call.require(object->profiled && !call.isPending(*object), CL_PROFILING_INFO_NOT_AVAILABLE,
                     "not profiled, or not complete");
    // A microsecond a command, which runs from its start to its end.
    const cl_ulong nanoseconds =
        object ? 1000 * cl_ulong{object->command} + (query - CL_PROFILING_COMMAND_QUEUED) : 0;
    return call.answer(query, &nanoseconds, sizeof nanoseconds, capacity, value, size);
}

} // extern "C"
