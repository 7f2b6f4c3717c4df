// A test layer below glshare: devices with memory of their own, and a runtime that never calls
// event callbacks.
#include "PassThroughLayer.h"

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

std::mutex theMutex; // guards the rest
std::map<std::pair<cl_mem, void*>, Mapping> theMappings;
std::vector<Bytes> theUsed; // commands may still read from it

cl_int getDeviceInfo(cl_device_id device, cl_device_info name, std::size_t size, void* value,
                     std::size_t* needed)
{
    const cl_int error = below.clGetDeviceInfo(device, name, size, value, needed);
    if (name == CL_DEVICE_TYPE && error == CL_SUCCESS && value != nullptr)
        *static_cast<cl_device_type*>(value) = CL_DEVICE_TYPE_ACCELERATOR;
    return error;
}

// Returns a copy, which has the contents only if it is mapped for reading.
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

// Writes back only memory that is mapped for writing.
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

// Never calls `notify`.
cl_int setEventCallback(cl_event /*event*/, cl_int /*status*/,
                        void(CL_CALLBACK* /*notify*/)(cl_event, cl_int, void*), void* /*user*/)
{
    return CL_SUCCESS;
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
