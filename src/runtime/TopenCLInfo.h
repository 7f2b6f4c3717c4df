// The process's OpenCL runtime.
#pragma once

#include "VyraOpenCLExport.h"
#include "host/Tstring.h"
#include "interop/TopenCLSharedBufferMgr.h"
#include "runtime/OpenCLProvider.h"

#include <cstddef>

#include <CL/cl.h>

class TopenCLKernelStore;

// The owner of device, context, queues, kernel store, shared buffers and options.
//
// The host calls initialize once, before any other function of the library; the object then lives
// until the process ends, whether valid or not. Start-up stops at the first failure. A failure that
// the user can do something about is printed to standard error; failing OpenCL calls are reported
// as warnings. The values decided before the failure stay readable.
//
// After initialize, all getters may be called from any thread without synchronisation. Only the
// three set functions write; they must not overlap with readers.
class VYRA_OPENCL_API TopenCLInfo {
public:
    // The way in which OpenCL waits for the renderer.
    enum GraphicsToCLSyncMode : int {
        kGraphicsToCLImplicit = 1, // the sharing extension orders them
        kGraphicsToCLExplicit = 2, // acquires wait for an OpenGL fence set after drawing
        kGraphicsToCLFinish = 3,   // the host calls glFinish
    };
    // The way in which the renderer waits for OpenCL.
    enum CLToGraphicsSyncMode : int {
        kCLToGraphicsImplicit = 1,   // the sharing extension orders them
        kCLToGraphicsEventQuery = 2, // the host polls the release event
        kCLToGraphicsSyncObject = 3, // the OpenGL stream waits for a sync object
        kCLToGraphicsFinish = 4,     // the host calls clFinish
    };

    // Creates the runtime object from the renderer's native window, its OpenGL context (or
    // ID3D11Device when `usingDX`) and the PCI vendor id of its adapter; `reserved` is ignored.
    // A later call changes nothing. Returns isValid().
    static bool initialize(void* window, void* graphicsContext, void* reserved, bool usingDX,
                           bool usingGLCoreProfile, unsigned vendorId);
    // Returns the object. Requires initialize.
    static TopenCLInfo& theOne();
    // Returns whether there is an object with a context and a primary queue.
    [[nodiscard]] static bool isValid();

    // Wait for (finish) or submit (flush) all commands of both queues. Do nothing if not valid.
    // Wrap clFinish and clFlush.
    static void finish();
    static void flush();
    // Returns whether the command of `event` is complete. True for null and for an event whose
    // query fails; false for a command that ended with an error. Wraps clGetEventInfo.
    [[nodiscard]] static bool IsEventComplete(cl_event event);

    // Copy the members: handles and kernel store are shared, nothing is retained.
    TopenCLInfo(const TopenCLInfo& other);
    TopenCLInfo& operator=(const TopenCLInfo& other);

    // The object owns the handles; callers borrow them.
    cl_context openCLContext() const noexcept { return fContext; }
    cl_command_queue openCLCommandQueue() const noexcept { return fCommandQueue; }
    cl_command_queue secondaryOpenCLCommandQueue() const noexcept { return fSecondaryCommandQueue; }
    cl_device_id openCLDevice() const noexcept { return fDevice; }
    OpenCLProvider openCLProvider() const noexcept { return fProvider; }
    unsigned computeUnitCount() const noexcept { return fComputeUnitCount; }
    // Requires that start-up has reached the creation of the queues.
    TopenCLKernelStore& kernelStore() const noexcept { return *fKernelStore; }
    TopenCLSharedBufferMgr& sharedBufferMgr() noexcept { return fSharedBufferMgr; }
    const TopenCLSharedBufferMgr& sharedBufferMgr() const noexcept { return fSharedBufferMgr; }

    GraphicsToCLSyncMode graphicsToCLSyncMode() const noexcept { return fGraphicsToCLSyncMode; }
    CLToGraphicsSyncMode clToGraphicsSyncMode() const noexcept { return fCLToGraphicsSyncMode; }
    // Return whether the host calls glFinish before an evaluation, and clFinish before drawing.
    bool useGLFinish() const noexcept
    {
        return fGraphicsToCLSyncMode == kGraphicsToCLFinish && !fUsingDX;
    }
    bool useCLFinish() const noexcept { return fCLToGraphicsSyncMode == kCLToGraphicsFinish; }
    // Returns whether several threads may share buffers at the same time.
    bool supportsThreadedSharing() const;

    bool usingGPU() const noexcept { return fUsingGPU; }
    bool usingDX() const noexcept { return fUsingDX; }
    bool usingGLCoreProfile() const noexcept { return fUsingGLCoreProfile; }
    bool usingOutOfOrderExecution() const noexcept { return fUsingOutOfOrderExecution; }
    bool supportsAsyncReadback() const noexcept { return fSupportsAsyncReadback; }

    bool platformSupportsDoublePrecision() const noexcept
    {
        return fPlatformSupportsDoublePrecision;
    }
    bool allowDoublePrecisionSupport() const noexcept { return fAllowDoublePrecisionSupport; }
    bool supportsDoublePrecision() const
    {
        return fPlatformSupportsDoublePrecision && fAllowDoublePrecisionSupport;
    }
    // Returns whether the stored value changed. Without the platform's support the value is false.
    bool setAllowDoublePrecisionSupport(bool allow);

    // Returns the least number of vertices for which the host deforms with OpenCL.
    int minimumBufferSize() const noexcept
    {
        return fUseMinimumBufferSize ? fMinimumBufferSize : 0;
    }
    bool useMinimumBufferSize() const noexcept { return fUseMinimumBufferSize; }
    // Returns, in vertices, VYRA_OPENCL_DEFORMER_MIN_VERTS if it is set, which is read and printed
    // to standard error on every call; else 2000 on NVIDIA and 500 elsewhere.
    int getDefaultMinimumBufferSize() const;
    // Return whether the stored value changed. A negative `size` selects the default.
    bool setMinimumBufferSize(int size);
    bool setUseMinimumBufferSize(bool use);

    // Returns a new in-order queue, whose reference the caller owns. Null without a context or a
    // device, or if a call fails, which is reported. The out-parameter may be null and receives
    // false. Wraps clCreateCommandQueue.
    [[nodiscard]] cl_command_queue createOpenCLCommandQueue(bool* usingOutOfOrderExecution);
    // Computes the sizes of a one-dimensional launch of `workItemCount` work-items: the kernel's
    // work-group size on the device, and the count rounded up to a multiple of it. Kernels must
    // skip the work-items past the count. Returns an OpenCL status; on failure the outputs are not
    // written. Wraps clGetKernelWorkGroupInfo.
    int getWorkGroupSizes(cl_kernel kernel, std::size_t workItemCount, std::size_t& globalWorkSize,
                          std::size_t& localWorkSize) const;

    // Returns the host's resource directory, which is queried once. The first call must not overlap
    // with another.
    Tstring& getAbsolutePathToResources();
    // Reads a kernel source file into `source`, unchanged, after `preamble`. Returns false if it
    // cannot be read, is empty, or has 2 GiB or more; `source` is then unspecified. Safe from any
    // thread.
    [[nodiscard]] static bool oclLoadProgSource(Tstring& source, const char* fileName,
                                                const char* preamble);

private:
    TopenCLInfo(void* window, void* graphicsContext, void* reserved, bool usingDX,
                bool usingGLCoreProfile, unsigned vendorId);
    ~TopenCLInfo();
    void cleanUpOpenCL();

    // The steps of start-up. A step that returns false stops it.
    [[nodiscard]] static bool findPlatformByVendor(const Tstring& vendor, cl_platform_id& platform,
                                                   Tstring& extensions);
    [[nodiscard]] bool setupDirectXExtensionFunctions(Tstring* extensions);
    [[nodiscard]] bool decideAsyncReadback();
    [[nodiscard]] bool judgeNVIDIADriver();
    [[nodiscard]] bool createContext(const cl_context_properties* properties);
    [[nodiscard]] bool setupExtensionFunctions(Tstring* extensions);
    static void finalizeExtensionFunctions();
    [[nodiscard]] bool decideDoublePrecision(cl_platform_id platform);
    void createQueuesAndKernelStore();
    [[nodiscard]] bool readComputeUnitCount();

    static TopenCLInfo* sfTheOne;
    static bool sfListPlatforms; // true until all platforms have been listed once

    cl_context fContext = nullptr;
    cl_command_queue fCommandQueue = nullptr;
    cl_command_queue fSecondaryCommandQueue = nullptr;
    cl_device_id fDevice = nullptr;
    Tstring fResourcesPath;
    int fMinimumBufferSize = 0;
    bool fUseMinimumBufferSize = true;
    OpenCLProvider fProvider = kUnknownProvider;
    unsigned fComputeUnitCount = 0;
    TopenCLKernelStore* fKernelStore = nullptr; // owned
    TopenCLSharedBufferMgr fSharedBufferMgr;
    GraphicsToCLSyncMode fGraphicsToCLSyncMode = kGraphicsToCLFinish;
    CLToGraphicsSyncMode fCLToGraphicsSyncMode = kCLToGraphicsFinish;
    bool fUsingGPU = true;
    bool fPlatformSupportsDoublePrecision = false;
    bool fAllowDoublePrecisionSupport = true;
    bool fUsingDX;
    bool fUsingKHRD3D11Sharing = false;
    bool fUsingOutOfOrderExecution = false;
    bool fUsingGLCoreProfile;
    bool fSupportsAsyncReadback = false;
    bool fDriverSupportsImplicitSync = false; // NVIDIA only
};
