// The program in worlds of all kinds: what it answers, and that its JSON keeps to its description.
#include <QJsonArray>
#include <QJsonDocument>
#include <QJsonObject>
#include <QProcess>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

const std::string kPoCL = "The pocl project";
constexpr int kNoGraphics = 4;

// Generous: kernels are compiled, perhaps under a sanitizer and beside other tests.
constexpr int kTimeoutMs = 100000;

// Options, and variables as env takes them: "NAME=value", or "-uNAME" to remove one.
using Settings = std::vector<std::string>;

struct InfoRun {
    int exitCode = -1; // -1: it crashed or did not end
    QByteArray output;
    QByteArray errors;
    QJsonObject json;
};

// This process's environment, without the variables that steer the library or its OpenCL.
QProcessEnvironment cleanEnvironment()
{
    QProcessEnvironment environment = QProcessEnvironment::systemEnvironment();
    for (const QString& name : environment.keys()) {
        if (name.startsWith("VYRA_") || name.startsWith("GLSHARE_") || name == "OPENCL_LAYERS")
            environment.remove(name);
    }
    return environment;
}

InfoRun runInfo(const Settings& settings)
{
    QStringList variables;
    QStringList options;
    for (const std::string& setting : settings)
        (setting.starts_with("--") ? options : variables).append(QString::fromStdString(setting));
    QProcess process;
    process.setProcessEnvironment(cleanEnvironment());
    process.start("env", variables + QStringList{INFO_PROGRAM} + options);
    InfoRun run;
    if (process.waitForFinished(kTimeoutMs) && process.exitStatus() == QProcess::NormalExit)
        run.exitCode = process.exitCode();
    run.output = process.readAllStandardOutput();
    run.errors = process.readAllStandardError();
    run.json = QJsonDocument::fromJson(run.output).object();
    return run;
}

// What is wrong with a program's output by the description of it.
QByteArray schemaViolations(const QByteArray& json)
{
    QProcess checker;
    checker.setProcessChannelMode(QProcess::MergedChannels);
    checker.start("python3", {INFO_SCHEMA_CHECKER, INFO_SCHEMA});
    checker.write(json);
    checker.closeWriteChannel();
    EXPECT_TRUE(checker.waitForFinished(kTimeoutMs)) << checker.errorString().toStdString();
    return checker.readAll();
}

// The value at a path such as "platforms.0.vendor"; "null", and "undefined" where there is none.
std::string textAt(QJsonValue value, const std::string& path)
{
    for (const QString& part : QString::fromStdString(path).split('.'))
        value = value.isArray() ? value.toArray().at(part.toInt()) : value[part];
    if (value.isNull() || value.isUndefined())
        return value.isNull() ? "null" : "undefined";
    return value.toVariant().toString().toStdString();
}

struct Case {
    std::string name;
    Settings settings;
    int exitCode;
    std::vector<std::string> expected; // in the JSON: "path=value", or "path~a part of it"
};

void PrintTo(const Case& row, std::ostream* stream)
{
    *stream << row.name;
}

// On this machine's OpenCL.
Case real(const char* name, const Settings& settings, int exitCode,
          const std::vector<std::string>& expected)
{
    return {name, settings, exitCode, expected};
}

// In a scripted world, whose platform is Intel's unless the world says otherwise.
Case scripted(const std::string& world, const Settings& more, int exitCode,
              const std::vector<std::string>& expected)
{
    Settings settings = {"LD_LIBRARY_PATH=" INFO_WORLDS, "INFO_WORLD=" + world,
                         "--device-vendor=0x8086"};
    settings.insert(settings.end(), more.begin(), more.end());
    return {more.empty() ? world : world + " " + more.back(), settings, exitCode, expected};
}

class InfoIn : public testing::TestWithParam<Case> {};

TEST_P(InfoIn, IsExplained)
{
    const Case& row = GetParam();
    Settings settings = row.settings;
    settings.emplace_back("--json");
    const InfoRun run = runInfo(settings);
    if (run.exitCode == kNoGraphics && row.exitCode != kNoGraphics)
        GTEST_SKIP() << "no OpenGL: " << textAt(run.json, "renderer.problem");

    EXPECT_EQ(run.exitCode, row.exitCode) << run.output.constData();
    EXPECT_EQ(run.json["exitCode"], row.exitCode);
    EXPECT_EQ(run.errors, QByteArray());
    EXPECT_EQ(schemaViolations(run.output), QByteArray());
    for (const QJsonValue time : run.json["selfTest"]["milliseconds"].toObject())
        EXPECT_GT(time.toDouble(), 0.0);
    for (const std::string& expected : row.expected) {
        const std::size_t path = expected.find_first_of("=~");
        const std::string text = expected.substr(path + 1);
        testing::Matcher<std::string> matches = testing::HasSubstr(text);
        if (expected[path] == '=')
            matches = text;
        EXPECT_THAT(textAt(run.json, expected.substr(0, path)), matches) << expected;
    }
}

const std::string kNVIDIA = "--device-vendor=0x10de";
const std::string kLayer = "OPENCL_LAYERS=" INFO_LAYER;

INSTANTIATE_TEST_SUITE_P(
    Worlds, InfoIn,
    testing::Values(
        real("a working machine", {kLayer, "VYRA_OPENCL_PLATFORM=" + kPoCL}, 0,
             {"stop=null", "selfTest.passed=true", "selfTest.evaluations=30",
              "platforms.0.accepted=true", "platforms.0.devices.0.accepted=true",
              "variables.1.effect=changed"}),
        real("finish calls are forced",
             {kLayer, "VYRA_OPENCL_FORCE_FINISH=1", "--platform=" + kPoCL}, 0,
             {"selfTest.passed=true", "variables.1.effect=changed"}),
        real("nothing is batched",
             {kLayer, "VYRA_OPENCL_FORCE_THREADING=0", "VYRA_OPENCLTOGRAPHICS_SYNC_MODE=3",
              "--platform=" + kPoCL},
             0,
             {"selfTest.passed=true", "decisions.2.value=no",
              "decisions.2.variable=VYRA_OPENCL_FORCE_THREADING", "variables.1.effect=changed",
              "variables.1.explanation~in place of mode 1"}),
        real("the platform cannot share", {"VYRA_OPENCL_PLATFORM=" + kPoCL}, 1,
             {"stop.step=device", "platforms.0.devices.0.accepted=false",
              "stop.reason~does not list cl_khr_gl_sharing", "stop.remedy~libglshare.so"}),
        real("the platform's name is misspelt", {"VYRA_OPENCL_PLATFORM=the pocl projekt"}, 1,
             {"stop.step=platform", "platforms.0.accepted=false", "stop.reason~'the pocl projekt'",
              "stop.remedy~Probably 'The pocl project' is meant"}),
        real("the vendor is not known", {"--device-vendor=74565"}, 1,
             {"stop.step=vendor", "startUp.vendorId=74565", "stop.reason~0x12345",
              "stop.remedy~'The pocl project'"}),
        real("OpenCL is switched off", {"VYRA_DISABLE_OPENCL=0", "VYRA_OPENCL_FORCE_FINNISH=1"}, 1,
             {"stop.step=switch", "stop.reason~'0'", "stop.remedy~unset VYRA_DISABLE_OPENCL",
              "loader.loaded=true", "variables.1.effect=unknown",
              "variables.1.suggestion=VYRA_OPENCL_FORCE_FINISH"}),
        real("there is no OpenCL library", {"LD_LIBRARY_PATH=" INFO_OTHER_OPENCL "/none"}, 1,
             {"stop.step=loader", "stop.reason~libOpenCL.so.1", "stop.remedy~Install",
              "loader.loaded=false"}),
        real("the OpenCL library is incomplete",
             {"LD_LIBRARY_PATH=" INFO_OTHER_OPENCL "/incomplete"}, 1,
             {"stop.step=loader", "stop.reason~lacks functions that every OpenCL has: cl",
              "stop.remedy~Replace", "loader.loaded=false"}),
        real("there is no display", {"-uDISPLAY", "-uWAYLAND_DISPLAY", "-uQT_QPA_PLATFORM"},
             kNoGraphics,
             {"stop.step=renderer", "stop.remedy~xvfb-run", "renderer.usable=false",
              "startUp.attempted=false"}),
        real("the display does not exist", {"DISPLAY=:4711", "QT_QPA_PLATFORM=xcb"}, kNoGraphics,
             {"stop.step=renderer", "stop.reason~could not connect to display"}),
        // Its kernels do nothing.
        scripted("ordinary", {}, 3,
                 {"on=true", "selfTest.milliseconds=null",
                  "selfTest.problem=30000 of 30000 numbers in OpenGL's memory are wrong in "
                  "evaluation 1"}),
        scripted("no-buffer", {}, 3,
                 {"selfTest.status.code=-60", "selfTest.status.name=CL_INVALID_GL_OBJECT"}),
        scripted("no-platform", {}, 1,
                 {"stop.step=platform", "stop.reason~no OpenCL platform", "stop.remedy~Install"}),
        scripted("two-platforms", {}, 3,
                 {"platforms.0.accepted=true",
                  "platforms.1.rejection=another platform of the same vendor comes first"}),
        scripted("cpu", {}, 1, {"stop.step=device", "stop.reason~no GPUs: Scripted GPU (CPU)"}),
        scripted("context-unknown", {}, 1,
                 {"stop.step=device", "stop.status.code=-1000",
                  "stop.reason~CL_INVALID_GL_SHAREGROUP_REFERENCE_KHR (-1000)"}),
        scripted("refused-driver", {kNVIDIA}, 1,
                 {"stop.step=driver", "stop.reason~365.10",
                  "stop.remedy~VYRA_OPENCL_IGNORE_DRIVER_VERSION=1",
                  "platforms.0.devices.0.rejection=the GPU's driver is refused",
                  "decisions.4.id=device", "decisions.5=undefined"}),
        scripted("refused-driver", {kNVIDIA, "VYRA_OPENCL_IGNORE_DRIVER_VERSION=0"}, 3,
                 {"variables.0.effect=changed", "decisions.5.id=driver",
                  "decisions.5.variable=VYRA_OPENCL_IGNORE_DRIVER_VERSION"}),
        scripted("old-driver", {kNVIDIA}, 3,
                 {"decisions.3.value=no", "decisions.8.id=opencl-to-graphics",
                  "decisions.8.value=event query (2)"}),
        // With a status of no header.
        scripted("no-context", {kNVIDIA}, 1,
                 {"stop.step=context", "stop.status.code=-9999", "stop.status.name=null",
                  "stop.reason~-9999", "startUp.warnings.0.status.code=-9999"}),
        // Questions to the device fail, which stops start-up without a message.
        scripted("no-driver-version", {kNVIDIA}, 1,
                 {"stop.step=driver", "stop.reason~CL_INVALID_VALUE (-30)",
                  "stop.remedy~update it"}),
        scripted("no-device-type", {}, 1,
                 {"stop.step=availability", "stop.status.code=-30", "stop.reason~does not answer"}),
        scripted("no-float-config", {}, 1,
                 {"stop.step=double-precision", "stop.status.code=-30",
                  "stop.reason~does not tell"}),
        scripted("no-acquire", {}, 1,
                 {"stop.step=sharing-functions", "stop.reason~clEnqueueAcquireGLObjects",
                  "loader.missingSharing.0=clEnqueueAcquireGLObjects"}),
        scripted("unavailable", {}, 1,
                 {"stop.step=availability", "platforms.0.devices.0.available=false"}),
        scripted("no-double", {"VYRA_OPENCL_OFF_WITHOUT_DOUBLE_SUPPORT=1"}, 1,
                 {"stop.step=double-precision", "variables.0.effect=changed"}),
        // A forced mode is overridden.
        scripted("no-gl-event", {"VYRA_OPENCLTOGRAPHICS_SYNC_MODE=1"}, 3,
                 {"variables.0.effect=none", "variables.0.explanation~lacks the means",
                  "decisions.8.value=event query (2)"}),
        scripted("no-queue", {}, 1,
                 {"stop.step=queue", "stop.status.name=CL_INVALID_QUEUE_PROPERTIES"})));

// Nothing is changed on the machine, and nothing depends on chance; no times are told here.
TEST(Info, TellsTheSameTwice)
{
    const Settings settings = scripted("ordinary", {"--json"}, 3, {}).settings;
    const QByteArray first = runInfo(settings).output;
    EXPECT_EQ(first, runInfo(settings).output);
    EXPECT_FALSE(first.isEmpty());
}

TEST(Info, WrongOptionsGetASentence)
{
    const InfoRun run = runInfo({"--jsn"});
    EXPECT_EQ(run.exitCode, 2);
    EXPECT_EQ(run.output, QByteArray());
    EXPECT_EQ(run.errors, QByteArray("vyra-opencl-info: there is no option '--jsn'; see "
                                     "vyra-opencl-info --help\n"));
}

} // namespace
