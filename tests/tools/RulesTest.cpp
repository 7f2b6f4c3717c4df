// Stops, verdicts, decisions and what became of each environment variable, on made-up facts.
#include "runtime/PlatformSelection.h"
#include "tools/info/rules/Decisions.h"
#include "tools/info/rules/StartUpFailure.h"
#include "tools/info/rules/SyncDecisions.h"
#include "tools/info/rules/Variables.h"
#include "tools/info/rules/Verdicts.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using info::Effect;
using info::Facts;
using testing::HasSubstr;

// One platform with one GPU that drives the renderer, NVIDIA's with the driver that is named, else
// Intel's; start-up went through, in the modes that are automatic there.
Facts workingFacts(const char* nvidiaDriver = nullptr)
{
    Facts facts;
    facts.renderer.usable = facts.renderer.syncObjects = true;
    facts.renderer.renderer = "Maker's GPU";
    facts.renderer.adapterVendorId = 0x8086;
    info::Platform& platform = facts.platforms.emplace_back();
    platform.vendor = nvidiaDriver ? kNVIDIAVendor : kIntelVendor;
    platform.extensions = "cl_khr_gl_sharing cl_khr_gl_event";
    info::Device& device = platform.devices.emplace_back();
    device.driverVersion = nvidiaDriver ? nvidiaDriver : "1.0";
    device.type = CL_DEVICE_TYPE_GPU;
    device.vendorId = 0x8086;
    device.sharesWithRenderer = device.drivesRenderer = true;
    device.chosen = platform.chosen = true;

    info::StartUp& startUp = facts.startUp;
    startUp.valid = startUp.hasDevice = startUp.hasContext = true;
    startUp.vendorId = 0x8086;
    startUp.output = "Device is available.\n\n";
    startUp.provider = nvidiaDriver ? kNVIDIAProvider : kIntelProvider;
    startUp.graphicsToCL = TopenCLInfo::kGraphicsToCLImplicit;
    startUp.clToGraphics = TopenCLInfo::kCLToGraphicsImplicit;
    startUp.doublePrecision = true;
    return facts;
}

// The renderer's GPU has no OpenCL, another one has: the user hears of both.
TEST(Stops, NameBothMakersWhereTheRenderersHasNoPlatform)
{
    Facts facts = workingFacts("400.00");
    facts.wantedVendor = kIntelVendor;
    facts.platforms[0].chosen = facts.startUp.valid = false;
    facts.startUp.output = "OpenCL evaluator failed to find OpenCL device with vendor x.\n";
    facts.startUp.warnings = {"OpenCL error: CL_INVALID_CONTEXT", "OpenCL error: CL_INVALID_VALUE",
                              "a build log"};
    const auto stop = info::findStop(facts);
    ASSERT_TRUE(stop);
    EXPECT_EQ(stop->step, info::Step::kPlatform);
    EXPECT_EQ(stop->status, CL_INVALID_VALUE) << "the last that failed";
    EXPECT_THAT(stop->reason, testing::AllOf(HasSubstr("'Intel(R) Corporation'"),
                                             HasSubstr("'NVIDIA Corporation'"), HasSubstr("0x8086"),
                                             HasSubstr("Maker's GPU")));
    EXPECT_THAT(stop->remedy, HasSubstr("two GPUs"));
}

TEST(Verdicts, NameTheFirstTestThatADeviceFailed)
{
    Facts facts = workingFacts();
    info::Platform& platform = facts.platforms[0];
    platform.devices.resize(2);
    info::Device& other = platform.devices[1];
    const auto rejection = [&] { return info::deviceRejection(facts, platform, other); };
    EXPECT_EQ(info::deviceRejection(facts, platform, platform.devices[0]), "");
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

TEST(Verdicts, TellOfAGpuThatIsNotTheRenderers)
{
    Facts facts = workingFacts();
    EXPECT_EQ(info::rendererBesideDevice(facts), "");
    facts.platforms[0].devices[0].drivesRenderer = false;
    EXPECT_THAT(info::rendererBesideDevice(facts), HasSubstr("does not name it"));
    facts.platforms[0].devices[0].vendorId = 0x10DE;
    EXPECT_THAT(info::rendererBesideDevice(facts), HasSubstr("different makers"));
    facts.renderer.adapterVendorId.reset();
    EXPECT_THAT(info::rendererBesideDevice(facts), HasSubstr("software"));
}

TEST(Decisions, GiveTheReasonOfTheMode)
{
    constexpr char kEvent[] = "cl_khr_gl_event";
    constexpr auto kImplicit = TopenCLInfo::kGraphicsToCLImplicit;
    constexpr auto kExplicit = TopenCLInfo::kGraphicsToCLExplicit;
    constexpr auto kFinish = TopenCLInfo::kGraphicsToCLFinish;
    const struct {
        const char* extensions;
        bool syncObjects;
        int wish;
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
        {"", false, 2, kFinish, "lacks the means", false},
    };
    for (const auto& row : rows) {
        SCOPED_TRACE(row.reason);
        Facts facts = workingFacts();
        facts.platforms[0].extensions = row.extensions;
        facts.renderer.syncObjects = row.syncObjects;
        facts.environment.syncModes.graphicsToCL = row.wish;
        facts.startUp.graphicsToCL = row.mode;
        const info::Decision decision = info::decideGraphicsToCL(facts);
        EXPECT_THAT(decision.reason, HasSubstr(row.reason));
        EXPECT_EQ(!decision.variable.empty(), row.byVariable);
    }
}

using Change = void (*)(Facts& facts);

void stopAtPlatform(Facts& facts)
{
    facts.startUp.valid = false;
    facts.startUp.output = "OpenCL evaluator failed to find OpenCL device with vendor x.\n";
}

TEST(Variables, AreToldWithTheirEffect)
{
    constexpr char kFinish[] = "VYRA_OPENCL_FORCE_FINISH";
    constexpr char kFence[] = "VYRA_GRAPHICSTOOPENCL_SYNC_MODE";
    constexpr char kDouble[] = "VYRA_OPENCL_OFF_WITHOUT_DOUBLE_SUPPORT";
    constexpr char kIgnore[] = "VYRA_OPENCL_IGNORE_DRIVER_VERSION";
    constexpr Change forceFinish = [](Facts& facts) {
        facts.environment.syncModes.forceFinish = 1;
    };
    constexpr Change demandDouble = [](Facts& facts) { facts.environment.doubleDemanded = 1; };
    constexpr Change ignore0 = [](Facts& facts) { facts.environment.ignoreDriverVersion = 0; };
    constexpr Change ignore1 = [](Facts& facts) { facts.environment.ignoreDriverVersion = 1; };
    const struct {
        const char* name;
        const char* value;
        Effect effect;
        const char* explanation; // a part of it
        Change change = [](Facts&) {};
        const char* nvidiaDriver = nullptr; // on NVIDIA's platform, with this driver
    } rows[] = {
        {kFinish, "yes", Effect::kNone, "whole number"},
        {kFinish, "1", Effect::kChanged, "finish calls", forceFinish},
        {kFence, "2", Effect::kNone, "goes before it", forceFinish},
        {kFence, "4", Effect::kNone, "1 to 3"},
        {kFence, "2", Effect::kNone, "stopped before", stopAtPlatform},
        {kDouble, "yes", Effect::kNone, "whole number"},
        {kDouble, "1", Effect::kNone, "has double precision", demandDouble},
        {kIgnore, "1", Effect::kNone, "not NVIDIA's", ignore1},
        {kIgnore, "0", Effect::kNone, "judged the same", ignore0, "400.00"},
        {kIgnore, "0", Effect::kNone, "judged the same", ignore0, "384.00"},
        {kIgnore, "1", Effect::kChanged, "implicit synchronisation", ignore1, "384.00"},
        {kIgnore, "0", Effect::kChanged, "refused otherwise", ignore0, "365.10"},
        {kIgnore, "1", Effect::kNone, "cannot be read", ignore1, "new"},
        {"VYRA_OPENCL_FORCE_THREADING", "", Effect::kChanged, "batching off"},
        {"VYRA_OPENCL_DEFORMER_MIN_VERTS", "10", Effect::kNone, "stopped before", stopAtPlatform},
        {"VYRA_SOMETHING", "1", Effect::kUnknown, "no variable of this name"},
        {"OPENCL_LAYERS", "x", Effect::kNoted, "steers"},
    };
    for (const auto& row : rows) {
        SCOPED_TRACE(std::string(row.name) + "=" + row.value);
        Facts facts = workingFacts(row.nvidiaDriver);
        row.change(facts);
        facts.environment.variables = {{row.name, row.value}};
        const auto reports = info::explainVariables(facts);
        ASSERT_EQ(reports.size(), 1U);
        EXPECT_EQ(reports[0].effect, row.effect);
        EXPECT_THAT(reports[0].explanation, HasSubstr(row.explanation));
    }
}

TEST(Variables, MisspeltOnesGetTheNearestName)
{
    const std::pair<const char*, const char*> rows[] = {
        {"VYRA_OPENCL_PLATTFORM", "VYRA_OPENCL_PLATFORM"},
        {"VYRA_OPENCL_DISABLE", ""}, // nothing is near
        {"VYRA_DISABLE_OPENGL", "VYRA_DISABLE_OPENCL"},
        {"VYRA_GRAPHICS_TO_OPENCL_SYNC_MODE", "VYRA_GRAPHICSTOOPENCL_SYNC_MODE"},
        {"VYRA_OPENCL_TO_GRAPHICS_SYNC_MODE", "VYRA_OPENCLTOGRAPHICS_SYNC_MODE"},
        {"VYRA_opencl_force_finish", "VYRA_OPENCL_FORCE_FINISH"},
    };
    Facts facts = workingFacts();
    for (const auto& [name, meant] : rows) {
        facts.environment.variables = {{name, "1"}};
        EXPECT_EQ(info::explainVariables(facts)[0].suggestion, meant) << name;
    }
}

} // namespace
