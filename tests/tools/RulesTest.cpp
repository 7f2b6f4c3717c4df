// The rules of vyra-opencl-info on hand-made diagnostics.
#include "runtime/PlatformSelection.h"
#include "tools/info/rules/Decisions.h"
#include "tools/info/rules/StartUpFailure.h"
#include "tools/info/rules/SyncDecisions.h"
#include "tools/info/rules/Variables.h"
#include "tools/info/rules/Verdicts.h"

#include <tuple>

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
    using Mode = TopenCLInfo::GraphicsToCLSyncMode;
    const std::tuple<const char*, bool, int, Mode, const char*, bool> rows[] = {
        {kEvent, true, 0, kImplicit, "lists", false},
        {"", true, 0, kExplicit, "OpenGL has GL_ARB_sync", false},
        {"", false, 0, kFinish, "OpenGL lacks GL_ARB_sync", false},
        {kEvent, true, 3, kFinish, "forces it", true},
        {kEvent, true, 1, kImplicit, "forces it", false},
        {"", true, 1, kImplicit, "wrong pictures", true},
        {"", false, 2, kFinish, "does not support", false},
    };
    for (const auto& [extensions, syncObjects, requested, mode, reason, byVariable] : rows) {
        SCOPED_TRACE(reason);
        Diagnostics diagnostics = workingDiagnostics();
        diagnostics.platforms[0].extensions = extensions;
        diagnostics.renderer.syncObjects = syncObjects;
        diagnostics.environment.syncModes.graphicsToCL = requested;
        diagnostics.startUp.graphicsToCL = mode;
        const info::Decision decision = info::decideGraphicsToCL(diagnostics);
        EXPECT_THAT(decision.reason, HasSubstr(reason));
        EXPECT_EQ(!decision.variable.empty(), byVariable);
    }
}

TEST(Variables, SetVariableReportsEffectExplanationAndSuggestion)
{
    constexpr char kFinish[] = "VYRA_OPENCL_FORCE_FINISH";
    constexpr char kFence[] = "VYRA_GRAPHICSTOOPENCL_SYNC_MODE";
    constexpr char kDouble[] = "VYRA_OPENCL_OFF_WITHOUT_DOUBLE_SUPPORT";
    constexpr char kIgnore[] = "VYRA_OPENCL_IGNORE_DRIVER_VERSION";
    constexpr char kUnknown[] = "no variable of this name";
    struct Changes {
        const char* nvidiaDriver = nullptr; // on NVIDIA's platform, with this driver
        std::optional<int> ignoreDriver = {};
        int forceFinish = 0;
        int requireDouble = 0;
        bool stopped = false; // at the platform
    };
    const struct {
        const char* name;
        const char* value;
        Effect effect;
        const char* explanation; // a part of it
        Changes changes = {};
        const char* suggestion = "";
    } rows[] = {
        {kFinish, "yes", Effect::kNone, "whole number"},
        {kFinish, "1", Effect::kChanged, "finish calls", {.forceFinish = 1}},
        {kFence, "2", Effect::kNone, "takes precedence", {.forceFinish = 1}},
        {kFence, "4", Effect::kNone, "1 to 3"},
        {kFence, "2", Effect::kNone, "stopped before", {.stopped = true}},
        {kDouble, "yes", Effect::kNone, "whole number"},
        {kDouble, "1", Effect::kNone, "has double precision", {.requireDouble = 1}},
        {kIgnore, "1", Effect::kNone, "not NVIDIA's", {nullptr, 1}},
        {kIgnore, "0", Effect::kNone, "is the same", {"400.00", 0}},
        {kIgnore, "0", Effect::kNone, "is the same", {"384.00", 0}},
        {kIgnore, "1", Effect::kChanged, "implicit synchronisation", {"384.00", 1}},
        {kIgnore, "0", Effect::kChanged, "refused range", {"365.10", 0}},
        {kIgnore, "1", Effect::kNone, "cannot be parsed", {"new", 1}},
        {"VYRA_OPENCL_FORCE_THREADING", "", Effect::kChanged, "batching off"},
        {"VYRA_OPENCL_DEFORMER_MIN_VERTS",
         "10",
         Effect::kNone,
         "stopped before",
         {.stopped = true}},
        {"OPENCL_LAYERS", "x", Effect::kNoted, "selects"},
        {"VYRA_OPENCL_DISABLE", "1", Effect::kUnknown, kUnknown}, // no name is near
        {"VYRA_DISABLE_OPENGL", "1", Effect::kUnknown, kUnknown, {}, "VYRA_DISABLE_OPENCL"},
        {"VYRA_GRAPHICS_TO_OPENCL_SYNC_MODE", "1", Effect::kUnknown, kUnknown, {}, kFence},
        {"VYRA_opencl_force_finish", "1", Effect::kUnknown, kUnknown, {}, kFinish},
    };
    for (const auto& row : rows) {
        SCOPED_TRACE(std::string(row.name) + "=" + row.value);
        Diagnostics diagnostics = workingDiagnostics(row.changes.nvidiaDriver);
        if (row.changes.stopped)
            stopAt(diagnostics, StartUpStep::kPlatform);
        diagnostics.environment.syncModes.forceFinish = row.changes.forceFinish;
        diagnostics.environment.requireDoublePrecision = row.changes.requireDouble;
        diagnostics.environment.ignoreDriverVersion = row.changes.ignoreDriver;
        diagnostics.environment.variables = {{row.name, row.value}};
        const auto reports = info::explainVariables(diagnostics);
        ASSERT_EQ(reports.size(), 1U);
        EXPECT_EQ(reports[0].effect, row.effect);
        EXPECT_THAT(reports[0].explanation, HasSubstr(row.explanation));
        EXPECT_EQ(reports[0].suggestion, row.suggestion);
    }
}

} // namespace
