// Describes the scenario named by INFO_SCENARIO to the scripted runtime when it is loaded.
#include "fake/FakeRuntime.h"

#include <cstdlib>
#include <map>
#include <string_view>

namespace {

using scripted::World;

struct Scenario {
    void (*describe)(World& world);
    const char* failing = nullptr; // the function that fails
    cl_int status = CL_SUCCESS;
    unsigned nth = 1; // the first call that fails; all later ones fail as well
};

void nothing(World&) {}

void makeNVIDIA(World& world, const char* driver)
{
    world.platforms[0].vendor = "NVIDIA Corporation";
    world.platforms[0].devices[0].driverVersion = driver;
}

const std::map<std::string_view, Scenario> kScenarios = {
    {"ordinary", {nothing}},
    {"no-platform", {[](World& world) { world.platforms.clear(); }}},
    {"two-platforms", {[](World& world) { world.platforms.resize(2); }}},
    {"cpu", {[](World& world) { world.platforms[0].devices[0].type = CL_DEVICE_TYPE_CPU; }}},
    {"refused-driver", {[](World& world) { makeNVIDIA(world, "365.10"); }}},
    {"old-driver", {[](World& world) { makeNVIDIA(world, "384.00"); }}},
    {"no-acquire", {[](World& world) { world.missing.insert("clEnqueueAcquireGLObjects"); }}},
    {"unavailable", {[](World& world) { world.platforms[0].devices[0].available = false; }}},
    {"no-double", {[](World& world) { world.platforms[0].devices[0].doublePrecision = 0; }}},
    {"no-gl-event", {[](World& world) { world.platforms[0].extensions = "cl_khr_gl_sharing"; }}},
    {"context-unknown", {nothing, "clGetGLContextInfoKHR", -1000}},
    {"no-device-type", {nothing, "clGetDeviceInfo", CL_INVALID_VALUE, 3}},
    {"no-float-config", {nothing, "clGetDeviceInfo", CL_INVALID_VALUE, 5}},
    {"no-driver-version",
     {[](World& world) { makeNVIDIA(world, "400.00"); }, "clGetDeviceInfo", CL_INVALID_VALUE, 2}},
    {"no-context", {[](World& world) { makeNVIDIA(world, "400.00"); }, "clCreateContext", -9999}},
    {"no-queue", {nothing, "clCreateCommandQueue", CL_INVALID_QUEUE_PROPERTIES}},
    {"no-buffer", {nothing, "clCreateFromGLBuffer", CL_INVALID_GL_OBJECT}},
};

const bool kDescribed = [] {
    const char* name = std::getenv("INFO_SCENARIO");
    const Scenario& scenario = kScenarios.at(name ? name : ""); // throws for an unknown name
    World world;
    scenario.describe(world);
    scripted::runtime().describe(world);
    if (scenario.failing) {
        scripted::runtime().plan({.function = scenario.failing,
                                  .status = scenario.status,
                                  .nth = scenario.nth,
                                  .onwards = true});
    }
    return true;
}();

} // namespace
