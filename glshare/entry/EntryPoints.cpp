#include "entry/EntryPoints.h"

#include "core/Counters.h"
#include "core/Switches.h"
#include "glshare.h"

#include <array>
#include <string_view>

namespace glshare {

void installEntryPoints(cl_icd_dispatch& table)
{
    table.clGetPlatformInfo = entry::getPlatformInfo;
    table.clGetDeviceIDs = entry::getDeviceIds;
    table.clGetDeviceInfo = entry::getDeviceInfo;
    table.clCreateContext = entry::createContext;
    table.clCreateContextFromType = entry::createContextFromType;
    table.clRetainContext = entry::retainContext;
    table.clReleaseContext = entry::releaseContext;
    table.clGetContextInfo = entry::getContextInfo;
    table.clGetGLContextInfoKHR = entry::getGlContextInfo;
    table.clCreateFromGLBuffer = entry::createFromGlBuffer;
    table.clCreateFromGLTexture = entry::createFromGlTexture;
    table.clCreateFromGLTexture2D = entry::createFromGlTexture2D;
    table.clCreateFromGLTexture3D = entry::createFromGlTexture3D;
    table.clCreateFromGLRenderbuffer = entry::createFromGlRenderbuffer;
    table.clGetGLObjectInfo = entry::getGlObjectInfo;
    table.clGetGLTextureInfo = entry::getGlTextureInfo;
    table.clGetMemObjectInfo = entry::getMemObjectInfo;
    table.clEnqueueAcquireGLObjects = entry::enqueueAcquireGlObjects;
    table.clEnqueueReleaseGLObjects = entry::enqueueReleaseGlObjects;
    table.clCreateEventFromGLsyncKHR = entry::createEventFromGlSync;
    table.clGetEventInfo = entry::getEventInfo;
    table.clRetainEvent = entry::retainEvent;
    table.clReleaseEvent = entry::releaseEvent;
    table.clSetUserEventStatus = entry::setUserEventStatus;
    table.clGetExtensionFunctionAddress = entry::getExtensionFunctionAddress;
    table.clGetExtensionFunctionAddressForPlatform = entry::getExtensionFunctionAddressForPlatform;
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
        named("clGetGLContextInfoKHR", entry::getGlContextInfo),
        named("clCreateFromGLBuffer", entry::createFromGlBuffer),
        named("clCreateFromGLTexture", entry::createFromGlTexture),
        named("clCreateFromGLTexture2D", entry::createFromGlTexture2D),
        named("clCreateFromGLTexture3D", entry::createFromGlTexture3D),
        named("clCreateFromGLRenderbuffer", entry::createFromGlRenderbuffer),
        named("clGetGLObjectInfo", entry::getGlObjectInfo),
        named("clGetGLTextureInfo", entry::getGlTextureInfo),
        named("clEnqueueAcquireGLObjects", entry::enqueueAcquireGlObjects),
        named("clEnqueueReleaseGLObjects", entry::enqueueReleaseGlObjects),
        named(kCreateEventFromGlSync, entry::createEventFromGlSync),
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
