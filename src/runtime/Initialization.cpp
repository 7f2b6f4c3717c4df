// Part of TopenCLInfo: start-up and clean-up.
#include "diagnostics/CLStatusReport.h"
#include "diagnostics/ContextErrorCallback.h"
#include "host/Application.h"
#include "kernels/TopenCLKernelStore.h"
#include "loader/OpenCLLoader.h"
#include "runtime/DeviceSelection.h"
#include "runtime/EnvironmentVariables.h"
#include "runtime/PlatformSelection.h"
#include "runtime/StartUpStep.h"
#include "runtime/TopenCLInfo.h"

#include <cstdio>
#include <cstdlib>
#include <exception>
#include <optional>

namespace {

bool disabledByUser()
{
    enterStartUpStep(StartUpStep::kSwitch);
    if (!std::getenv(kDisableOpenCLVariable))
        return false;
    std::fprintf(stderr, "OpenCL initialization has been disabled by user\n");
    return true;
}

bool loadRuntime()
{
    enterStartUpStep(StartUpStep::kLoader);
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

// Prints the chosen platform, or that there is none. Returns whether there is one.
bool reportPlatform(const Tstring& vendor, cl_platform_id platform)
{
    if (!platform) {
        std::fprintf(stderr, "OpenCL evaluator failed to find OpenCL device with vendor %s.\n",
                     vendor.asChar());
        return false;
    }
    std::fprintf(stderr, "OpenCL evaluator choosing OpenCL platform %s.\n", vendor.asChar());
    return true;
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

// theOne() has no object to return during construction: no step may call it.
TopenCLInfo::TopenCLInfo(void* window, void* graphicsContext, void* /*reserved*/, bool usingDX,
                         bool usingGLCoreProfile, unsigned vendorId)
    : fUsingDX(usingDX), fUsingGLCoreProfile(usingGLCoreProfile)
{
    std::fprintf(stderr, "OpenCL evaluator is attempting to initialize OpenCL.\n");
    if (disabledByUser() || !loadRuntime())
        return;

    enterStartUpStep(StartUpStep::kVendor);
    const std::optional<Tstring> vendor = chooseVendor(vendorId);
    if (!vendor)
        return;
    cl_platform_id platform = nullptr;
    Tstring extensions;
    // The result is ignored: a search that fails after the match has found the platform.
    static_cast<void>(findPlatformByVendor(*vendor, platform, extensions));
    if (!reportPlatform(*vendor, platform))
        return;
    fProvider = providerOfVendor(*vendor);
    setMinimumBufferSize(getDefaultMinimumBufferSize());

    if (!setupDirectXExtensionFunctions(&extensions))
        return;
    const ContextProperties properties =
        usingDX ? d3d11ContextProperties(graphicsContext, platform)
                : openGLContextProperties(window, graphicsContext, platform);
    if (!chooseDevice(usingDX, graphicsContext, platform, properties, fDevice))
        return;
    if (!decideAsyncReadback() || !createContext(properties.data()))
        return;
    if (!setupExtensionFunctions(&extensions))
        return;
    finalizeExtensionFunctions();

    if (!reportDevice(fDevice) || !decideDoublePrecision(platform))
        return;
    if (!fContext) { // created without an error, and null all the same
        enterStartUpStep(StartUpStep::kContext);
        return;
    }
    createQueuesAndKernelStore();
    std::fprintf(stderr, "\n");
    if (!readComputeUnitCount())
        return;
    TresourceGuard::initializeOffset();
}

bool TopenCLInfo::createContext(const cl_context_properties* properties)
{
    enterStartUpStep(StartUpStep::kContext);
    cl_int status = CL_SUCCESS;
    fContext = ocl.clCreateContext(properties, 1, &fDevice, contextErrorCallback, nullptr, &status);
    return checkStatus(status, CLReportStyle::kWithLineBreak);
}

void TopenCLInfo::createQueuesAndKernelStore()
{
    enterStartUpStep(StartUpStep::kQueue);
    fCommandQueue = createOpenCLCommandQueue(&fUsingOutOfOrderExecution);
    fSecondaryCommandQueue = createOpenCLCommandQueue(&fUsingOutOfOrderExecution);
    fKernelStore = new TopenCLKernelStore;
    fKernelStore->initialize(fContext, fDevice, fProvider);
}

TopenCLInfo::~TopenCLInfo()
{
    cleanUpOpenCL();
}

// Context and queues are set to null and not released.
void TopenCLInfo::cleanUpOpenCL()
{
    delete fKernelStore;
    fKernelStore = nullptr;
    fCommandQueue = nullptr;
    fSecondaryCommandQueue = nullptr;
    fContext = nullptr;
}
