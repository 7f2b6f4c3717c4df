// The OpenCL platforms of this machine, and the choice of one for a renderer: for applications
// that run on any machine, also without a GPU.
#pragma once

#include "host/HostExport.h"

#include <optional>
#include <string>
#include <string_view>
#include <vector>

class QOpenGLContext;

struct OpenCLPlatform {
    std::string vendor;
    std::string name;
    bool sharesWithOpenGL = false; // lists cl_khr_gl_sharing
    unsigned deviceCount = 0;      // of all types
};

// Returns all platforms in the order of the OpenCL loader. Empty without an OpenCL library.
[[nodiscard]] VYRA_HOST_API std::vector<OpenCLPlatform> openCLPlatforms();

// Returns the files that the variable OPENCL_LAYERS names and that do not exist. The OpenCL loader
// ignores them silently.
[[nodiscard]] VYRA_HOST_API std::vector<std::string> missingOpenCLLayers();

// Returns the PCI vendor id of the adapter that has these GL_VENDOR and GL_RENDERER texts. Empty
// for a software renderer and for a vendor whose OpenCL the library does not choose by id.
[[nodiscard]] VYRA_HOST_API std::optional<unsigned> adapterVendorId(std::string_view glVendor,
                                                                    std::string_view glRenderer);

// Returns the vendor id to pass to TopenCLInfo::initialize for the renderer of this context, which
// is current: the PCI id of its adapter, or 0 for a software renderer and an unknown adapter.
//
// With the id 0 the library needs the variable VYRA_OPENCL_PLATFORM. If it is not set, this
// function sets it to the vendor of the platforms that share buffers with OpenGL, if they have one
// vendor. It must not run while another thread reads the environment.
VYRA_HOST_API unsigned chooseOpenCLPlatform(QOpenGLContext& context);
