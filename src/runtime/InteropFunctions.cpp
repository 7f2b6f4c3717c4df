// The interop function table, and the parts of TopenCLInfo that fill it.
#include "runtime/InteropFunctions.h"

#include "host/Environment.h"
#include "host/GLFunctionTable.h"
#include "runtime/EnvironmentVariables.h"
#include "runtime/StartUpStep.h"
#include "runtime/SyncModes.h"
#include "runtime/TopenCLInfo.h"

#include <cstdio>

constinit D3D11GetDeviceIDs sfGetDeviceIDsFromD3D11 = nullptr;
constinit CreateSharedCLBuffer sfCreateSharedCLBuffer = nullptr;
constinit EnqueueSharedObjects sfPendingEnqueueAcquireSharedObjects = nullptr;
constinit EnqueueSharedObjects sfPendingEnqueueReleaseSharedObjects = nullptr;
constinit EnqueueSharedObjects sfEnqueueAcquireSharedObjects = nullptr;
constinit EnqueueSharedObjects sfEnqueueReleaseSharedObjects = nullptr;

namespace {

// The entry points of one Direct3D 11 extension.
struct D3D11Extension {
    const char* name;
    bool isKHR;
    D3D11GetDeviceIDs getDeviceIDs;
    D3D11CreateBuffer createBuffer;
    D3D11EnqueueObjects enqueueAcquire;
    D3D11EnqueueObjects enqueueRelease;
};

// Fills the table. Returns false if an entry point is missing; the device query is set even then.
bool useD3D11Extension(const D3D11Extension& extension)
{
    sfGetDeviceIDsFromD3D11 = extension.getDeviceIDs;
    if (!extension.getDeviceIDs || !extension.createBuffer || !extension.enqueueAcquire ||
        !extension.enqueueRelease)
        return false;
    sfCreateSharedCLBuffer = extension.createBuffer;
    sfPendingEnqueueAcquireSharedObjects = extension.enqueueAcquire;
    sfPendingEnqueueReleaseSharedObjects = extension.enqueueRelease;
    return true;
}

cl_mem CL_API_CALL createFromGLBuffer(cl_context context, cl_mem_flags flags, void* resource,
                                      cl_int* error)
{
    return ocl.clCreateFromGLBuffer(context, flags, *static_cast<const cl_GLuint*>(resource),
                                    error);
}

// Fills the table. Returns false if an entry point of OpenGL sharing is missing.
bool useGLSharing()
{
    if (!ocl.clCreateFromGLBuffer || !ocl.clEnqueueAcquireGLObjects ||
        !ocl.clEnqueueReleaseGLObjects || !ocl.clGetGLContextInfoKHR)
        return false;
    sfCreateSharedCLBuffer = createFromGLBuffer;
    sfPendingEnqueueAcquireSharedObjects = ocl.clEnqueueAcquireGLObjects;
    sfPendingEnqueueReleaseSharedObjects = ocl.clEnqueueReleaseGLObjects;
    return true;
}

// Prints the message of a choice, if it has one, and returns the mode.
template <typename Mode>
Mode reportChoice(const SyncModeChoice<Mode>& choice)
{
    if (choice.message)
        std::fputs(choice.message, stderr);
    return choice.mode;
}

bool listsExtension(const Tstring& extensions, const char* name)
{
    return extensions.findMB(name) != -1;
}

} // namespace

bool TopenCLInfo::setupDirectXExtensionFunctions(Tstring* extensions)
{
    enterStartUpStep(StartUpStep::kD3D11Sharing);
    if (!fUsingDX)
        return true;
    // Both extensions order Direct3D and OpenCL themselves; no variable changes that.
    fGraphicsToCLSyncMode = kGraphicsToCLImplicit;
    fCLToGraphicsSyncMode = kCLToGraphicsImplicit;

    const D3D11Extension known[] = {
        {"cl_nv_d3d11_sharing", false, ocl.clGetDeviceIDsFromD3D11NV, ocl.clCreateFromD3D11BufferNV,
         ocl.clEnqueueAcquireD3D11ObjectsNV, ocl.clEnqueueReleaseD3D11ObjectsNV},
        {"cl_khr_d3d11_sharing", true, ocl.clGetDeviceIDsFromD3D11KHR,
         ocl.clCreateFromD3D11BufferKHR, ocl.clEnqueueAcquireD3D11ObjectsKHR,
         ocl.clEnqueueReleaseD3D11ObjectsKHR},
    };
    for (const D3D11Extension& extension : known) {
        if (!listsExtension(*extensions, extension.name))
            continue;
        if (useD3D11Extension(extension)) {
            fUsingKHRD3D11Sharing = extension.isKHR;
            return true;
        }
        std::printf("Error: found %s extension but failed to get function pointers.",
                    extension.name);
        return false;
    }
    std::fprintf(stderr, "Error: using D3D11 but found no OpenCL/D3D11 interop extension.");
    return false;
}

bool TopenCLInfo::setupExtensionFunctions(Tstring* extensions)
{
    enterStartUpStep(StartUpStep::kSharingFunctions);
    if (fUsingDX)
        return true;
    const SyncModeVariables variables = readSyncModeVariables();
    if (variables.forceFinish != 0) {
        fGraphicsToCLSyncMode = kGraphicsToCLFinish;
        fCLToGraphicsSyncMode = kCLToGraphicsFinish;
    } else {
        const GLFunctionTable* gl = GLFunctionTable::fpGlobalFunctionTable;
        const SyncAbilities abilities{
            .glEvent = listsExtension(*extensions, "cl_khr_gl_event"),
            .arbSync = gl && gl->syncObjectsUsable(),
            .implicitSyncTrusted = fProvider != kNVIDIAProvider || fDriverSupportsImplicitSync,
        };
        fGraphicsToCLSyncMode =
            reportChoice(chooseGraphicsToCLSyncMode(variables.graphicsToCL, abilities));
        fCLToGraphicsSyncMode =
            reportChoice(chooseCLToGraphicsSyncMode(variables.clToGraphics, abilities));
    }

    if (useGLSharing())
        return true;
    std::fprintf(stderr, "Error: found cl_khr_gl_sharing but failed to get function pointers");
    return false;
}

void TopenCLInfo::finalizeExtensionFunctions()
{
    sfEnqueueAcquireSharedObjects = sfPendingEnqueueAcquireSharedObjects;
    sfEnqueueReleaseSharedObjects = sfPendingEnqueueReleaseSharedObjects;
}

bool TopenCLInfo::supportsThreadedSharing() const
{
    static const bool sfForceThreading = VyraGetEnv(kForceThreadingVariable) != nullptr;
    return sfForceThreading || fProvider != kNVIDIAProvider || fUsingDX || fUsingKHRD3D11Sharing;
}
