// The machine that a test describes to the scripted OpenCL runtime, and which calls fail in it:
// plain data, no behaviour.
#pragma once

#include <cstddef>
#include <cstdint>
#include <map>
#include <optional>
#include <set>
#include <string>
#include <vector>

#include <CL/cl.h>

namespace scripted {

struct DeviceScript {
    cl_device_type type = CL_DEVICE_TYPE_GPU;
    std::string name = "Scripted GPU";
    std::string driverVersion = "1.0";
    bool available = true;
    cl_device_fp_config doublePrecision = CL_FP_FMA; // 0: none
    cl_uint computeUnits = 8;
    std::size_t workGroupSize = 64; // of every kernel
};

struct PlatformScript {
    std::string vendor = "Intel(R) Corporation";
    std::string name = "Scripted platform";
    std::string version = "OpenCL 1.2 scripted";
    std::string extensions = "cl_khr_gl_sharing cl_khr_gl_event";
    std::vector<DeviceScript> devices{1};
};

// The effect of looking up an extension entry point.
enum class LookUp { kAnswers, kThrowsStandardException, kThrowsNumber };

struct Machine {
    std::vector<PlatformScript> platforms{1};

    // Devices are numbered from 0 across all platforms.
    std::vector<std::size_t> glDevices{0};         // share with the OpenGL context
    std::optional<std::size_t> currentGLDevice{0}; // drives the OpenGL context
    std::vector<std::size_t> d3dDevices{0};        // belong to the Direct3D 11 device
    std::set<std::string> missing;                 // extension entry points left out
    std::set<cl_uint> emptyAnswers;                // queries answered with size 0, unwritten
    // Bytes of the renderer's buffers, by name or address; 1 MiB without an entry.
    std::map<std::uintptr_t, std::size_t> sharedBytes;
    LookUp lookUp = LookUp::kAnswers;
    std::string buildLog = "line 1: 100%s wrong"; // of a program that does not build
};

// A planned failure of one function. A failing retain or release still counts; any other failing
// call has no effect, except a create function, a mapping or a build `withHandle`.
struct Fault {
    std::string function;                // "*": every function, including OpenGL's
    cl_int status = CL_OUT_OF_RESOURCES; // CL_SUCCESS: returns no object, but reports success
    unsigned nth = 1;                    // the call that fails, counted from the planning
    bool onwards = false;                // all later calls fail, too
    bool withHandle = false; // returns an object or an address, or builds, despite the status
};

} // namespace scripted
