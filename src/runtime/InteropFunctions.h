// The interop function table: the same pointers for sharing with OpenGL and with Direct3D 11.
// Internal.
//
// Null until the runtime object is constructed, and read-only afterwards. The create function and
// the Direct3D 11 device query are set when the extension is chosen, the acquire and release
// functions when the context has been created.
#pragma once

#include "loader/OpenCLLoader.h"

// Creates a memory object of a renderer's buffer. With OpenGL, `resource` is the address of a
// 32-bit buffer name; with Direct3D 11, an ID3D11Buffer.
using CreateSharedCLBuffer = cl_mem(CL_API_CALL*)(cl_context context, cl_mem_flags flags,
                                                  void* resource, cl_int* error);
// Acquires or releases memory objects.
using EnqueueSharedObjects = cl_int(CL_API_CALL*)(cl_command_queue queue, cl_uint numObjects,
                                                  const cl_mem* objects, cl_uint numEvents,
                                                  const cl_event* waitList, cl_event* event);

extern D3D11GetDeviceIDs sfGetDeviceIDsFromD3D11;
extern CreateSharedCLBuffer sfCreateSharedCLBuffer;
extern EnqueueSharedObjects sfPendingEnqueueAcquireSharedObjects;
extern EnqueueSharedObjects sfPendingEnqueueReleaseSharedObjects;
extern EnqueueSharedObjects sfEnqueueAcquireSharedObjects;
extern EnqueueSharedObjects sfEnqueueReleaseSharedObjects;
