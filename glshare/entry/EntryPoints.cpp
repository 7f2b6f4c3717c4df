#include "entry/EntryPoints.h"

#include "core/api/Switches.h"
#include "core/sharing/Counters.h"
#include "entry/EntryPoint.h"
#include "glshare.h"

#include <array>
#include <string_view>

namespace glshare {

void installEntryPoints(cl_icd_dispatch& table)
{
    table.clGetPlatformInfo = entryPointOfDescription<entry::getPlatformInfo>;
    table.clGetDeviceIDs = entryPointOfDescription<entry::getDeviceIds>;
    table.clGetDeviceInfo = entryPointOfDescription<entry::getDeviceInfo>;
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
    table.clGetExtensionFunctionAddress =
        entryPointOfDescription<entry::getExtensionFunctionAddress>;
    table.clGetExtensionFunctionAddressForPlatform =
        entryPointOfDescription<entry::getExtensionFunctionAddressForPlatform>;
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

// The loader has an entry point of its own for every name it knows, so that a function which is not
// offered must be hidden from it.
template <typename AskBelow>
void* lookUp(const char* name, AskBelow askBelow)
{
    const std::string_view wanted = name == nullptr ? std::string_view() : name;
    if (wanted == kCreateEventFromGlSync && !switches().glEvent)
        return nullptr;
    void* own = findFunction(wanted);
    return own != nullptr ? own : askBelow();
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
