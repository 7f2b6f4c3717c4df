// Stops that no message gives away, verdicts and decisions, on made-up facts.
#include "MadeUpFacts.h"

#include "tools/Decisions.h"
#include "tools/Stop.h"
#include "tools/Verdicts.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using info::Facts;
using info::Step;
using testing::HasSubstr;

struct SilentStop {
    const char* description;
    bool nvidia;
    bool device;
    bool context;
    const char* driverVersion;
    const char* output;
    Step step;
};

// A query that fails stops start-up without a message.
TEST(SilentStops, AreFoundFromWhatIsThere)
{
    constexpr SilentStop kRows[] = {
        {"the devices cannot be asked for", false, false, false, "1.0", "", Step::kDevice},
        {"the driver does not tell its version", true, true, false, "", "", Step::kDriver},
        {"no context with NVIDIA", true, true, false, "400.00", "", Step::kContext},
        {"no context elsewhere", false, true, false, "", "", Step::kContext},
        {"the device does not tell its type", false, true, true, "1.0",
         "Choosing OpenCL Device x.  ", Step::kAvailability},
        {"double precision cannot be asked for", false, true, true, "1.0", "Device is available.\n",
         Step::kDoublePrecision},
        {"no queue", false, true, true, "1.0", "Device is available.\n\n", Step::kQueue},
    };
    for (const SilentStop& row : kRows) {
        Facts facts = row.nvidia ? nvidiaFacts(row.driverVersion) : intelFacts();
        facts.platforms[0].devices[0].chosen = row.device;
        facts.startUp.valid = facts.startUp.hasQueue = false;
        facts.startUp.hasDevice = row.device;
        facts.startUp.hasContext = row.context;
        facts.startUp.output = row.output;
        facts.startUp.warnings = {"a build log", "OpenCL error: CL_INVALID_VALUE"};
        const auto stop = info::findStop(facts);
        ASSERT_TRUE(stop) << row.description;
        EXPECT_EQ(stop->step, row.step) << row.description;
        EXPECT_EQ(stop->status, CL_INVALID_VALUE) << row.description;
        EXPECT_THAT(stop->reason, HasSubstr("CL_INVALID_VALUE (-30)")) << row.description;
        EXPECT_FALSE(stop->remedy.empty()) << row.description;
    }
    EXPECT_FALSE(info::findStop(intelFacts()));
}

// The renderer's GPU has no OpenCL, another one has: the user hears of both.
TEST(Stops, NameBothMakersWhereTheRenderersHasNoPlatform)
{
    Facts facts = nvidiaFacts("400.00");
    facts.wantedVendor = "Intel(R) Corporation";
    facts.platforms[0].chosen = false;
    facts.startUp.valid = false;
    facts.startUp.output = "OpenCL evaluator failed to find OpenCL device with vendor Intel(R) "
                           "Corporation.\n";
    const auto stop = info::findStop(facts);
    ASSERT_TRUE(stop);
    EXPECT_EQ(stop->step, Step::kPlatform);
    EXPECT_THAT(stop->reason, testing::AllOf(HasSubstr("'Intel(R) Corporation'"),
                                             HasSubstr("'NVIDIA Corporation'"), HasSubstr("0x8086"),
                                             HasSubstr("Maker's GPU")));
    EXPECT_THAT(stop->remedy, HasSubstr("two GPUs"));
}

TEST(Verdicts, NameTheFirstTestThatADeviceFailed)
{
    Facts facts = intelFacts();
    info::Platform& platform = facts.platforms[0];
    platform.devices.resize(2);
    info::Device& other = platform.devices[1];
    EXPECT_EQ(info::deviceRejection(facts, platform, platform.devices[0]), "");
    EXPECT_THAT(info::deviceRejection(facts, platform, other), HasSubstr("does not share"));
    other.sharesWithRenderer = true;
    other.type = CL_DEVICE_TYPE_GPU | CL_DEVICE_TYPE_DEFAULT;
    EXPECT_THAT(info::deviceRejection(facts, platform, other), HasSubstr("GPU and default device"));
    other.type = CL_DEVICE_TYPE_GPU;
    EXPECT_THAT(info::deviceRejection(facts, platform, other), HasSubstr("comes first"));
    platform.sharingStatus = -1000;
    EXPECT_THAT(info::deviceRejection(facts, platform, other), HasSubstr("(-1000)"));
    platform.chosen = false;
    EXPECT_THAT(info::deviceRejection(facts, platform, other), HasSubstr("platform"));
}

TEST(Verdicts, TellOfAGpuThatIsNotTheRenderers)
{
    Facts facts = intelFacts();
    EXPECT_EQ(info::rendererBesideDevice(facts), "");
    facts.platforms[0].devices[0].drivesRenderer = false;
    EXPECT_THAT(info::rendererBesideDevice(facts), HasSubstr("does not name it"));
    facts.platforms[0].devices[0].vendorId = 0x10DE;
    EXPECT_THAT(info::rendererBesideDevice(facts), HasSubstr("different makers"));
    facts.renderer.adapterVendorId.reset();
    EXPECT_THAT(info::rendererBesideDevice(facts), HasSubstr("software"));
}

const info::Decision* find(const std::vector<info::Decision>& decisions, const std::string& id)
{
    for (const info::Decision& decision : decisions) {
        if (decision.id == id)
            return &decision;
    }
    return nullptr;
}

struct ModeReason {
    const char* description;
    const char* extensions;
    bool syncObjects;
    int wish;
    TopenCLInfo::GraphicsToCLSyncMode mode;
    const char* reason;
    bool byVariable;
};

TEST(Decisions, GiveTheReasonOfTheMode)
{
    constexpr auto kImplicit = TopenCLInfo::kGraphicsToCLImplicit;
    constexpr auto kExplicit = TopenCLInfo::kGraphicsToCLExplicit;
    constexpr auto kFinish = TopenCLInfo::kGraphicsToCLFinish;
    constexpr ModeReason kRows[] = {
        {"the extension", "cl_khr_gl_event", true, 0, kImplicit, "lists", false},
        {"fences", "", true, 0, kExplicit, "OpenGL has GL_ARB_sync", false},
        {"nothing", "", false, 0, kFinish, "OpenGL lacks GL_ARB_sync", false},
        {"forced", "cl_khr_gl_event", true, 3, kFinish, "forces it", true},
        {"forced to the automatic one", "cl_khr_gl_event", true, 1, kImplicit, "forces it", false},
        {"forced without the means", "", true, 1, kImplicit, "wrong pictures", true},
        {"overridden", "", false, 2, kFinish, "lacks the means", false},
    };
    for (const ModeReason& row : kRows) {
        Facts facts = intelFacts();
        facts.platforms[0].extensions = row.extensions;
        facts.renderer.syncObjects = row.syncObjects;
        facts.environment.syncModes.graphicsToCL = row.wish;
        facts.startUp.graphicsToCL = row.mode;
        const auto decisions = info::explainDecisions(facts);
        const info::Decision* decision = find(decisions, "graphics-to-opencl");
        ASSERT_TRUE(decision) << row.description;
        EXPECT_THAT(decision->reason, HasSubstr(row.reason)) << row.description;
        EXPECT_EQ(!decision->variable.empty(), row.byVariable) << row.description;
    }
}

// What was not reached was not decided.
TEST(Decisions, EndWhereStartUpStopped)
{
    Facts facts = nvidiaFacts("365.10");
    facts.startUp.valid = facts.startUp.hasContext = facts.startUp.hasQueue = false;
    facts.startUp.output = "\nOpenCL is not supported by NVidia drivers between version 361.91";
    const auto decisions = info::explainDecisions(facts);
    EXPECT_TRUE(find(decisions, "device"));
    EXPECT_FALSE(find(decisions, "driver"));
    EXPECT_FALSE(find(decisions, "graphics-to-opencl"));
    EXPECT_FALSE(find(decisions, "double-precision"));
}

} // namespace
