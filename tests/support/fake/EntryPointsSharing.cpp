// Entry points of the sharing extensions, and the look-up through which they are found.
#include "fake/Entry.h"

#include <algorithm>
#include <cstdint>
#include <map>
#include <stdexcept>

#include <CL/cl_gl.h>

using namespace scripted;

namespace {

using MemList = List<cl_mem>;

struct SharingNames {
    const char* devices;
    const char* create;
    const char* acquire;
    const char* release;
};
constexpr SharingNames kGL = {"clGetGLContextInfoKHR", "clCreateFromGLBuffer",
                              "clEnqueueAcquireGLObjects", "clEnqueueReleaseGLObjects"};
constexpr SharingNames kNV = {"clGetDeviceIDsFromD3D11NV", "clCreateFromD3D11BufferNV",
                              "clEnqueueAcquireD3D11ObjectsNV", "clEnqueueReleaseD3D11ObjectsNV"};
constexpr SharingNames kKHR = {"clGetDeviceIDsFromD3D11KHR", "clCreateFromD3D11BufferKHR",
                               "clEnqueueAcquireD3D11ObjectsKHR",
                               "clEnqueueReleaseD3D11ObjectsKHR"};
constexpr cl_int kD3DAlreadyAcquired = -1008;
constexpr cl_int kD3DNotAcquired = -1009;

template <typename Resource>
cl_mem createShared(const SharingNames& names, cl_context context, cl_mem_flags flags,
                    Resource resource, cl_int* error)
{
    Entry call(names.create, context, flags, resource);
    call.object(Kind::kContext, context);
    const std::optional<cl_mem> scripted = call.nextSharedMem();
    if (scripted && *scripted)
        call.retain(Kind::kMem, *scripted);
    if (scripted)
        return call.result(*scripted, error);
    const auto mem = call.create<cl_mem>(Kind::kMem);
    if (mem) {
        constexpr std::size_t kUsualBytes = 1 << 20;
        const auto bytes = call.machine().sharedBytes.find(resource);
        Object* object = call.object(Kind::kMem, mem);
        object->shared = true;
        object->size = bytes == call.machine().sharedBytes.end() ? kUsualBytes : bytes->second;
    }
    return call.result(mem, error);
}

// Acquire and release: every object must be shared, and not acquired or acquired, respectively.
template <const SharingNames& kNames, bool kAcquire>
cl_int changeSide(cl_command_queue queue, cl_uint count, const cl_mem* mems, cl_uint waitCount,
                  const cl_event* waitList, cl_event* event)
{
    const WaitList list{waitCount, waitList};
    Entry call(kAcquire ? kNames.acquire : kNames.release, queue, MemList{count, mems}, list);
    call.require((count == 0) == (mems == nullptr), CL_INVALID_VALUE,
                 "count and pointer of the objects disagree");
    constexpr cl_int kD3DStatus = kAcquire ? kD3DAlreadyAcquired : kD3DNotAcquired;
    constexpr cl_int kWrongSide = &kNames == &kGL ? CL_INVALID_GL_OBJECT : kD3DStatus;
    std::vector<Object*> objects;
    for (cl_uint i = 0; call.ok() && mems && i < count; ++i) {
        Object* object = call.object(Kind::kMem, mems[i]);
        if (object && call.require(object->shared && object->acquired != kAcquire, kWrongSide,
                                   kAcquire ? "already acquired" : "not acquired"))
            objects.push_back(object);
    }
    return call.changeSide(queue, list, event, objects, kAcquire);
}

cl_mem createFromGLBuffer(cl_context context, cl_mem_flags flags, cl_GLuint buffer, cl_int* error)
{
    return createShared(kGL, context, flags, buffer, error);
}

template <const SharingNames& kNames>
cl_mem createFromD3DBuffer(cl_context context, cl_mem_flags flags, void* buffer, cl_int* error)
{
    // The log shows a Direct3D 11 buffer as a number: its address, which tests choose.
    return createShared(kNames, context, flags, reinterpret_cast<std::uintptr_t>(buffer), error);
}

cl_int getGLContextInfo(const cl_context_properties* properties, cl_gl_context_info query,
                        std::size_t capacity, void* value, std::size_t* size)
{
    Entry call("clGetGLContextInfoKHR", PropertyList{properties}, query, capacity);
    const auto& all = call.devices();
    std::vector<cl_device_id> answer;
    if (query == CL_DEVICES_FOR_GL_CONTEXT_KHR) {
        for (const std::size_t index : call.machine().glDevices)
            answer.push_back(all[index]);
    } else if (query == CL_CURRENT_DEVICE_FOR_GL_CONTEXT_KHR) {
        const auto current = call.machine().currentGLDevice;
        answer.push_back(current ? all[*current] : nullptr);
    } else {
        call.require(false, CL_INVALID_VALUE, "unknown query");
    }
    return call.answer(query, answer.data(), answer.size() * sizeof(cl_device_id), capacity, value,
                       size);
}

template <const SharingNames& kNames>
cl_int getDeviceIDsFromD3D11(cl_platform_id platform, cl_uint source, void* object, cl_uint set,
                             cl_uint capacity, cl_device_id* devices, cl_uint* count)
{
    Entry call(kNames.devices, platform, source, reinterpret_cast<std::uintptr_t>(object), set,
               capacity);
    call.object(Kind::kPlatform, platform);
    if (!call.ok())
        return call.status();
    const auto& indices = call.machine().d3dDevices;
    for (std::size_t i = 0; devices && i < std::min<std::size_t>(capacity, indices.size()); ++i)
        devices[i] = call.devices()[indices[i]];
    if (count)
        *count = static_cast<cl_uint>(indices.size());
    return CL_SUCCESS;
}

template <typename Function>
void* addressOf(Function* function)
{
    return reinterpret_cast<void*>(function);
}
const std::map<std::string, void*> kExtensionFunctions = {
    {kGL.devices, addressOf(&getGLContextInfo)},
    {kGL.create, addressOf(&createFromGLBuffer)},
    {kGL.acquire, addressOf(&changeSide<kGL, true>)},
    {kGL.release, addressOf(&changeSide<kGL, false>)},
    {kNV.devices, addressOf(&getDeviceIDsFromD3D11<kNV>)},
    {kNV.create, addressOf(&createFromD3DBuffer<kNV>)},
    {kNV.acquire, addressOf(&changeSide<kNV, true>)},
    {kNV.release, addressOf(&changeSide<kNV, false>)},
    {kKHR.devices, addressOf(&getDeviceIDsFromD3D11<kKHR>)},
    {kKHR.create, addressOf(&createFromD3DBuffer<kKHR>)},
    {kKHR.acquire, addressOf(&changeSide<kKHR, true>)},
    {kKHR.release, addressOf(&changeSide<kKHR, false>)},
};

} // namespace

extern "C" void* clGetExtensionFunctionAddress(const char* name)
{
    const Entry call("clGetExtensionFunctionAddress", name);
    if (call.machine().lookUp == LookUp::kThrowsStandardException)
        throw std::runtime_error("scripted look-up");
    if (call.machine().lookUp == LookUp::kThrowsNumber)
        throw 1;
    const auto found = kExtensionFunctions.find(name);
    const bool there = found != kExtensionFunctions.end() && !call.machine().missing.contains(name);
    return there ? found->second : nullptr;
}
