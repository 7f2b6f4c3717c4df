// What vyra-opencl-info found, as plain data: the rules that explain it, and the tests of those
// rules, need no OpenCL and no display.
#pragma once

#include "runtime/OpenCLProvider.h"
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
    std::string windowSystem;                // as Qt names it, such as "xcb"
    std::optional<unsigned> adapterVendorId; // PCI vendor id that follows from the texts
    bool syncObjects = false;                // GL_ARB_sync, on every thread
};

// The OpenCL loader library.
struct Loader {
    bool loaded = false;
    std::string file;                       // where the library was found
    std::string problem;                    // the system's words when it cannot be opened
    std::vector<std::string> missingLayers; // of OPENCL_LAYERS: no such file
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
    bool sharesWithRenderer = false; // is in the runtime's list for the OpenGL context
    bool drivesRenderer = false;     // is the OpenGL context's current device
    bool chosen = false;
};

struct Platform {
    std::string vendor;
    std::string name;
    std::string version;
    std::string extensions;
    int status = CL_SUCCESS;        // of the first query that failed
    bool chosen = false;            // start-up took it
    int sharingStatus = CL_SUCCESS; // of the query for the devices of the OpenGL context
    std::vector<Device> devices;
};

// What the library's start-up said and left behind.
struct StartUp {
    bool attempted = false;
    unsigned vendorId = 0;             // what it was told
    std::string output;                // standard output and standard error
    std::vector<std::string> warnings; // failing OpenCL calls, as the warning sink got them
    bool valid = false;
    bool hasDevice = false;
    bool hasContext = false;
    bool hasQueue = false;
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

// The environment, and what the library reads in it.
struct Environment {
    std::vector<Variable> variables; // whatever begins with VYRA_, and what steers the loader
    bool platformFromOption = false; // --platform set VYRA_OPENCL_PLATFORM
    bool platformWasChosen = false;  // as the only one that shares with an unknown renderer
    SyncModeVariables syncModes;
    std::optional<int> ignoreDriverVersion;
    int doubleDemanded = 0;

    // The value of a variable, or null when it is not set.
    const std::string* find(const std::string& name) const;
};

// Medians of several evaluations, in milliseconds.
struct SelfTestTimes {
    double kernelBuild = 0; // once
    double firstEvaluation = 0;
    double evaluation = 0; // until OpenGL has read the result, not held up in between
    double acquire = 0;
    double kernel = 0;
    double release = 0;
    double read = 0; // OpenGL reads the result
};

struct SelfTest {
    bool passed = false;
    std::string problem;     // what went wrong
    int status = CL_SUCCESS; // of the OpenCL call that failed
    std::size_t vertices = 0;
    int evaluations = 0; // checked
    SelfTestTimes times;
    std::vector<std::string> warnings; // while it ran
};

struct Facts {
    Environment environment;
    Renderer renderer;
    Loader loader;
    int platformStatus = CL_SUCCESS; // of the query for the platforms
    std::vector<Platform> platforms;
    std::optional<std::string> wantedVendor; // of the platform that start-up looks for
    StartUp startUp;
    std::optional<SelfTest> selfTest; // where OpenCL is on
};

// What start-up chose; null where it got no further.
const Platform* chosenPlatform(const Facts& facts);
const Device* chosenDevice(const Facts& facts);

// Whether the extension string has `name` in it: a plain search, as the library makes it.
bool listsExtension(const std::string& extensions, const char* name);

} // namespace info
