// Describes the scenario named by INFO_SCENARIO to the scripted runtime when it is loaded.
#include "fake/FakeRuntime.h"

#include <cstdlib>
#include <map>
#include <string_view>

namespace {

using scripted::Machine;

struct Scenario {
    void (*describe)(Machine& machine);
    const char* failing = nullptr; // the function that fails
    cl_int status = CL_SUCCESS;
    unsigned nth = 1; // the first call that fails; all later ones fail as well
};

void nothing(Machine&) {}

void makeNVIDIA(Machine& machine, const char* driver)
{
    machine.platforms[0].vendor = "NVIDIA Corporation";
    machine.platforms[0].devices[0].driverVersion = driver;
}

const std::map<std::string_view, Scenario> kScenarios = {
    {"ordinary", {nothing}},
    {"no-platform", {[](Machine& machine) { machine.platforms.clear(); }}},
    {"two-platforms", {[](Machine& machine) { machine.platforms.resize(2); }}},
    {"cpu", {[](Machine& machine) { machine.platforms[0].devices[0].type = CL_DEVICE_TYPE_CPU; }}},
    {"refused-driver", {[](Machine& machine) { makeNVIDIA(machine, "365.10"); }}},
    {"old-driver", {[](Machine& machine) { makeNVIDIA(machine, "384.00"); }}},
    {"no-acquire", {[](Machine& machine) { machine.missing.insert("clEnqueueAcquireGLObjects"); }}},
    {"unavailable", {[](Machine& machine) { machine.platforms[0].devices[0].available = false; }}},
    {"no-double", {[](Machine& machine) { machine.platforms[0].devices[0].doublePrecision = 0; }}},
    {"no-gl-event",
     {[](Machine& machine) { machine.platforms[0].extensions = "cl_khr_gl_sharing"; }}},
    {"context-unknown", {nothing, "clGetGLContextInfoKHR", -1000}},
    {"no-device-type", {nothing, "clGetDeviceInfo", CL_INVALID_VALUE, 3}},
    {"no-float-config", {nothing, "clGetDeviceInfo", CL_INVALID_VALUE, 5}},
    {"no-driver-version",
     {[](Machine& machine) { makeNVIDIA(machine, "400.00"); }, "clGetDeviceInfo", CL_INVALID_VALUE,
      2}},
    {"no-context",
     {[](Machine& machine) { makeNVIDIA(machine, "400.00"); }, "clCreateContext", -9999}},
    {"no-queue", {nothing, "clCreateCommandQueue", CL_INVALID_QUEUE_PROPERTIES}},
    {"no-buffer", {nothing, "clCreateFromGLBuffer", CL_INVALID_GL_OBJECT}},
};

const bool kDescribed = [] {
    const char* name = std::getenv("INFO_SCENARIO");
    const Scenario& scenario = kScenarios.at(name ? name : ""); // throws for an unknown name
    Machine machine;
    scenario.describe(machine);
    scripted::runtime().describe(machine);
    if (scenario.failing) {
        scripted::runtime().plan({.function = scenario.failing,
                                  .status = scenario.status,
                                  .nth = scenario.nth,
                                  .onwards = true});
    }
    return true;
}();

} // namespace
