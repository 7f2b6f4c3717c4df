// What became of each environment variable.
#include "MadeUpFacts.h"

#include "tools/Variables.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using info::Effect;
using info::Facts;
using testing::HasSubstr;

struct Row {
    const char* name;
    const char* value;
    Effect effect;
    const char* explanation; // a part of it
    void (*change)(Facts& facts) = [](Facts&) {};
    const char* nvidiaDriver = nullptr; // on NVIDIA's platform, with this driver
};

void overrideMode(Facts& facts)
{
    facts.environment.syncModes.graphicsToCL = 2;
    facts.startUp.graphicsToCL = TopenCLInfo::kGraphicsToCLFinish;
}

void forceSyncObject(Facts& facts)
{
    facts.environment.syncModes.clToGraphics = 3;
    facts.startUp.clToGraphics = TopenCLInfo::kCLToGraphicsSyncObject;
}

void forceFinish(Facts& facts)
{
    facts.environment.syncModes.forceFinish = 1;
    facts.environment.syncModes.graphicsToCL = 2;
}

void demandDouble(Facts& facts)
{
    facts.environment.doubleDemanded = 1;
}

void stopAtPlatform(Facts& facts)
{
    facts.startUp.valid = false;
    facts.startUp.output = "OpenCL evaluator failed to find OpenCL device with vendor x.\n";
}

template <int kIgnore>
void ignoreDriver(Facts& facts)
{
    facts.environment.ignoreDriverVersion = kIgnore;
}

TEST(Variables, AreToldWithTheirEffect)
{
    constexpr char kFence[] = "VYRA_GRAPHICSTOOPENCL_SYNC_MODE";
    constexpr char kRelease[] = "VYRA_OPENCLTOGRAPHICS_SYNC_MODE";
    constexpr char kDouble[] = "VYRA_OPENCL_OFF_WITHOUT_DOUBLE_SUPPORT";
    constexpr char kIgnore[] = "VYRA_OPENCL_IGNORE_DRIVER_VERSION";
    const Row rows[] = {
        {"VYRA_OPENCL_FORCE_FINISH", "yes", Effect::kNone, "whole number"},
        {"VYRA_OPENCL_FORCE_FINISH", "1", Effect::kChanged, "finish calls", forceFinish},
        {kFence, "2", Effect::kNone, "goes before it", forceFinish},
        {kFence, "4", Effect::kNone, "1 to 3"},
        {kFence, "2", Effect::kNone, "lacks the means", overrideMode},
        {kFence, "2", Effect::kNone, "stopped before", stopAtPlatform},
        {kRelease, "3", Effect::kChanged, "in place of mode 1", forceSyncObject},
        {kDouble, "yes", Effect::kNone, "whole number"},
        {kDouble, "1", Effect::kNone, "has double precision", demandDouble},
        {kIgnore, "1", Effect::kNone, "not NVIDIA's", ignoreDriver<1>},
        {kIgnore, "0", Effect::kNone, "judged the same", ignoreDriver<0>, "400.00"},
        {kIgnore, "0", Effect::kNone, "judged the same", ignoreDriver<0>, "384.00"},
        {kIgnore, "1", Effect::kChanged, "implicit synchronisation", ignoreDriver<1>, "384.00"},
        {kIgnore, "0", Effect::kChanged, "refused otherwise", ignoreDriver<0>, "365.10"},
        {kIgnore, "1", Effect::kNone, "cannot be read", ignoreDriver<1>, "new"},
        {"VYRA_OPENCL_FORCE_THREADING", "", Effect::kChanged, "batching off"},
        {"VYRA_OPENCL_DEFORMER_MIN_VERTS", "10", Effect::kNone, "stopped before", stopAtPlatform},
        {"VYRA_SOMETHING", "1", Effect::kUnknown, "no variable of this name"},
        {"OPENCL_LAYERS", "x", Effect::kNoted, "steers"},
    };
    for (const Row& row : rows) {
        Facts facts = row.nvidiaDriver ? nvidiaFacts(row.nvidiaDriver) : intelFacts();
        row.change(facts);
        facts.environment.variables = {{row.name, row.value}};
        const std::string what = std::string(row.name) + "=" + row.value;
        const auto reports = info::explainVariables(facts);
        ASSERT_EQ(reports.size(), 1U) << what;
        EXPECT_EQ(reports[0].effect, row.effect) << what << ": " << reports[0].explanation;
        EXPECT_THAT(reports[0].explanation, HasSubstr(row.explanation)) << what;
    }
}

TEST(Variables, MisspeltOnesGetTheNearestName)
{
    struct Misspelt {
        const char* name;
        const char* meant; // "": nothing near
    };
    constexpr Misspelt kRows[] = {
        {"VYRA_OPENCL_PLATTFORM", "VYRA_OPENCL_PLATFORM"},
        {"VYRA_OPENCL_DISABLE", ""},
        {"VYRA_DISABLE_OPENGL", "VYRA_DISABLE_OPENCL"},
        {"VYRA_GRAPHICS_TO_OPENCL_SYNC_MODE", "VYRA_GRAPHICSTOOPENCL_SYNC_MODE"},
        {"VYRA_OPENCL_TO_GRAPHICS_SYNC_MODE", "VYRA_OPENCLTOGRAPHICS_SYNC_MODE"},
        {"VYRA_opencl_force_finish", "VYRA_OPENCL_FORCE_FINISH"},
        {"VYRA_X", ""},
    };
    Facts facts = intelFacts();
    for (const Misspelt& row : kRows) {
        facts.environment.variables = {{row.name, "1"}};
        EXPECT_EQ(info::explainVariables(facts)[0].suggestion, row.meant) << row.name;
    }
}

} // namespace
