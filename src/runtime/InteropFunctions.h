// The interop function table: sharing with OpenGL or with Direct3D 11 behind the same pointers.
// Internal.
//
// All null at load. Filled once, while the runtime object is constructed, and only read afterwards:
// the create function and the Direct3D 11 device query as soon as the extension is chosen, the
// acquire and release functions once the context stands.
#pragma once

#include "loader/OpenCLLoader.h"

// As D3D11CreateBuffer. With OpenGL, `resource` is the address of a 32-bit buffer name.
using CreateSharedCLBuffer = D3D11CreateBuffer;
// The signature of all acquire and release functions.
using EnqueueSharedObjects = D3D11EnqueueObjects;

extern D3D11GetDeviceIDs sfGetDeviceIDsFromD3D11;
extern CreateSharedCLBuffer sfCreateSharedCLBuffer;
extern EnqueueSharedObjects sfPendingEnqueueAcquireSharedObjects;
extern EnqueueSharedObjects sfPendingEnqueueReleaseSharedObjects;
extern EnqueueSharedObjects sfEnqueueAcquireSharedObjects;
extern EnqueueSharedObjects sfEnqueueReleaseSharedObjects;
