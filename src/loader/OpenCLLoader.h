// Every OpenCL entry point that the library calls, resolved at run time. Internal.
//
// Nothing links the OpenCL loader library, so that this library also loads without one.
#pragma once

#include <CL/cl.h>
#include <CL/cl_gl.h>

// Direct3D 11 objects are passed as plain pointers and its enumerations as 32-bit numbers, since
// Direct3D's headers exist on Windows only. The two extensions, of the Khronos group and of NVIDIA,
// have the same signatures and values.
using D3D11GetDeviceIDs = cl_int(CL_API_CALL*)(cl_platform_id platform, cl_uint sourceKind,
                                               void* d3dObject, cl_uint deviceSet,
                                               cl_uint numEntries, cl_device_id* devices,
                                               cl_uint* numDevices);
using D3D11CreateBuffer = cl_mem(CL_API_CALL*)(cl_context context, cl_mem_flags flags,
                                               void* d3dBuffer, cl_int* error);
using D3D11EnqueueObjects = cl_int(CL_API_CALL*)(cl_command_queue queue, cl_uint numObjects,
                                                 const cl_mem* objects, cl_uint numEvents,
                                                 const cl_event* waitList, cl_event* event);

inline constexpr cl_uint kCLD3D11Device = 0x4019;              // CL_D3D11_DEVICE_KHR
inline constexpr cl_uint kCLPreferredDevicesForD3D11 = 0x401B; // CL_PREFERRED_DEVICES_FOR_D3D11_KHR
inline constexpr cl_context_properties kCLContextD3D11Device =
    0x401D; // CL_CONTEXT_D3D11_DEVICE_KHR

// The functions of OpenCL 1.0 that are required.
#define VYRA_OPENCL_CORE_ENTRY_POINTS(X)                                                           \
    X(clGetPlatformIDs)                                                                            \
    X(clGetPlatformInfo)                                                                           \
    X(clGetDeviceInfo)                                                                             \
    X(clCreateContext)                                                                             \
    X(clCreateCommandQueue)                                                                        \
    X(clFinish)                                                                                    \
    X(clFlush)                                                                                     \
    X(clCreateBuffer)                                                                              \
    X(clRetainMemObject)                                                                           \
    X(clReleaseMemObject)                                                                          \
    X(clEnqueueWriteBuffer)                                                                        \
    X(clEnqueueReadBuffer)                                                                         \
    X(clEnqueueMapBuffer)                                                                          \
    X(clEnqueueUnmapMemObject)                                                                     \
    X(clWaitForEvents)                                                                             \
    X(clGetEventInfo)                                                                              \
    X(clRetainEvent)                                                                               \
    X(clReleaseEvent)                                                                              \
    X(clCreateProgramWithSource)                                                                   \
    X(clBuildProgram)                                                                              \
    X(clGetProgramBuildInfo)                                                                       \
    X(clRetainProgram)                                                                             \
    X(clReleaseProgram)                                                                            \
    X(clCreateKernel)                                                                              \
    X(clGetKernelWorkGroupInfo)                                                                    \
    X(clRetainKernel)                                                                              \
    X(clReleaseKernel)                                                                             \
    X(clGetExtensionFunctionAddress)

// The functions of OpenGL sharing. Each is optional.
#define VYRA_OPENCL_GL_ENTRY_POINTS(X)                                                             \
    X(clGetGLContextInfoKHR)                                                                       \
    X(clCreateFromGLBuffer)                                                                        \
    X(clEnqueueAcquireGLObjects)                                                                   \
    X(clEnqueueReleaseGLObjects)

// The functions of Direct3D 11 sharing, with their types. Each is optional.
#define VYRA_OPENCL_D3D11_ENTRY_POINTS(X)                                                          \
    X(D3D11GetDeviceIDs, clGetDeviceIDsFromD3D11KHR)                                               \
    X(D3D11GetDeviceIDs, clGetDeviceIDsFromD3D11NV)                                                \
    X(D3D11CreateBuffer, clCreateFromD3D11BufferKHR)                                               \
    X(D3D11CreateBuffer, clCreateFromD3D11BufferNV)                                                \
    X(D3D11EnqueueObjects, clEnqueueAcquireD3D11ObjectsKHR)                                        \
    X(D3D11EnqueueObjects, clEnqueueAcquireD3D11ObjectsNV)                                         \
    X(D3D11EnqueueObjects, clEnqueueReleaseD3D11ObjectsKHR)                                        \
    X(D3D11EnqueueObjects, clEnqueueReleaseD3D11ObjectsNV)

struct OpenCLEntryPoints {
// NOLINTNEXTLINE(bugprone-macro-parentheses): the name in a declaration takes none.
#define VYRA_DECLARE(name) decltype(&::name) name = nullptr;
#define VYRA_DECLARE_TYPED(type, name) type name = nullptr;
    VYRA_OPENCL_CORE_ENTRY_POINTS(VYRA_DECLARE)
    VYRA_OPENCL_GL_ENTRY_POINTS(VYRA_DECLARE)
    VYRA_OPENCL_D3D11_ENTRY_POINTS(VYRA_DECLARE_TYPED)
#undef VYRA_DECLARE
#undef VYRA_DECLARE_TYPED
};

// All null until loadOpenCL has run, and read-only afterwards. An extension's function that the
// runtime does not offer stays null.
extern OpenCLEntryPoints ocl;

enum class OpenCLLoadStatus : int {
    kLoaded = 0,
    kNoLibrary,        // the library cannot be opened
    kNoCoreEntryPoint, // the library lacks a required function
};

// Opens the system's OpenCL loader library and fills the table; each entry is looked up in the
// library first, then with clGetExtensionFunctionAddress. Never ends the process. May throw
// standard exceptions.
[[nodiscard]] OpenCLLoadStatus loadOpenCL();
