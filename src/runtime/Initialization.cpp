// Part of TopenCLInfo: start-up and clean-up.
#include "diagnostics/CLStatusReport.h"
#include "host/Application.h"
#include "kernels/TopenCLKernelStore.h"
#include "loader/OpenCLLoader.h"
#include "runtime/DeviceSelection.h"
#include "runtime/PlatformSelection.h"
#include "runtime/TopenCLInfo.h"

#include <cstdio>
#include <cstdlib>
#include <exception>
#include <optional>

namespace {

bool disabledByUser()
{
    if (!std::getenv("VYRA_DISABLE_OPENCL"))
        return false;
    std::fprintf(stderr, "OpenCL initialization has been disabled by user\n");
    return true;
}

bool loadRuntime()
{
    try {
        if (loadOpenCL() == OpenCLLoadStatus::kLoaded)
            return true;
        std::fprintf(stderr, "OpenCL evaluator failed to initialize clew.\n");
    } catch (const std::exception& error) {
        std::fprintf(stderr,
                     "CLEW failed to initialize: %s  Vyra running without OpenCL support.\n",
                     error.what());
    } catch (...) {
        std::fprintf(stderr, "CLEW failed to initialize.  Vyra running without OpenCL support.\n");
    }
    return false;
}

} // namespace

bool TopenCLInfo::initialize(void* window, void* graphicsContext, void* reserved, bool usingDX,
                             bool usingGLCoreProfile, unsigned vendorId)
{
    if (!sfTheOne)
        sfTheOne = new TopenCLInfo(window, graphicsContext, reserved, usingDX, usingGLCoreProfile,
                                   vendorId);
    return isValid();
}

// While this runs there is no object for theOne() to return: no step may ask for it.
TopenCLInfo::TopenCLInfo(void* window, void* graphicsContext, void* /*reserved*/, bool usingDX,
                         bool usingGLCoreProfile, unsigned vendorId)
    : fUsingDX(usingDX), fUsingGLCoreProfile(usingGLCoreProfile)
{
    std::fprintf(stderr, "OpenCL evaluator is attempting to initialize OpenCL.\n");
    if (disabledByUser() || !loadRuntime())
        return;

    cl_platform_id platform = nullptr;
    Tstring extensions;
    if (!choosePlatform(vendorId, platform, extensions))
        return;
    setMinimumBufferSize(getDefaultMinimumBufferSize());

    if (!setupDirectXExtensionFunctions(&extensions))
        return;
    if (!chooseDeviceAndContext(window, graphicsContext, platform))
        return;
    if (!setupExtensionFunctions(&extensions))
        return;
    finalizeExtensionFunctions();

    if (!reportDevice(fDevice) || !decideDoublePrecision(platform) || !fContext)
        return;
    createQueuesAndKernelStore();
    std::fprintf(stderr, "\n");
    if (!readComputeUnitCount())
        return;
    TresourceGuard::initializeOffset();
}

// The vendor, its platform, and its class.
bool TopenCLInfo::choosePlatform(unsigned vendorId, cl_platform_id& platform, Tstring& extensions)
{
    const std::optional<Tstring> vendor = chooseVendor(vendorId);
    if (!vendor)
        return false;
    // A search that fails behind the match has found its platform all the same.
    findPlatformByVendor(*vendor, platform, extensions);
    if (!platform) {
        std::fprintf(stderr, "OpenCL evaluator failed to find OpenCL device with vendor %s.\n",
                     vendor->asChar());
        return false;
    }
    std::fprintf(stderr, "OpenCL evaluator choosing OpenCL platform %s.\n", vendor->asChar());
    fProvider = providerOfVendor(*vendor);
    return true;
}

// The device that shares with the renderer, what its driver is good for, and a context on it.
bool TopenCLInfo::chooseDeviceAndContext(void* window, void* graphicsContext,
                                         cl_platform_id platform)
{
    const ContextProperties properties =
        fUsingDX ? d3d11ContextProperties(graphicsContext, platform)
                 : openGLContextProperties(window, graphicsContext, platform);
    const bool found = fUsingDX ? chooseDeviceForD3D11(graphicsContext, platform, fDevice)
                                : chooseDeviceForOpenGL(properties, fDevice);
    if (!found || !decideAsyncReadback())
        return false;

    cl_int status = CL_SUCCESS;
    fContext =
        ocl.clCreateContext(properties.data(), 1, &fDevice, contextErrorCallback, nullptr, &status);
    return succeeded(status, CLReportStyle::kSetUp);
}

void TopenCLInfo::createQueuesAndKernelStore()
{
    fCommandQueue = createOpenCLCommandQueue(&fUsingOutOfOrderExecution);
    fSecondaryCommandQueue = createOpenCLCommandQueue(&fUsingOutOfOrderExecution);
    fKernelStore = new TopenCLKernelStore;
    fKernelStore->initialize(fContext, fDevice, fProvider);
}

TopenCLInfo::~TopenCLInfo()
{
    cleanUpOpenCL();
}

// Context and queues are dropped, not released: commands of the host may still be under way in
// them.
void TopenCLInfo::cleanUpOpenCL()
{
    delete fKernelStore;
    fKernelStore = nullptr;
    fCommandQueue = nullptr;
    fSecondaryCommandQueue = nullptr;
    fContext = nullptr;
}
