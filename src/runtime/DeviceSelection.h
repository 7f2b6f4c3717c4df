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

// The GPU device that shares with the OpenGL context of `properties`: its current device where that
// is a GPU of the list, else the first GPU of the list. False, and said, when there is none or a
// query fails.
bool chooseDeviceForOpenGL(const ContextProperties& properties, cl_device_id& device);

// The device that prefers to share with `d3dDevice`, through the function that the interop table
// holds. False when there is none, or, reported, when the query fails.
bool chooseDeviceForD3D11(void* d3dDevice, cl_platform_id platform, cl_device_id& device);

// Prints name, type and availability of `device`. False, and said, when it is not available or a
// query fails.
bool reportDevice(cl_device_id device);
