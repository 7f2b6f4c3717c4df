// The rules of vyra-opencl-info on hand-made diagnostics.
#include "runtime/PlatformSelection.h"
#include "tools/info/rules/Decisions.h"
#include "tools/info/rules/StartUpFailure.h"
#include "tools/info/rules/SyncDecisions.h"
#include "tools/info/rules/Variables.h"
#include "tools/info/rules/Verdicts.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using info::Diagnostics;
using info::Effect;
using testing::HasSubstr;

// Returns a platform of Intel, or of NVIDIA with the given driver, with one GPU that drives the
// renderer. Start-up has succeeded in the automatic modes.
Diagnostics workingDiagnostics(const char* nvidiaDriver = nullptr)
{
    Diagnostics diagnostics;
    diagnostics.renderer.usable = diagnostics.renderer.syncObjects = true;
    diagnostics.renderer.renderer = "A vendor's GPU";
    diagnostics.renderer.adapterVendorId = 0x8086;
    info::Platform& platform = diagnostics.platforms.emplace_back();
    platform.vendor = nvidiaDriver ? kNVIDIAVendor : kIntelVendor;
    platform.extensions = "cl_khr_gl_sharing cl_khr_gl_event";
    info::Device& device = platform.devices.emplace_back();
    device.driverVersion = nvidiaDriver ? nvidiaDriver : "1.0";
    device.type = CL_DEVICE_TYPE_GPU;
    device.vendorId = 0x8086;
    device.sharesWithRenderer = device.drivesRenderer = true;
    device.chosen = platform.chosen = true;

    info::StartUp& startUp = diagnostics.startUp;
    startUp.valid = true;
    startUp.lastStep = StartUpStep::kQueue;
    startUp.vendorId = 0x8086;
    startUp.provider = nvidiaDriver ? kNVIDIAProvider : kIntelProvider;
    startUp.graphicsToCL = TopenCLInfo::kGraphicsToCLImplicit;
    startUp.clToGraphics = TopenCLInfo::kCLToGraphicsImplicit;
    startUp.doublePrecision = true;
    return diagnostics;
}

void stopAt(Diagnostics& diagnostics, StartUpStep step)
{
    diagnostics.startUp.valid = false;
    diagnostics.startUp.lastStep = step;
}

TEST(StartUpFailure, MissingPlatformNamesVendorOfRendererAndVendorsOfPlatforms)
{
    Diagnostics diagnostics = workingDiagnostics("400.00");
    diagnostics.wantedVendor = kIntelVendor;
    diagnostics.platforms[0].chosen = false;
    stopAt(diagnostics, StartUpStep::kPlatform);
    diagnostics.startUp.warnings = {{"earlier", CL_INVALID_CONTEXT, StartUpStep::kLoader},
                                    {"a build log", CL_SUCCESS, StartUpStep::kPlatform},
                                    {"the reason", CL_INVALID_VALUE, StartUpStep::kPlatform},
                                    {"a consequence", CL_OUT_OF_RESOURCES, StartUpStep::kPlatform}};
    const auto failure = info::findStartUpFailure(diagnostics);
    ASSERT_TRUE(failure);
    EXPECT_EQ(failure->step, StartUpStep::kPlatform);
    EXPECT_EQ(failure->status, CL_INVALID_VALUE) << "the first call that failed in the step";
    EXPECT_THAT(failure->reason, testing::AllOf(HasSubstr("'Intel(R) Corporation'"),
                                                HasSubstr("'NVIDIA Corporation'"),
                                                HasSubstr("0x8086"), HasSubstr("A vendor's GPU")));
    EXPECT_THAT(failure->remedy, HasSubstr("two GPUs"));
}

TEST(Verdicts, RejectedDeviceReportsFirstFailedTest)
{
    Diagnostics diagnostics = workingDiagnostics();
    info::Platform& platform = diagnostics.platforms[0];
    platform.devices.resize(2);
    info::Device& other = platform.devices[1];
    const auto rejection = [&] { return info::deviceRejection(diagnostics, platform, other); };
    EXPECT_EQ(info::deviceRejection(diagnostics, platform, platform.devices[0]), "");
    EXPECT_THAT(rejection(), HasSubstr("does not share"));
    other.sharesWithRenderer = true;
    other.type = CL_DEVICE_TYPE_GPU | CL_DEVICE_TYPE_DEFAULT;
    EXPECT_THAT(rejection(), HasSubstr("GPU and default device"));
    other.type = CL_DEVICE_TYPE_GPU;
    EXPECT_THAT(rejection(), HasSubstr("comes first"));
    platform.sharingStatus = -1000;
    EXPECT_THAT(rejection(), HasSubstr("(-1000)"));
    platform.chosen = false;
    EXPECT_THAT(rejection(), HasSubstr("platform"));
}

TEST(Verdicts, DeviceThatDoesNotDriveRendererIsReported)
{
    Diagnostics diagnostics = workingDiagnostics();
    EXPECT_EQ(info::rendererDeviceMismatch(diagnostics), "");
    diagnostics.platforms[0].devices[0].drivesRenderer = false;
    EXPECT_THAT(info::rendererDeviceMismatch(diagnostics), HasSubstr("does not report it"));
    diagnostics.platforms[0].devices[0].vendorId = 0x10DE;
    EXPECT_THAT(info::rendererDeviceMismatch(diagnostics), HasSubstr("different vendors"));
    diagnostics.renderer.adapterVendorId.reset();
    EXPECT_THAT(info::rendererDeviceMismatch(diagnostics), HasSubstr("software"));
}

TEST(Decisions, SyncModeReportsReasonAndVariable)
{
    constexpr char kEvent[] = "cl_khr_gl_event";
    constexpr auto kImplicit = TopenCLInfo::kGraphicsToCLImplicit;
    constexpr auto kExplicit = TopenCLInfo::kGraphicsToCLExplicit;
    constexpr auto kFinish = TopenCLInfo::kGraphicsToCLFinish;
    const struct {
        const char* extensions;
        bool syncObjects;
        int requested;
        TopenCLInfo::GraphicsToCLSyncMode mode;
        const char* reason;
        bool byVariable;
    } rows[] = {
        {kEvent, true, 0, kImplicit, "lists", false},
        {"", true, 0, kExplicit, "OpenGL has GL_ARB_sync", false},
        {"", false, 0, kFinish, "OpenGL lacks GL_ARB_sync", false},
        {kEvent, true, 3, kFinish, "forces it", true},
        {kEvent, true, 1, kImplicit, "forces it", false},
        {"", true, 1, kImplicit, "wrong pictures", true},
        {"", false, 2, kFinish, "does not support", false},
    };
    for (const auto& row : rows) {
        SCOPED_TRACE(row.reason);
        Diagnostics diagnostics = workingDiagnostics();
        diagnostics.platforms[0].extensions = row.extensions;
        diagnostics.renderer.syncObjects = row.syncObjects;
        diagnostics.environment.syncModes.graphicsToCL = row.requested;
        diagnostics.startUp.graphicsToCL = row.mode;
        const info::Decision decision = info::decideGraphicsToCL(diagnostics);
        EXPECT_THAT(decision.reason, HasSubstr(row.reason));
        EXPECT_EQ(!decision.variable.empty(), row.byVariable);
    }
}

using Change = void (*)(Diagnostics& diagnostics);

TEST(Variables, SetVariableReportsEffectAndExplanation)
{
    constexpr char kFinish[] = "VYRA_OPENCL_FORCE_FINISH";
    constexpr char kFence[] = "VYRA_GRAPHICSTOOPENCL_SYNC_MODE";
    constexpr char kDouble[] = "VYRA_OPENCL_OFF_WITHOUT_DOUBLE_SUPPORT";
    constexpr char kIgnore[] = "VYRA_OPENCL_IGNORE_DRIVER_VERSION";
    constexpr Change stopAtPlatform = [](Diagnostics& diagnostics) {
        stopAt(diagnostics, StartUpStep::kPlatform);
    };
    constexpr Change forceFinish = [](Diagnostics& diagnostics) {
        diagnostics.environment.syncModes.forceFinish = 1;
    };
    constexpr Change requireDouble = [](Diagnostics& diagnostics) {
        diagnostics.environment.requireDoublePrecision = 1;
    };
    constexpr Change ignore0 = [](Diagnostics& diagnostics) {
        diagnostics.environment.ignoreDriverVersion = 0;
    };
    constexpr Change ignore1 = [](Diagnostics& diagnostics) {
        diagnostics.environment.ignoreDriverVersion = 1;
    };
    const struct {
        const char* name;
        const char* value;
        Effect effect;
        const char* explanation; // a part of it
        Change change = [](Diagnostics&) {};
        const char* nvidiaDriver = nullptr; // on NVIDIA's platform, with this driver
    } rows[] = {
        {kFinish, "yes", Effect::kNone, "whole number"},
        {kFinish, "1", Effect::kChanged, "finish calls", forceFinish},
        {kFence, "2", Effect::kNone, "takes precedence", forceFinish},
        {kFence, "4", Effect::kNone, "1 to 3"},
        {kFence, "2", Effect::kNone, "stopped before", stopAtPlatform},
        {kDouble, "yes", Effect::kNone, "whole number"},
        {kDouble, "1", Effect::kNone, "has double precision", requireDouble},
        {kIgnore, "1", Effect::kNone, "not NVIDIA's", ignore1},
        {kIgnore, "0", Effect::kNone, "is the same", ignore0, "400.00"},
        {kIgnore, "0", Effect::kNone, "is the same", ignore0, "384.00"},
        {kIgnore, "1", Effect::kChanged, "implicit synchronisation", ignore1, "384.00"},
        {kIgnore, "0", Effect::kChanged, "refused range", ignore0, "365.10"},
        {kIgnore, "1", Effect::kNone, "cannot be parsed", ignore1, "new"},
        {"VYRA_OPENCL_FORCE_THREADING", "", Effect::kChanged, "batching off"},
        {"VYRA_OPENCL_DEFORMER_MIN_VERTS", "10", Effect::kNone, "stopped before", stopAtPlatform},
        {"VYRA_SOMETHING", "1", Effect::kUnknown, "no variable of this name"},
        {"OPENCL_LAYERS", "x", Effect::kNoted, "selects"},
    };
    for (const auto& row : rows) {
        SCOPED_TRACE(std::string(row.name) + "=" + row.value);
        Diagnostics diagnostics = workingDiagnostics(row.nvidiaDriver);
        row.change(diagnostics);
        diagnostics.environment.variables = {{row.name, row.value}};
        const auto reports = info::explainVariables(diagnostics);
        ASSERT_EQ(reports.size(), 1U);
        EXPECT_EQ(reports[0].effect, row.effect);
        EXPECT_THAT(reports[0].explanation, HasSubstr(row.explanation));
    }
}

TEST(Variables, MisspeltVariableSuggestsNearestName)
{
    const std::pair<const char*, const char*> rows[] = {
        {"VYRA_OPENCL_PLATTFORM", "VYRA_OPENCL_PLATFORM"},
        {"VYRA_OPENCL_DISABLE", ""}, // nothing is near
        {"VYRA_DISABLE_OPENGL", "VYRA_DISABLE_OPENCL"},
        {"VYRA_GRAPHICS_TO_OPENCL_SYNC_MODE", "VYRA_GRAPHICSTOOPENCL_SYNC_MODE"},
        {"VYRA_OPENCL_TO_GRAPHICS_SYNC_MODE", "VYRA_OPENCLTOGRAPHICS_SYNC_MODE"},
        {"VYRA_opencl_force_finish", "VYRA_OPENCL_FORCE_FINISH"},
    };
    Diagnostics diagnostics = workingDiagnostics();
    for (const auto& [name, meant] : rows) {
        diagnostics.environment.variables = {{name, "1"}};
        EXPECT_EQ(info::explainVariables(diagnostics)[0].suggestion, meant) << name;
    }
}

} // namespace
