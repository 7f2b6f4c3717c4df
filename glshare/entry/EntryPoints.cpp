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

struct NamedFunction {
    std::string_view name;
    void* address;
};

template <typename Function>
NamedFunction named(std::string_view name, Function* function)
{
    return {name, reinterpret_cast<void*>(function)};
}

} // namespace

void* findExtensionFunction(const char* name)
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
        named(GLSHARE_GET_COUNTERS_NAME, getCounters),
    };
    if (name == nullptr)
        return nullptr;
    for (const NamedFunction& function : theFunctions) {
        if (function.name == name)
            return function.address;
    }
    if (switches().glEvent && std::string_view(name) == "clCreateEventFromGLsyncKHR")
        return reinterpret_cast<void*>(entry::createEventFromGlSync);
    return nullptr;
}

namespace entry {

void* CL_API_CALL getExtensionFunctionAddress(const char* name)
{
    void* own = findExtensionFunction(name);
    return own != nullptr ? own : runtime().clGetExtensionFunctionAddress(name);
}

void* CL_API_CALL getExtensionFunctionAddressForPlatform(cl_platform_id platform, const char* name)
{
    void* own = findExtensionFunction(name);
    return own != nullptr ? own
                          : runtime().clGetExtensionFunctionAddressForPlatform(platform, name);
}

} // namespace entry

} // namespace glshare
