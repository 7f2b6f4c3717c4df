#include "entry/EntryPoints.h"

#include "core/api/Settings.h"
#include "core/sharing/Counters.h"
#include "entry/EntryPoint.h"
#include "glshare.h"

#include <array>
#include <string_view>

namespace glshare {

void installEntryPoints(cl_icd_dispatch& table)
{
    table.clGetPlatformInfo = queryEntryPoint<entry::getPlatformInfo>;
    table.clGetDeviceIDs = queryEntryPoint<entry::getDeviceIds>;
    table.clGetDeviceInfo = queryEntryPoint<entry::getDeviceInfo>;
    table.clCreateContext = entryPoint<entry::createContext>;
    table.clCreateContextFromType = entryPoint<entry::createContextFromType>;
    table.clRetainContext = entryPoint<entry::retainContext>;
    table.clReleaseContext = entryPoint<entry::releaseContext>;
    table.clGetContextInfo = entryPoint<entry::getContextInfo>;
    table.clGetGLContextInfoKHR = entryPoint<entry::getGlContextInfo>;
    table.clCreateFromGLBuffer = entryPoint<entry::createFromGlBuffer>;
    table.clCreateFromGLTexture = entryPoint<entry::createFromGlTexture>;
    table.clCreateFromGLTexture2D = entryPoint<entry::createFromGlTexture2D>;
    table.clCreateFromGLTexture3D = entryPoint<entry::createFromGlTexture3D>;
    table.clCreateFromGLRenderbuffer = entryPoint<entry::createFromGlRenderbuffer>;
    table.clGetGLObjectInfo = entryPoint<entry::getGlObjectInfo>;
    table.clGetGLTextureInfo = entryPoint<entry::getGlTextureInfo>;
    table.clGetMemObjectInfo = entryPoint<entry::getMemObjectInfo>;
    table.clEnqueueAcquireGLObjects = entryPoint<entry::enqueueAcquireGlObjects>;
    table.clEnqueueReleaseGLObjects = entryPoint<entry::enqueueReleaseGlObjects>;
    table.clCreateEventFromGLsyncKHR = entryPoint<entry::createEventFromGlSync>;
    table.clGetEventInfo = entryPoint<entry::getEventInfo>;
    table.clRetainEvent = entryPoint<entry::retainEvent>;
    table.clReleaseEvent = entryPoint<entry::releaseEvent>;
    table.clSetUserEventStatus = entryPoint<entry::setUserEventStatus>;
    table.clGetExtensionFunctionAddress = queryEntryPoint<entry::getExtensionFunctionAddress>;
    table.clGetExtensionFunctionAddressForPlatform =
        queryEntryPoint<entry::getExtensionFunctionAddressForPlatform>;
}

namespace {

constexpr std::string_view kCreateEventFromGlSync = "clCreateEventFromGLsyncKHR";

struct NamedFunction {
    std::string_view name;
    void* address;
};

template <typename Function>
NamedFunction named(std::string_view name, Function* function)
{
    return {name, reinterpret_cast<void*>(function)};
}

void* findFunction(std::string_view name)
{
    static const std::array theFunctions{
        named("clGetGLContextInfoKHR", entryPoint<entry::getGlContextInfo>),
        named("clCreateFromGLBuffer", entryPoint<entry::createFromGlBuffer>),
        named("clCreateFromGLTexture", entryPoint<entry::createFromGlTexture>),
        named("clCreateFromGLTexture2D", entryPoint<entry::createFromGlTexture2D>),
        named("clCreateFromGLTexture3D", entryPoint<entry::createFromGlTexture3D>),
        named("clCreateFromGLRenderbuffer", entryPoint<entry::createFromGlRenderbuffer>),
        named("clGetGLObjectInfo", entryPoint<entry::getGlObjectInfo>),
        named("clGetGLTextureInfo", entryPoint<entry::getGlTextureInfo>),
        named("clEnqueueAcquireGLObjects", entryPoint<entry::enqueueAcquireGlObjects>),
        named("clEnqueueReleaseGLObjects", entryPoint<entry::enqueueReleaseGlObjects>),
        named(kCreateEventFromGlSync, entryPoint<entry::createEventFromGlSync>),
        named(GLSHARE_GET_COUNTERS_NAME, getCounters),
    };
    for (const NamedFunction& function : theFunctions) {
        if (function.name == name)
            return function.address;
    }
    return nullptr;
}

// Returns a function of glshare, or else what the runtime returns. The loader has an entry point
// for every name of an extension, so the name of a disabled function must not reach it.
template <typename CallRuntime>
void* lookUp(const char* name, CallRuntime callRuntime)
{
    const std::string_view requested = name == nullptr ? std::string_view() : name;
    if (requested == kCreateEventFromGlSync && !settings().glEvent)
        return nullptr;
    void* own = findFunction(requested);
    return own != nullptr ? own : callRuntime();
}

} // namespace

namespace entry {

void* CL_API_CALL getExtensionFunctionAddress(const char* name)
{
    return lookUp(name, [name] { return runtime().clGetExtensionFunctionAddress(name); });
}

void* CL_API_CALL getExtensionFunctionAddressForPlatform(cl_platform_id platform, const char* name)
{
    return lookUp(name, [platform, name] {
        return runtime().clGetExtensionFunctionAddressForPlatform(platform, name);
    });
}

} // namespace entry

} // namespace glshare
