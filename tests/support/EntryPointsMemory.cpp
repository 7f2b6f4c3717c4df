// Entry points of memory objects and events.
#include "Entry.h"

using namespace scripted;

namespace {

// What a command may do with a memory object: a renderer's buffer only while it is acquired.
Object* usableMem(Entry& call, cl_mem mem)
{
    Object* object = call.object(Kind::kMem, mem);
    if (object)
        call.require(!object->shared || object->acquired, CL_INVALID_GL_OBJECT,
                     "used without acquire");
    return object;
}

cl_int transfer(const char* function, cl_command_queue queue, cl_mem mem, cl_bool blocking,
                std::size_t offset, std::size_t size, const void* data, const WaitList& list,
                cl_event* event)
{
    Entry call(function, queue, mem, blocking, offset, size, data, list);
    if (const Object* object = usableMem(call, mem))
        call.require(offset + size <= object->size, CL_INVALID_VALUE, "beyond the end");
    return call.command(queue, list, event);
}

// A mapping's address: a number of its own that nobody looks behind.
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

cl_int clRetainMemObject(cl_mem mem)
{
    return Entry("clRetainMemObject", mem).retain(Kind::kMem, mem);
}

cl_int clReleaseMemObject(cl_mem mem)
{
    return Entry("clReleaseMemObject", mem).release(Kind::kMem, mem);
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
    Object* object = usableMem(call, mem);
    call.command(queue, list, event);
    const bool mapped = object && call.ok();
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

cl_int clRetainEvent(cl_event event)
{
    return Entry("clRetainEvent", event).retain(Kind::kEvent, event);
}

cl_int clReleaseEvent(cl_event event)
{
    return Entry("clReleaseEvent", event).release(Kind::kEvent, event);
}

cl_int clWaitForEvents(cl_uint count, const cl_event* events)
{
    const WaitList list{count, events};
    Entry call("clWaitForEvents", list);
    call.require(count > 0, CL_INVALID_VALUE, "for no event");
    call.requireWaitList(list);
    for (cl_uint i = 0; call.ok() && i < count; ++i)
        call.object(Kind::kEvent, events[i])->statuses = {CL_COMPLETE};
    return call.status();
}

cl_int clGetEventInfo(cl_event event, cl_event_info query, std::size_t room, void* value,
                      std::size_t* size)
{
    Entry call("clGetEventInfo", event, query);
    Object* object = call.object(Kind::kEvent, event);
    call.require(query == CL_EVENT_COMMAND_EXECUTION_STATUS, CL_INVALID_VALUE, "unknown query");
    if (!call.ok())
        return call.status();
    const cl_int status = object->statuses.front();
    if (object->statuses.size() > 1)
        object->statuses.pop_front();
    return call.answer(query, &status, sizeof status, room, value, size);
}

} // extern "C"
