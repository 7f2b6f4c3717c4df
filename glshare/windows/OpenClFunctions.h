// The list of the functions of OpenCL 1.2, which an OpenCL.dll exports.
#pragma once

// clang-format off
#define GLSHARE_FUNCTIONS(X)                                                                       \
    X(clGetPlatformIDs) X(clGetPlatformInfo) X(clGetDeviceIDs) X(clGetDeviceInfo)                  \
    X(clCreateSubDevices) X(clRetainDevice) X(clReleaseDevice) X(clCreateContext)                  \
    X(clCreateContextFromType) X(clRetainContext) X(clReleaseContext) X(clGetContextInfo)          \
    X(clCreateCommandQueue) X(clRetainCommandQueue) X(clReleaseCommandQueue)                       \
    X(clGetCommandQueueInfo) X(clSetCommandQueueProperty) X(clCreateBuffer) X(clCreateSubBuffer)   \
    X(clCreateImage) X(clCreateImage2D) X(clCreateImage3D) X(clRetainMemObject)                    \
    X(clReleaseMemObject) X(clGetSupportedImageFormats) X(clGetMemObjectInfo) X(clGetImageInfo)    \
    X(clSetMemObjectDestructorCallback) X(clCreateSampler) X(clRetainSampler)                      \
    X(clReleaseSampler) X(clGetSamplerInfo) X(clCreateProgramWithSource)                           \
    X(clCreateProgramWithBinary) X(clCreateProgramWithBuiltInKernels) X(clRetainProgram)           \
    X(clReleaseProgram) X(clBuildProgram) X(clCompileProgram) X(clLinkProgram)                     \
    X(clUnloadCompiler) X(clUnloadPlatformCompiler) X(clGetProgramInfo) X(clGetProgramBuildInfo)   \
    X(clCreateKernel) X(clCreateKernelsInProgram) X(clRetainKernel) X(clReleaseKernel)             \
    X(clSetKernelArg) X(clGetKernelInfo) X(clGetKernelArgInfo) X(clGetKernelWorkGroupInfo)         \
    X(clWaitForEvents) X(clGetEventInfo) X(clCreateUserEvent) X(clRetainEvent) X(clReleaseEvent)   \
    X(clSetUserEventStatus) X(clSetEventCallback) X(clGetEventProfilingInfo) X(clFlush)            \
    X(clFinish) X(clEnqueueReadBuffer) X(clEnqueueReadBufferRect) X(clEnqueueWriteBuffer)          \
    X(clEnqueueWriteBufferRect) X(clEnqueueFillBuffer) X(clEnqueueCopyBuffer)                      \
    X(clEnqueueCopyBufferRect) X(clEnqueueReadImage) X(clEnqueueWriteImage)                        \
    X(clEnqueueFillImage) X(clEnqueueCopyImage) X(clEnqueueCopyImageToBuffer)                      \
    X(clEnqueueCopyBufferToImage) X(clEnqueueMapBuffer) X(clEnqueueMapImage)                       \
    X(clEnqueueUnmapMemObject) X(clEnqueueMigrateMemObjects) X(clEnqueueNDRangeKernel)             \
    X(clEnqueueTask) X(clEnqueueNativeKernel) X(clEnqueueMarker) X(clEnqueueMarkerWithWaitList)    \
    X(clEnqueueWaitForEvents) X(clEnqueueBarrier) X(clEnqueueBarrierWithWaitList)                  \
    X(clGetExtensionFunctionAddress) X(clGetExtensionFunctionAddressForPlatform)                   \
    X(clCreateFromGLBuffer) X(clCreateFromGLTexture) X(clCreateFromGLTexture2D)                    \
    X(clCreateFromGLTexture3D) X(clCreateFromGLRenderbuffer) X(clGetGLObjectInfo)                  \
    X(clGetGLTextureInfo) X(clEnqueueAcquireGLObjects) X(clEnqueueReleaseGLObjects)
// clang-format on
