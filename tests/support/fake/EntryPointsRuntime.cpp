// Entry points of platforms, devices, contexts and queues.
#include "fake/Entry.h"

#include <algorithm>
#include <map>

using namespace scripted;

namespace {

const std::map<cl_platform_info, std::string PlatformScript::*> kPlatformTexts = {
    {CL_PLATFORM_VENDOR, &PlatformScript::vendor},
    {CL_PLATFORM_NAME, &PlatformScript::name},
    {CL_PLATFORM_VERSION, &PlatformScript::version},
    {CL_PLATFORM_EXTENSIONS, &PlatformScript::extensions}};

} // namespace

extern "C" {

cl_int clGetPlatformIDs(cl_uint capacity, cl_platform_id* platforms, cl_uint* count)
{
    Entry call("clGetPlatformIDs", capacity, platforms);
    if (!call.ok())
        return call.status();
    const auto& all = call.platforms();
    if (platforms)
        std::copy_n(all.begin(), std::min<std::size_t>(capacity, all.size()), platforms);
    if (count)
        *count = static_cast<cl_uint>(all.size());
    return CL_SUCCESS;
}

cl_int clGetPlatformInfo(cl_platform_id platform, cl_platform_info query, std::size_t capacity,
                         void* value, std::size_t* size)
{
    Entry call("clGetPlatformInfo", platform, query);
    const Object* object = call.object(Kind::kPlatform, platform);
    if (!object)
        return call.status();
    const auto text = kPlatformTexts.find(query);
    if (!call.require(text != kPlatformTexts.end(), CL_INVALID_VALUE, "unknown query"))
        return call.status();
    const PlatformScript& script = call.machine().platforms[object->index];
    return call.answer(query, script.*text->second, capacity, value, size);
}

cl_int clGetDeviceInfo(cl_device_id device, cl_device_info query, std::size_t capacity, void* value,
                       std::size_t* size)
{
    Entry call("clGetDeviceInfo", device, query);
    const Object* object = call.object(Kind::kDevice, device);
    if (!object)
        return call.status();
    const DeviceScript& script = call.script(*object);
    const auto number = [&](const auto& field) {
        return call.answer(query, &field, sizeof field, capacity, value, size);
    };
    switch (query) {
    case CL_DEVICE_TYPE:
        return number(script.type);
    case CL_DEVICE_NAME:
        return call.answer(query, script.name, capacity, value, size);
    case CL_DRIVER_VERSION:
        return call.answer(query, script.driverVersion, capacity, value, size);
    case CL_DEVICE_AVAILABLE:
        return number(static_cast<cl_bool>(script.available));
    case CL_DEVICE_DOUBLE_FP_CONFIG:
        return number(script.doublePrecision);
    case CL_DEVICE_QUEUE_PROPERTIES:
        return number(cl_command_queue_properties{0});
    case CL_DEVICE_MAX_COMPUTE_UNITS:
        return number(script.computeUnits);
    default:
        call.require(false, CL_INVALID_VALUE, "unknown query");
        return call.status();
    }
}

cl_context clCreateContext(const cl_context_properties* properties, cl_uint deviceCount,
                           const cl_device_id* devices, ContextNotify notify, void* userData,
                           cl_int* error)
{
    Entry call("clCreateContext", PropertyList{properties},
               List<cl_device_id>{deviceCount, devices}, userData);
    for (cl_uint i = 0; i < deviceCount; ++i)
        call.object(Kind::kDevice, devices[i]);
    call.rememberNotify(notify);
    return call.result(call.create<cl_context>(Kind::kContext), error);
}

cl_command_queue clCreateCommandQueue(cl_context context, cl_device_id device,
                                      cl_command_queue_properties properties, cl_int* error)
{
    Entry call("clCreateCommandQueue", context, device, properties);
    call.object(Kind::kContext, context);
    call.object(Kind::kDevice, device);
    const auto queue = call.create<cl_command_queue>(Kind::kQueue);
    if (queue)
        call.object(Kind::kQueue, queue)->profiled = (properties & CL_QUEUE_PROFILING_ENABLE) != 0;
    return call.result(queue, error);
}

cl_int clFinish(cl_command_queue queue)
{
    Entry call("clFinish", queue);
    call.object(Kind::kQueue, queue);
    if (call.ok())
        call.waitForQueue(queue);
    return call.status();
}

cl_int clFlush(cl_command_queue queue)
{
    Entry call("clFlush", queue);
    call.object(Kind::kQueue, queue);
    return call.status();
}

// A function that counts the references of its only argument.
#define VYRA_COUNTING(function, operation, Handle, kind)                                           \
    cl_int function(Handle handle)                                                                 \
    {                                                                                              \
        return Entry(#function, handle).operation(kind, handle);                                   \
    }
VYRA_COUNTING(clRetainMemObject, retain, cl_mem, Kind::kMem)
VYRA_COUNTING(clReleaseMemObject, release, cl_mem, Kind::kMem)
VYRA_COUNTING(clRetainEvent, retain, cl_event, Kind::kEvent)
VYRA_COUNTING(clReleaseEvent, release, cl_event, Kind::kEvent)
VYRA_COUNTING(clRetainProgram, retain, cl_program, Kind::kProgram)
VYRA_COUNTING(clReleaseProgram, release, cl_program, Kind::kProgram)
VYRA_COUNTING(clRetainKernel, retain, cl_kernel, Kind::kKernel)
VYRA_COUNTING(clReleaseKernel, release, cl_kernel, Kind::kKernel)
VYRA_COUNTING(clReleaseContext, release, cl_context, Kind::kContext)
VYRA_COUNTING(clReleaseCommandQueue, release, cl_command_queue, Kind::kQueue)
#undef VYRA_COUNTING

} // extern "C"
