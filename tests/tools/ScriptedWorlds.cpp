// Gives the scripted runtime its world when it is loaded (INFO_WORLD names it), and kernels that
// run without doing anything.
#include "FakeRuntime.h"

#include <cstdlib>
#include <string_view>

namespace {

using scripted::World;

struct NamedWorld {
    std::string_view name;
    void (*change)(World& world);
    const char* failing = nullptr; // the function that fails, always
    cl_int status = CL_SUCCESS;
};

void changeNothing(World&) {}

void makeNVIDIA(World& world, const char* driver)
{
    world.platforms[0].vendor = "NVIDIA Corporation";
    world.platforms[0].devices[0].driverVersion = driver;
}

constexpr NamedWorld kWorlds[] = {
    {"ordinary", changeNothing},
    {"no-platform", [](World& world) { world.platforms.clear(); }},
    {"two-platforms", [](World& world) { world.platforms.resize(2); }},
    {"cpu", [](World& world) { world.platforms[0].devices[0].type = CL_DEVICE_TYPE_CPU; }},
    {"refused-driver", [](World& world) { makeNVIDIA(world, "365.10"); }},
    {"old-driver", [](World& world) { makeNVIDIA(world, "384.00"); }},
    {"no-acquire", [](World& world) { world.missing.insert("clEnqueueAcquireGLObjects"); }},
    {"unavailable", [](World& world) { world.platforms[0].devices[0].available = false; }},
    {"no-double", [](World& world) { world.platforms[0].devices[0].doublePrecision = 0; }},
    {"no-gl-event", [](World& world) { world.platforms[0].extensions = "cl_khr_gl_sharing"; }},
    {"context-unknown", changeNothing, "clGetGLContextInfoKHR", -1000},
    {"no-context", changeNothing, "clCreateContext", -9999},
    {"no-queue", changeNothing, "clCreateCommandQueue", CL_INVALID_QUEUE_PROPERTIES},
    {"no-buffer", changeNothing, "clCreateFromGLBuffer", CL_INVALID_GL_OBJECT},
};

const bool kDescribed = [] {
    const char* wanted = std::getenv("INFO_WORLD");
    for (const NamedWorld& named : kWorlds) {
        if (!wanted || named.name != wanted)
            continue;
        World world;
        named.change(world);
        scripted::runtime().describe(world);
        if (named.failing)
            scripted::runtime().plan(
                {.function = named.failing, .status = named.status, .onwards = true});
        return true;
    }
    std::abort(); // a test that names no world would test nothing
}();

} // namespace

extern "C" cl_int clSetKernelArg(cl_kernel, cl_uint, std::size_t, const void*)
{
    return CL_SUCCESS;
}

// Done as soon as what it waits for, so it answers with that event.
extern "C" cl_int clEnqueueNDRangeKernel(cl_command_queue, cl_kernel, cl_uint, const std::size_t*,
                                         const std::size_t*, const std::size_t*, cl_uint,
                                         const cl_event* waitList, cl_event* event)
{
    *event = waitList[0];
    return clRetainEvent(waitList[0]);
}
