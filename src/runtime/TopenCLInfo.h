// The process's OpenCL runtime.
#pragma once

#include "VyraOpenCLExport.h"
#include "host/Tstring.h"
#include "interop/TopenCLSharedBufferMgr.h"
#include "runtime/OpenCLProvider.h"

#include <cstddef>

#include <CL/cl.h>

class TopenCLKernelStore;

// The one object that holds platform, device, context, queues, kernel store, shared buffers and
// options.
//
// The host calls initialize once, before anything else of the library; the object then lives until
// the process ends, valid or not. Start-up stops at the first failure and says so on standard error
// where the user can do something about it; failing OpenCL calls are reported as warnings. What it
// had decided by then stays readable. Everything is read without synchronisation afterwards: only
// the three set operations write, and they are not to overlap with readers.
class VYRA_OPENCL_API TopenCLInfo {
public:
    // How OpenCL waits for the renderer.
    enum GraphicsToCLSyncMode : int {
        kGraphicsToCLImplicit = 1, // the sharing extension orders the two
        kGraphicsToCLExplicit = 2, // acquires wait for an OpenGL fence set after drawing
        kGraphicsToCLFinish = 3,   // the host calls glFinish
    };
    // How the renderer waits for OpenCL.
    enum CLToGraphicsSyncMode : int {
        kCLToGraphicsImplicit = 1,   // the sharing extension orders the two
        kCLToGraphicsEventQuery = 2, // the host polls the release event
        kCLToGraphicsSyncObject = 3, // the OpenGL stream waits for a sync object
        kCLToGraphicsFinish = 4,     // the host calls clFinish
    };

    // Creates the runtime object from the renderer's native window, its OpenGL context (or
    // ID3D11Device when `usingDX`) and the PCI vendor id of its adapter; `reserved` is ignored.
    // Once only: a later call changes nothing. Returns isValid().
    static bool initialize(void* window, void* graphicsContext, void* reserved, bool usingDX,
                           bool usingGLCoreProfile, unsigned vendorId);
    // The object. Only after initialize.
    static TopenCLInfo& theOne();
    // There is an object, and it has a context and a primary queue.
    static bool isValid();

    // Waits for (finish) or submits (flush) all commands of both queues. Nothing when not valid.
    // Wrap clFinish and clFlush.
    static void finish();
    static void flush();
    // Whether `event` is done. Null, and an event that cannot be asked, count as done; a command
    // that ended with an error does not. Wraps clGetEventInfo.
    static bool IsEventComplete(cl_event event);

    // Member-wise copies: handles and kernel store are shared, nothing is retained.
    TopenCLInfo(const TopenCLInfo& other);
    TopenCLInfo& operator=(const TopenCLInfo& other);

    // All handles are the object's own, borrowed by callers.
    cl_context openCLContext() const { return fContext; }
    cl_command_queue openCLCommandQueue() const { return fCommandQueue; }
    cl_command_queue secondaryOpenCLCommandQueue() const { return fSecondaryCommandQueue; }
    cl_device_id openCLDevice() const { return fDevice; }
    OpenCLProvider openCLProvider() const { return fProvider; }
    unsigned computeUnitCount() const { return fComputeUnitCount; }
    // Only when start-up got as far as the queues.
    TopenCLKernelStore& kernelStore() const { return *fKernelStore; }
    TopenCLSharedBufferMgr& sharedBufferMgr() { return fSharedBufferMgr; }
    const TopenCLSharedBufferMgr& sharedBufferMgr() const { return fSharedBufferMgr; }

    GraphicsToCLSyncMode graphicsToCLSyncMode() const { return fGraphicsToCLSyncMode; }
    CLToGraphicsSyncMode clToGraphicsSyncMode() const { return fCLToGraphicsSyncMode; }
    // The host is to call glFinish before an evaluation; clFinish before drawing.
    bool useGLFinish() const { return fGraphicsToCLSyncMode == kGraphicsToCLFinish && !fUsingDX; }
    bool useCLFinish() const { return fCLToGraphicsSyncMode == kCLToGraphicsFinish; }
    // Whether buffers may be shared from several threads at once.
    bool supportsThreadedSharing() const;

    bool usingGPU() const { return fUsingGPU; }
    bool usingDX() const { return fUsingDX; }
    bool usingGLCoreProfile() const { return fUsingGLCoreProfile; }
    bool usingOutOfOrderExecution() const { return fUsingOutOfOrderExecution; }
    bool supportsAsyncReadback() const { return fSupportsAsyncReadback; }

    bool platformSupportsDoublePrecision() const { return fPlatformSupportsDoublePrecision; }
    bool allowDoublePrecisionSupport() const { return fAllowDoublePrecisionSupport; }
    bool supportsDoublePrecision() const
    {
        return fPlatformSupportsDoublePrecision && fAllowDoublePrecisionSupport;
    }
    // Returns whether the stored value changed. Without the platform's support it can only become
    // false.
    bool setAllowDoublePrecisionSupport(bool allow);

    // The least number of vertices for which the host is to deform with OpenCL.
    int minimumBufferSize() const { return fUseMinimumBufferSize ? fMinimumBufferSize : 0; }
    bool useMinimumBufferSize() const { return fUseMinimumBufferSize; }
    // 2000 on NVIDIA, 500 elsewhere, or VYRA_OPENCL_DEFORMER_MIN_VERTS, which is read, and said on
    // standard error, on every call.
    int getDefaultMinimumBufferSize() const;
    // Returns whether the stored value changed. A negative `size` stands for the default.
    bool setMinimumBufferSize(int size);
    bool setUseMinimumBufferSize(bool use);

    // A new in-order queue, whose reference is the caller's. Null without a context or a device
    // and, reported, when a call fails. The out-parameter may be null and receives false. Wraps
    // clCreateCommandQueue.
    cl_command_queue createOpenCLCommandQueue(bool* usingOutOfOrderExecution);
    // Sizes a one-dimensional launch of `workItemCount` work-items: the kernel's work-group size on
    // the device, and the count rounded up to a multiple of it. Kernels guard the work-items beyond
    // the count. An OpenCL status; on failure the outputs are not written. Wraps
    // clGetKernelWorkGroupInfo.
    int getWorkGroupSizes(cl_kernel kernel, std::size_t workItemCount, std::size_t& globalWorkSize,
                          std::size_t& localWorkSize) const;

    // The host's resource directory, asked for once. The first call must not overlap with another.
    Tstring& getAbsolutePathToResources();
    // Reads a kernel source file, unchanged, behind `preamble`. False when it cannot be read, is
    // empty, or is 2 GiB or larger; `source` then holds nothing of use. Safe from any thread.
    static bool oclLoadProgSource(Tstring& source, const char* fileName, const char* preamble);

private:
    TopenCLInfo(void* window, void* graphicsContext, void* reserved, bool usingDX,
                bool usingGLCoreProfile, unsigned vendorId);
    ~TopenCLInfo();
    void cleanUpOpenCL();

    // The steps of start-up; false stops it.
    static bool findPlatformByVendor(const Tstring& vendor, cl_platform_id& platform,
                                     Tstring& extensions);
    bool setupDirectXExtensionFunctions(Tstring* extensions);
    bool decideAsyncReadback();
    bool judgeNVIDIADriver();
    bool createContext(const cl_context_properties* properties);
    bool setupExtensionFunctions(Tstring* extensions);
    static void finalizeExtensionFunctions();
    bool decideDoublePrecision(cl_platform_id platform);
    void createQueuesAndKernelStore();
    bool readComputeUnitCount();

    static TopenCLInfo* sfTheOne;
    static bool sfListPlatforms; // until one pass over the platforms has been complete

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
