// The program in worlds of all kinds: what it answers, and that its JSON keeps to its description.
#include "InfoProcess.h"
#include "Schema.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

constexpr const char* kPoCL = "The pocl project";
constexpr int kNoGraphics = 4;

struct Expected {
    const char* path;
    QJsonValue value;
};

struct Case {
    const char* name;
    std::vector<Setting> settings;
    std::vector<std::string> arguments;
    int exitCode;
    std::vector<Expected> expected;
    const char* inReason = ""; // a part of stop.reason
    const char* inRemedy = ""; // a part of stop.remedy
};

void PrintTo(const Case& row, std::ostream* stream)
{
    *stream << row.name;
}

// In a scripted world, whose platform is Intel's unless the world says otherwise.
std::vector<Setting> world(const char* name, std::vector<Setting> more = {})
{
    more.push_back({"LD_LIBRARY_PATH", INFO_WORLDS});
    more.push_back({"INFO_WORLD", name});
    return more;
}

class InfoIn : public testing::TestWithParam<Case> {};

TEST_P(InfoIn, IsExplained)
{
    const Case& row = GetParam();
    std::vector<std::string> arguments = row.arguments;
    arguments.emplace_back("--json");
    const InfoRun run = runInfo(row.settings, arguments);
    const QJsonObject json = run.json();
    if (run.exitCode == kNoGraphics && row.exitCode != kNoGraphics)
        GTEST_SKIP() << "no OpenGL: " << valueAt(json, "renderer.problem").toString().toStdString();

    EXPECT_EQ(run.exitCode, row.exitCode) << run.output.constData();
    EXPECT_EQ(json["exitCode"].toInt(), row.exitCode);
    EXPECT_EQ(run.errors, QByteArray());
    EXPECT_THAT(schemaViolations(INFO_SCHEMA, json), testing::IsEmpty());
    for (const Expected& expected : row.expected)
        EXPECT_EQ(valueAt(json, expected.path), expected.value) << expected.path;
    EXPECT_THAT(valueAt(json, "stop.reason").toString().toStdString(),
                testing::HasSubstr(row.inReason));
    EXPECT_THAT(valueAt(json, "stop.remedy").toString().toStdString(),
                testing::HasSubstr(row.inRemedy));
}

const std::vector<std::string> kIntel = {"--device-vendor", "0x8086"};
const std::vector<std::string> kNVIDIA = {"--device-vendor=0x10de"};

INSTANTIATE_TEST_SUITE_P(
    RealOpenCL, InfoIn,
    testing::Values(
        Case{"a working machine",
             {{"OPENCL_LAYERS", INFO_LAYER}, {"VYRA_OPENCL_PLATFORM", kPoCL}},
             {},
             0,
             {{"stop", QJsonValue()},
              {"selfTest.passed", true},
              {"selfTest.evaluations", 30},
              {"platforms.0.accepted", true},
              {"platforms.0.devices.0.accepted", true},
              {"variables.1.effect", "changed"}}},
        Case{"finish calls are forced",
             {{"OPENCL_LAYERS", INFO_LAYER}, {"VYRA_OPENCL_FORCE_FINISH", "1"}},
             {"--platform", kPoCL},
             0,
             {{"selfTest.passed", true}, {"variables.1.effect", "changed"}}},
        Case{"nothing is batched",
             {{"OPENCL_LAYERS", INFO_LAYER},
              {"VYRA_OPENCL_FORCE_THREADING", "0"},
              {"VYRA_OPENCLTOGRAPHICS_SYNC_MODE", "3"}},
             {"--platform", kPoCL},
             0,
             {{"selfTest.passed", true},
              {"decisions.2.value", "no"},
              {"decisions.2.variable", "VYRA_OPENCL_FORCE_THREADING"}}},
        Case{"the platform cannot share",
             {{"VYRA_OPENCL_PLATFORM", kPoCL}},
             {},
             1,
             {{"stop.step", "device"}, {"platforms.0.devices.0.accepted", false}},
             "does not list cl_khr_gl_sharing",
             "libglshare.so"},
        Case{"the platform's name is misspelt",
             {{"VYRA_OPENCL_PLATFORM", "the pocl projekt"}},
             {},
             1,
             {{"stop.step", "platform"}, {"platforms.0.accepted", false}},
             "'the pocl projekt'",
             "Probably 'The pocl project' is meant"},
        Case{"the vendor is not known",
             {},
             {"--device-vendor", "74565"},
             1,
             {{"stop.step", "vendor"}, {"startUp.vendorId", 0x12345}},
             "0x12345",
             "'The pocl project'"},
        Case{"OpenCL is switched off",
             {{"VYRA_DISABLE_OPENCL", "0"}, {"VYRA_OPENCL_FORCE_FINNISH", "1"}},
             {},
             1,
             {{"stop.step", "switch"},
              {"loader.loaded", true},
              {"variables.1.effect", "unknown"},
              {"variables.1.suggestion", "VYRA_OPENCL_FORCE_FINISH"}},
             "'0'",
             "unset VYRA_DISABLE_OPENCL"},
        Case{"there is no OpenCL library",
             {{"LD_LIBRARY_PATH", INFO_OTHER_OPENCL "/none"}},
             {},
             1,
             {{"stop.step", "loader"}, {"loader.loaded", false}},
             "libOpenCL.so.1",
             "Install"},
        Case{"the OpenCL library is incomplete",
             {{"LD_LIBRARY_PATH", INFO_OTHER_OPENCL "/incomplete"}},
             {},
             1,
             {{"stop.step", "loader"}, {"loader.loaded", false}},
             "lacks functions that every OpenCL has: cl",
             "Replace"},
        Case{"there is no display",
             {{"DISPLAY", nullptr}, {"WAYLAND_DISPLAY", nullptr}, {"QT_QPA_PLATFORM", nullptr}},
             {},
             kNoGraphics,
             {{"stop.step", "renderer"}, {"renderer.usable", false}, {"startUp.attempted", false}},
             "",
             "xvfb-run"},
        Case{"the display does not exist",
             {{"DISPLAY", ":4711"}, {"QT_QPA_PLATFORM", "xcb"}},
             {},
             kNoGraphics,
             {{"stop.step", "renderer"}},
             "could not connect to display"}));

INSTANTIATE_TEST_SUITE_P(
    ScriptedOpenCL, InfoIn,
    testing::Values(
        Case{"kernels do nothing",
             world("ordinary"),
             kIntel,
             3,
             {{"on", true},
              {"selfTest.problem",
               "30000 of 30000 numbers in OpenGL's memory are wrong in evaluation 1"},
              {"selfTest.milliseconds", QJsonValue()}}},
        Case{"a buffer is refused",
             world("no-buffer"),
             kIntel,
             3,
             {{"selfTest.status.code", -60}, {"selfTest.status.name", "CL_INVALID_GL_OBJECT"}}},
        Case{"there is no platform",
             world("no-platform"),
             kIntel,
             1,
             {{"stop.step", "platform"}},
             "no OpenCL platform",
             "Install"},
        Case{"two platforms of a vendor",
             world("two-platforms"),
             kIntel,
             3,
             {{"platforms.0.accepted", true},
              {"platforms.1.rejection", "another platform of the same vendor comes first"}}},
        Case{"a CPU shares",
             world("cpu"),
             kIntel,
             1,
             {{"stop.step", "device"}},
             "no GPUs: Scripted GPU (CPU)"},
        Case{"the runtime does not know the context",
             world("context-unknown"),
             kIntel,
             1,
             {{"stop.step", "device"}, {"stop.status.code", -1000}},
             "CL_INVALID_GL_SHAREGROUP_REFERENCE_KHR (-1000)"},
        Case{"the driver is refused",
             world("refused-driver"),
             kNVIDIA,
             1,
             {{"stop.step", "driver"},
              {"platforms.0.devices.0.rejection", "the GPU's driver is refused"}},
             "365.10",
             "VYRA_OPENCL_IGNORE_DRIVER_VERSION=1"},
        Case{"a refused driver is accepted",
             world("refused-driver", {{"VYRA_OPENCL_IGNORE_DRIVER_VERSION", "0"}}),
             kNVIDIA,
             3,
             {{"variables.0.effect", "changed"},
              {"decisions.5.id", "driver"},
              {"decisions.5.variable", "VYRA_OPENCL_IGNORE_DRIVER_VERSION"}}},
        Case{"an old driver",
             world("old-driver"),
             kNVIDIA,
             3,
             {{"decisions.3.value", "no"},
              {"decisions.8.id", "opencl-to-graphics"},
              {"decisions.8.value", "event query (2)"}}},
        Case{"no context, with a status of no header",
             world("no-context"),
             kIntel,
             1,
             {{"stop.step", "context"},
              {"stop.status.code", -9999},
              {"stop.status.name", QJsonValue()},
              {"startUp.warnings.0.status.code", -9999}},
             "-9999"},
        Case{"a sharing function is missing",
             world("no-acquire"),
             kIntel,
             1,
             {{"stop.step", "sharing-functions"},
              {"loader.missingSharing.0", "clEnqueueAcquireGLObjects"}},
             "clEnqueueAcquireGLObjects"},
        Case{"the device is not available",
             world("unavailable"),
             kIntel,
             1,
             {{"stop.step", "availability"}, {"platforms.0.devices.0.available", false}}},
        Case{"double precision is demanded",
             world("no-double", {{"VYRA_OPENCL_OFF_WITHOUT_DOUBLE_SUPPORT", "1"}}),
             kIntel,
             1,
             {{"stop.step", "double-precision"}, {"variables.0.effect", "changed"}}},
        Case{"a forced mode is overridden",
             world("no-gl-event", {{"VYRA_OPENCLTOGRAPHICS_SYNC_MODE", "1"}}),
             kIntel,
             3,
             {{"variables.0.effect", "none"}, {"decisions.8.value", "event query (2)"}}},
        Case{"there is no queue",
             world("no-queue"),
             kIntel,
             1,
             {{"stop.step", "queue"}, {"stop.status.name", "CL_INVALID_QUEUE_PROPERTIES"}}}));

// Nothing is changed on the machine, and nothing depends on chance; only times differ.
TEST(Info, TellsTheSameTwice)
{
    const std::vector<Setting> settings = {{"OPENCL_LAYERS", INFO_LAYER}};
    QJsonObject first = runInfo(settings, {"--json", "--platform", kPoCL}).json();
    QJsonObject second = runInfo(settings, {"--json", "--platform", kPoCL}).json();
    ASSERT_FALSE(first.isEmpty());
    if (first["exitCode"].toInt() == kNoGraphics)
        GTEST_SKIP() << "no OpenGL";
    for (QJsonObject* report : {&first, &second}) {
        QJsonObject test = (*report)["selfTest"].toObject();
        EXPECT_GT(valueAt(test, "milliseconds.evaluation").toDouble(), 0.0);
        test.remove("milliseconds");
        report->insert("selfTest", test);
    }
    EXPECT_EQ(first, second);
}

TEST(Info, WrongOptionsGetASentence)
{
    const InfoRun run = runInfo({}, {"--jsn"});
    EXPECT_EQ(run.exitCode, 2);
    EXPECT_EQ(run.output, QByteArray());
    EXPECT_EQ(run.errors, QByteArray("vyra-opencl-info: there is no option '--jsn'; see "
                                     "vyra-opencl-info --help\n"));
}

} // namespace
