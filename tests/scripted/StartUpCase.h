// One start-up of the library: the machine, and the expected output, results and remaining objects.
#pragma once

#include "ScriptedTest.h"

#include <functional>
#include <optional>
#include <utility>

namespace scripted {

inline const std::string kForceThreading = "VyraGetEnv(VYRA_OPENCL_FORCE_THREADING)";

struct StartUp {
    Machine machine;
    StartArguments arguments;
    std::vector<std::pair<const char*, const char*>> environment;
    std::vector<Fault> faults;
    std::function<void()> prepareHost; // may be empty

    std::optional<std::string> error; // on standard error; unset: that of a successful start-up
    std::string output;               // on standard output
    Lines warnings;
    Lines misuse;
    bool valid = true;
    OpenCLProvider provider = kIntelProvider;
    int minimumBufferSize = 500;
    bool asyncReadback = true;
    bool doublePrecision = true;
    std::string device = "device#1";
    std::pair<int, int> modes{1, 1}; // graphics to OpenCL, OpenCL to graphics
    bool threadedSharing = true;
    Lines lookUps{kForceThreading, "asInt32(VYRA_OPENCL_FORCE_FINISH, 0)",
                  "asInt32(VYRA_GRAPHICSTOOPENCL_SYNC_MODE, 0)",
                  "asInt32(VYRA_OPENCLTOGRAPHICS_SYNC_MODE, 0)"}; // of variables, by the host
    unsigned computeUnits = 8; // 0: start-up stopped before its last call of the host
    std::string table{"create pending final"}; // the filled entries of the interop function table
    Lines left{"context#1 x1", "queue#1 x1", "queue#2 x1"};

    PlatformScript& platform() { return machine.platforms[0]; }
    DeviceScript& firstDevice() { return machine.platforms[0].devices[0]; }
    // The platform has another vendor.
    void onVendor(const char* vendor, OpenCLProvider expectedProvider, unsigned id);
    void onNVIDIA(const char* driver);
    // The renderer is Direct3D 11; the platform has these extensions.
    void onDirect3D(const char* extensions);

    // The text printed up to the choice of the platform, and the whole text.
    std::string platformText() const;
    std::string wholeText() const;

    // Start-up stops, having printed `text` last, before it has chosen a platform, a device, or
    // after it has made the context. Later steps' answers keep their initial values.
    void stopsBeforePlatform(const std::string& text);
    void stopsBeforeDevice(const std::string& text);
    void stopsWithContext(const std::string& text);
    // The device has no double precision: start-up reads the variable that requires it.
    void withoutDoublePrecision();
    // Makes the n-th call of `function` fail with CL_OUT_OF_RESOURCES, which is reported.
    void fails(const std::string& function, unsigned nth = 1);
};

struct StartUpRow : Named {
    std::function<void(StartUp&)> set;
};

// A table of start-ups.
class StartUpRows : public ScriptedTest, public ::testing::WithParamInterface<StartUpRow> {};

// Returns the listing of all platforms, with the line of the chosen one.
std::string listing(const Machine& machine, std::size_t taken);

inline constexpr std::size_t kNoPlatform = 64; // more than any test has
inline const std::string kAttempt = "OpenCL evaluator is attempting to initialize OpenCL.\n";
inline const std::string kIntel = "Intel(R) Corporation";
inline const std::string kNamed = "Choosing OpenCL Device Scripted GPU.  ";
inline const std::string kReported = kNamed + "Device Type: GPU  Device is available.\n";
inline const std::string kOutOfResources = "OpenCL error: CL_OUT_OF_RESOURCES\n";

inline const auto kName = ::testing::PrintToStringParamName();

} // namespace scripted
