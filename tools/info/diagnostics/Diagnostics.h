// The diagnostics that vyra-opencl-info collects, as plain data. The rules that explain them, and
// the tests of those rules, need neither OpenCL nor a display.
#pragma once

#include "runtime/OpenCLProvider.h"
#include "runtime/StartUpStep.h"
#include "runtime/SyncModes.h"
#include "runtime/TopenCLInfo.h"

#include <cstddef>
#include <optional>
#include <string>
#include <vector>

#include <CL/cl.h>

namespace info {

// The OpenGL side.
struct Renderer {
    bool usable = false;
    std::string problem; // why it is not usable
    std::string vendor;
    std::string renderer;
    std::string version;
    std::string windowSystem;                // Qt's name for it, such as "xcb"
    std::optional<unsigned> adapterVendorId; // PCI vendor id, derived from the texts
    bool syncObjects = false;                // GL_ARB_sync, usable on every thread
};

// The OpenCL loader library.
struct Loader {
    bool loaded = false;
    std::string file;                       // path of the library
    std::string problem;                    // the system's message if it cannot be opened
    std::vector<std::string> missingLayers; // entries of OPENCL_LAYERS that are not files
    std::vector<std::string> missingCore;
    std::vector<std::string> missingSharing;
};

struct Device {
    std::string name;
    std::string vendor;
    std::string version;
    std::string driverVersion;
    std::string extensions;
    cl_device_type type = 0;
    std::optional<unsigned> vendorId; // PCI vendor id, for most devices
    bool available = false;
    bool doublePrecision = false;
    unsigned computeUnits = 0;
    bool sharesWithRenderer = false; // in the runtime's list for the OpenGL context
    bool drivesRenderer = false;     // the current device of the OpenGL context
    bool chosen = false;             // by start-up
};

struct Platform {
    std::string vendor;
    std::string name;
    std::string version;
    std::string extensions;
    int status = CL_SUCCESS;        // of the first query that failed
    bool chosen = false;            // by start-up
    int sharingStatus = CL_SUCCESS; // of the query for the devices of the OpenGL context
    std::vector<Device> devices;
};

// A warning of the library: a failing OpenCL call, or a build log.
struct Warning {
    std::string text;
    int status = CL_SUCCESS;                     // of the call; CL_SUCCESS for a build log
    StartUpStep step = StartUpStep::kNotStarted; // the last step that start-up had begun
};

// The output and the result of the library's start-up.
struct StartUp {
    bool attempted = false;
    unsigned vendorId = 0; // the argument of TopenCLInfo::initialize
    std::string output;    // standard output and standard error
    std::vector<Warning> warnings;
    StartUpStep lastStep = StartUpStep::kNotStarted; // the step that stopped it, unless valid
    bool valid = false;
    OpenCLProvider provider = kUnknownProvider;
    TopenCLInfo::GraphicsToCLSyncMode graphicsToCL = TopenCLInfo::kGraphicsToCLFinish;
    TopenCLInfo::CLToGraphicsSyncMode clToGraphics = TopenCLInfo::kCLToGraphicsFinish;
    bool asyncReadback = false;
    bool doublePrecision = false;
    bool threadedSharing = false;
    int minimumVertices = 0;
};

struct Variable {
    std::string name;
    std::string value;
};

// The environment, and the values that the library reads from it.
struct Environment {
    std::vector<Variable> variables; // of the library, of glshare and of the OpenCL loader
    bool platformFromOption = false; // --platform set VYRA_OPENCL_PLATFORM
    bool platformWasChosen = false;  // the only one that shares with a renderer of unknown vendor
    SyncModeVariables syncModes;
    std::optional<int> ignoreDriverVersion;
    int requireDoublePrecision = 0;

    // Returns the value of a variable. Null if it is not set.
    const std::string* find(const std::string& name) const;
};

// In milliseconds; medians of several evaluations, except for the first two.
struct SelfTestTimes {
    double kernelBuild = 0;
    double firstEvaluation = 0;
    double evaluation = 0; // until OpenGL has read the result, without waits between the stages
    double acquire = 0;
    double kernel = 0;
    double release = 0;
    double read = 0; // OpenGL reads the result
};

struct SelfTest {
    bool passed = false;
    std::string problem;     // the first error
    int status = CL_SUCCESS; // of the OpenCL call that failed
    std::size_t vertices = 0;
    int evaluations = 0; // the number of evaluations whose result was checked
    SelfTestTimes times;
    std::vector<Warning> warnings;
};

struct Diagnostics {
    Environment environment;
    Renderer renderer;
    Loader loader;
    int platformStatus = CL_SUCCESS; // of the query for the platforms
    std::vector<Platform> platforms;
    std::optional<std::string> wantedVendor; // the vendor whose platform start-up looks for
    StartUp startUp;
    std::optional<SelfTest> selfTest; // empty if OpenCL is off
};

// Return the platform and the device that start-up chose. Null if it stopped before that.
const Platform* chosenPlatform(const Diagnostics& diagnostics);
const Device* chosenDevice(const Diagnostics& diagnostics);

// Returns whether the extension string contains `name`: a plain search, as in the library.
[[nodiscard]] bool listsExtension(const std::string& extensions, const char* name);

} // namespace info
