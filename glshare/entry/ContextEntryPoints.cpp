// Implements the context functions of EntryPoints.h.
#include "core/api/Arguments.h"
#include "core/api/Devices.h"
#include "core/sharing/ObjectRegistry.h"
#include "entry/EntryPoints.h"

#include <algorithm>
#include <memory>
#include <span>
#include <utility>
#include <vector>

namespace glshare::entry {

namespace {

bool shareNatively(std::span<const cl_device_id> devices)
{
    return !devices.empty() && std::ranges::all_of(devices, sharesNatively);
}

bool areCpuDevices(std::span<const cl_device_id> devices)
{
    return std::ranges::all_of(devices, [](cl_device_id device) {
        return (runtimeType(device) & CL_DEVICE_TYPE_CPU) != 0;
    });
}

// Starts to share with the OpenGL context of `properties`. Returns null, and sets `error`, if that
// context cannot be shared with.
[[nodiscard]] std::shared_ptr<SharingContext> startSharing(ContextProperties properties,
                                                           bool canUseHostMemory, cl_int* error)
{
    std::unique_ptr<GlContext> gl = createSharedGlContext(*properties.glContext);
    std::unique_ptr<GlWorker> worker = gl == nullptr ? nullptr : GlWorker::start(std::move(gl));
    if (worker == nullptr) {
        setError(error, CL_INVALID_GL_SHAREGROUP_REFERENCE_KHR);
        return nullptr;
    }
    return std::make_shared<SharingContext>(std::move(worker), std::move(properties),
                                            canUseHostMemory);
}

// Creates a context on `devices`. `create` calls the runtime with the properties that it is passed.
template <typename Create>
[[nodiscard]] cl_context createSharingContext(const cl_context_properties* properties,
                                              std::span<const cl_device_id> devices, cl_int* error,
                                              Create create)
{
    ContextProperties parsed = parseProperties(properties);
    if (parsed.original == parsed.forRuntime || shareNatively(devices))
        return create(properties, error);
    if (parsed.error != CL_SUCCESS) {
        setError(error, parsed.error);
        return nullptr;
    }
    const std::vector<cl_context_properties> forRuntime = parsed.forRuntime;
    if (!parsed.glContext)
        return create(forRuntime.data(), error);

    std::shared_ptr<SharingContext> sharing =
        startSharing(std::move(parsed), areCpuDevices(devices), error);
    if (sharing == nullptr)
        return nullptr;
    cl_context context = create(forRuntime.data(), error);
    if (context == nullptr)
        return nullptr;
    try {
        ObjectRegistry::get().add(context, std::move(sharing));
    } catch (...) {
        runtime().clReleaseContext(context); // the only reference
        throw;
    }
    return context;
}

} // namespace

cl_context CL_API_CALL createContext(const cl_context_properties* properties, cl_uint count,
                                     const cl_device_id* devices, ContextNotify notify, void* user,
                                     cl_int* error)
{
    if (!isValidList(count, devices)) {
        setError(error, CL_INVALID_VALUE);
        return nullptr;
    }
    return createSharingContext(properties, {devices, count}, error,
                                [&](const cl_context_properties* forRuntime, cl_int* result) {
                                    return runtime().clCreateContext(forRuntime, count, devices,
                                                                     notify, user, result);
                                });
}

cl_context CL_API_CALL createContextFromType(const cl_context_properties* properties,
                                             cl_device_type type, ContextNotify notify, void* user,
                                             cl_int* error)
{
    const auto typeForRuntime = runtimeTypeFor(type);
    const cl_platform_id platform = platformOrFirst(parseProperties(properties).platform);
    return createSharingContext(
        properties, devicesOf(platform, type), error,
        [&](const cl_context_properties* forRuntime, cl_int* result) -> cl_context {
            if (typeForRuntime)
                return runtime().clCreateContextFromType(forRuntime, *typeForRuntime, notify, user,
                                                         result);
            const bool isUserUnused = notify == nullptr && user != nullptr;
            setError(result, isUserUnused ? CL_INVALID_VALUE : CL_DEVICE_NOT_FOUND);
            return nullptr;
        });
}

cl_int CL_API_CALL retainContext(cl_context context)
{
    const cl_int error = runtime().clRetainContext(context);
    if (error == CL_SUCCESS)
        ObjectRegistry::get().retain(context);
    return error;
}

// Counts first: after the release the handle may be reused for another context.
cl_int CL_API_CALL releaseContext(cl_context context)
{
    ObjectRegistry::get().release(context);
    return runtime().clReleaseContext(context);
}

cl_int CL_API_CALL getContextInfo(cl_context context, cl_context_info name, std::size_t size,
                                  void* value, std::size_t* sizeNeeded)
{
    if (name == CL_CONTEXT_PROPERTIES) {
        if (const auto sharing = ObjectRegistry::get().find(context))
            return writeInfo(std::as_bytes(std::span(sharing->properties().original)),
                             {size, value, sizeNeeded});
    }
    return runtime().clGetContextInfo(context, name, size, value, sizeNeeded);
}

namespace {

// Creates a context with these properties, releases it, and returns the error. For a property that
// the runtime does not have, this query requires CL_INVALID_VALUE.
[[nodiscard]] cl_int testContextCreation(const cl_context_properties* properties,
                                         const ContextProperties& parsed, cl_device_id device)
{
    cl_int error = CL_SUCCESS;
    cl_context context = createContext(properties, 1, &device, nullptr, nullptr, &error);
    if (context != nullptr)
        return releaseContext(context);
    return error == CL_INVALID_PROPERTY && parsed.error == CL_SUCCESS ? CL_INVALID_VALUE : error;
}

} // namespace

cl_int CL_API_CALL getGlContextInfo(const cl_context_properties* properties,
                                    cl_gl_context_info name, std::size_t size, void* value,
                                    std::size_t* sizeNeeded)
{
    const ContextProperties parsed = parseProperties(properties);
    cl_platform_id platform = platformOrFirst(parsed.platform);
    const std::vector<cl_device_id> devices = devicesOf(platform, CL_DEVICE_TYPE_ALL);
    if (devices.empty())
        return CL_INVALID_PLATFORM;
    if (shareNatively(devices))
        return runtime().clGetGLContextInfoKHR(properties, name, size, value, sizeNeeded);
    if (parsed.error == CL_SUCCESS && !parsed.glContext)
        return CL_INVALID_GL_SHAREGROUP_REFERENCE_KHR;
    if (const cl_int error = testContextCreation(properties, parsed, devices.front());
        error != CL_SUCCESS)
        return error;
    switch (name) {
    case CL_CURRENT_DEVICE_FOR_GL_CONTEXT_KHR:
        return writeInfoValue(devices.front(), {size, value, sizeNeeded});
    case CL_DEVICES_FOR_GL_CONTEXT_KHR:
        return writeInfo(std::as_bytes(std::span(devices)), {size, value, sizeNeeded});
    default:
        return CL_INVALID_VALUE;
    }
}

} // namespace glshare::entry
