// Part of a layer below glshare: devices with memory of their own, and a runtime that calls back
// late.
#include "PassThroughLayer.h"

#include <iterator>
#include <list>
#include <map>
#include <mutex>
#include <utility>
#include <vector>

namespace {

cl_icd_dispatch below;

using Bytes = std::vector<unsigned char>;

struct Mapping {
    cl_map_flags flags;
    Bytes bytes;
};

// A callback, which comes late.
struct LateCall {
    void(CL_CALLBACK* notify)(cl_event, cl_int, void*);
    void* user;
    cl_event event = nullptr;
    cl_int status = CL_QUEUED; // until the event has come
};

std::mutex theMutex; // guards the rest
std::map<std::pair<cl_mem, void*>, Mapping> theMappings;
std::vector<Bytes> theUsed;       // commands may still be writing from it
std::list<LateCall> theLateCalls; // runtimes drop those whose event fails

cl_int getDeviceInfo(cl_device_id device, cl_device_info name, std::size_t size, void* value,
                     std::size_t* needed)
{
    const cl_int error = below.clGetDeviceInfo(device, name, size, value, needed);
    if (name == CL_DEVICE_TYPE && error == CL_SUCCESS && value != nullptr)
        *static_cast<cl_device_type*>(value) = CL_DEVICE_TYPE_ACCELERATOR;
    return error;
}

// Mapped memory is a copy, which has the contents only for reading.
void* mapBuffer(cl_command_queue queue, cl_mem memory, cl_bool blocking, cl_map_flags flags,
                std::size_t offset, std::size_t size, cl_uint count, const cl_event* waitList,
                cl_event* event, cl_int* error)
{
    Mapping mapping{flags, Bytes(size, 0xcd)};
    void* address = mapping.bytes.data();
    *error = (flags & CL_MAP_READ) != 0
                 ? below.clEnqueueReadBuffer(queue, memory, blocking, offset, size, address, count,
                                             waitList, event)
                 : below.clEnqueueMarkerWithWaitList(queue, count, waitList, event);
    const std::scoped_lock lock(theMutex);
    theMappings.emplace(std::pair(memory, address), std::move(mapping));
    return address;
}

// What was mapped for reading is not written back.
cl_int unmap(cl_command_queue queue, cl_mem memory, void* address, cl_uint count,
             const cl_event* waitList, cl_event* event)
{
    const std::scoped_lock lock(theMutex);
    auto node = theMappings.extract(std::pair(memory, address));
    if (node.empty())
        return CL_INVALID_VALUE;
    Bytes& bytes = theUsed.emplace_back(std::move(node.mapped().bytes));
    return (node.mapped().flags & CL_MAP_WRITE) != 0
               ? below.clEnqueueWriteBuffer(queue, memory, CL_FALSE, 0, bytes.size(), bytes.data(),
                                            count, waitList, event)
               : below.clEnqueueMarkerWithWaitList(queue, count, waitList, event);
}

void CL_CALLBACK onEvent(cl_event event, cl_int status, void* user)
{
    const std::scoped_lock lock(theMutex);
    static_cast<LateCall*>(user)->event = event;
    static_cast<LateCall*>(user)->status = status;
}

// A callback comes when the next one is set.
cl_int setEventCallback(cl_event event, cl_int status,
                        void(CL_CALLBACK* notify)(cl_event, cl_int, void*), void* user)
{
    std::list<LateCall> due;
    LateCall* added = nullptr;
    {
        const std::scoped_lock lock(theMutex);
        for (auto call = theLateCalls.begin(); call != theLateCalls.end();) {
            const auto next = std::next(call);
            if (call->status != CL_QUEUED)
                due.splice(due.end(), theLateCalls, call);
            call = next;
        }
        added = &theLateCalls.emplace_back(LateCall{notify, user});
    }
    for (const LateCall& call : due)
        call.notify(call.event, call.status, call.user);
    return below.clSetEventCallback(event, status, onEvent, added);
}

} // namespace

void changeTable(cl_icd_dispatch& table)
{
    below = table;
    table.clGetDeviceInfo = getDeviceInfo;
    table.clEnqueueMapBuffer = mapBuffer;
    table.clEnqueueUnmapMemObject = unmap;
    table.clSetEventCallback = setEventCallback;
}
