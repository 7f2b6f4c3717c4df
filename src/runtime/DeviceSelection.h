// The choice of the device. Internal.
#pragma once

#include <array>

#include <CL/cl.h>

// The property list of a context that shares with the renderer. Zero-initialised, so that it ends
// with 0.
using ContextProperties = std::array<cl_context_properties, 7>;

// Return the property list for sharing. For OpenGL, the host provides the display of `window`. For
// Direct3D 11, `d3dDevice` is an ID3D11Device.
ContextProperties openGLContextProperties(void* window, void* glContext, cl_platform_id platform);
ContextProperties d3d11ContextProperties(void* d3dDevice, cl_platform_id platform);

// Chooses the device for the renderer. With OpenGL: the current device of the context in
// `properties` if it is a GPU and shares with the context, else the first GPU that shares; none is
// reported on standard error. With Direct3D 11: the first device that the runtime prefers for the
// device `graphicsContext`. Returns false if there is none, or if a query fails, which is reported.
[[nodiscard]] bool chooseDevice(bool usingDX, void* graphicsContext, cl_platform_id platform,
                                const ContextProperties& properties, cl_device_id& device);

// Prints name, type and availability of `device` to standard error. Returns false if the device is
// not available or a query fails; both are reported.
[[nodiscard]] bool reportDevice(cl_device_id device);
