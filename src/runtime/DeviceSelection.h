// Which device the library runs on. Internal.
#pragma once

#include <array>

#include <CL/cl.h>

// The property list of a context that shares with the renderer. It begins as zeros, so it always
// ends with 0.
using ContextProperties = std::array<cl_context_properties, 7>;

// For OpenGL: asks the host for the display of `window`. For Direct3D 11: `d3dDevice` is an
// ID3D11Device.
ContextProperties openGLContextProperties(void* window, void* glContext, cl_platform_id platform);
ContextProperties d3d11ContextProperties(void* d3dDevice, cl_platform_id platform);

// The device for the renderer. With OpenGL, the one that shares with the context of `properties`:
// its current device where that is a GPU of the list, else the first GPU of the list; it is said
// when there is none. With Direct3D 11, the one that prefers to share with the device
// `graphicsContext`. False when there is none, or, reported, when a query fails.
bool chooseDevice(bool usingDX, void* graphicsContext, cl_platform_id platform,
                  const ContextProperties& properties, cl_device_id& device);

// Prints name, type and availability of `device`. False when it is not available, which is said,
// or, reported, when a query fails.
bool reportDevice(cl_device_id device);
