#include "StartUpCase.h"

#include "runtime/InteropFunctions.h"

namespace scripted {

std::string listing(const Machine& machine, std::size_t taken)
{
    std::string text =
        "Detected " + std::to_string(machine.platforms.size()) + " OpenCL Platforms: \n";
    for (std::size_t i = 0; i < machine.platforms.size(); ++i) {
        const PlatformScript& p = machine.platforms[i];
        text +=
            ' ' + std::to_string(i) + ": " + p.vendor + ". " + p.name + ". " + p.version + ".\n";
        text += " Supported extensions: " + p.extensions + " \n";
        if (i == taken)
            text += " Selected matching OpenCL Platform: " + p.vendor + ' ' + p.name + ' ' +
                    p.version + ".\n";
    }
    return text;
}

void StartUp::onVendor(const char* vendor, OpenCLProvider expectedProvider, unsigned id)
{
    platform().vendor = vendor;
    arguments.vendorId = id;
    provider = expectedProvider;
    asyncReadback = provider == kAMDProvider || provider == kIntelProvider;
}

void StartUp::onNVIDIA(const char* driver)
{
    onVendor("NVIDIA Corporation", kNVIDIAProvider, 0x10DE);
    firstDevice().driverVersion = driver;
    minimumBufferSize = 2000;
    asyncReadback = true;
    threadedSharing = false;
}

void StartUp::onDirect3D(const char* extensions)
{
    arguments.usingDX = true;
    platform().extensions = extensions;
    threadedSharing = true;
    lookUps = {kForceThreading};
    table = "devices create pending final";
}

// The row's last platform is the requested one; the first platform of its vendor is chosen.
std::string StartUp::platformText() const
{
    std::size_t taken = 0;
    while (taken < machine.platforms.size() &&
           machine.platforms[taken].vendor != machine.platforms.back().vendor)
        ++taken;
    return kAttempt + listing(machine, taken) + "OpenCL evaluator choosing OpenCL platform " +
           machine.platforms.back().vendor + ".\n";
}

std::string StartUp::wholeText() const
{
    return platformText() + kReported + "\n";
}

void StartUp::stopsBeforePlatform(const std::string& text)
{
    stopsBeforeDevice("");
    error = kAttempt + text;
    provider = kUnknownProvider;
    minimumBufferSize = 0;
    modes = {3, 4};
    table = "";
}

void StartUp::stopsBeforeDevice(const std::string& text)
{
    stopsWithContext("");
    error = machine.platforms.empty() ? text : platformText() + text;
    device = "null";
    asyncReadback = false;
    modes = arguments.usingDX ? std::pair{1, 1} : std::pair{3, 4};
    left = {};
    lookUps = {kForceThreading};
    table = arguments.usingDX ? "devices create pending" : "";
}

void StartUp::stopsWithContext(const std::string& text)
{
    error = machine.platforms.empty() ? text : platformText() + text;
    valid = false;
    doublePrecision = false;
    computeUnits = 0;
    left = {"context#1 x1"};
}

void StartUp::withoutDoublePrecision()
{
    doublePrecision = false;
    lookUps.emplace_back("asInt32(VYRA_OPENCL_OFF_WITHOUT_DOUBLE_SUPPORT, 0)");
}

void StartUp::fails(const std::string& function, unsigned nth)
{
    faults.push_back({.function = function, .nth = nth});
    warnings = {kOutOfResources};
}

namespace {

// Returns the entries of the interop function table that are set; those of a pair are set together.
std::string interopTable()
{
    std::string names = sfGetDeviceIDsFromD3D11 ? " devices" : "";
    names += sfCreateSharedCLBuffer ? " create" : "";
    if (sfPendingEnqueueAcquireSharedObjects && sfPendingEnqueueReleaseSharedObjects)
        names += " pending";
    if (sfEnqueueAcquireSharedObjects && sfEnqueueReleaseSharedObjects)
        names += " final";
    return names.substr(names.empty() ? 0 : 1);
}

} // namespace

TEST_P(StartUpRows, InitializePrintsReturnsAndSetsExpectedState)
{
    StartUp expected;
    GetParam().set(expected);
    machine = expected.machine;
    arguments = expected.arguments;
    for (const auto& [name, value] : expected.environment)
        setEnvironment(name, value);
    faults = expected.faults;
    if (expected.prepareHost)
        expected.prepareHost();

    EXPECT_EQ(startWatched(), expected.valid);
    const Lines lookUps = calls();
    EXPECT_EQ(lookUps.back() == "initializeOffset()", expected.computeUnits != 0);
    EXPECT_EQ(linesOf(lookUps, "VyraGetEnv", "asInt32"), expected.lookUps);
    EXPECT_EQ(interopTable(), expected.table);

    EXPECT_EQ(printedError, expected.error ? *expected.error : expected.wholeText());
    EXPECT_EQ(printedOutput, expected.output);
    EXPECT_EQ(warnings(), expected.warnings);
    EXPECT_EQ(runtime().takeMisuse(), expected.misuse);
    EXPECT_EQ(leftByStart, expected.left);
    EXPECT_EQ(TopenCLInfo::isValid(), expected.valid);
    EXPECT_EQ(info().openCLProvider(), expected.provider);
    EXPECT_EQ(info().computeUnitCount(), expected.computeUnits);
    EXPECT_EQ(info().minimumBufferSize(), expected.minimumBufferSize);
    EXPECT_EQ(info().supportsAsyncReadback(), expected.asyncReadback);
    EXPECT_EQ(info().platformSupportsDoublePrecision(), expected.doublePrecision);
    EXPECT_EQ(runtime().name(info().openCLDevice()), expected.device);
    EXPECT_EQ(info().graphicsToCLSyncMode(), expected.modes.first);
    EXPECT_EQ(info().clToGraphicsSyncMode(), expected.modes.second);
    EXPECT_EQ(info().useGLFinish(), expected.modes.first == 3 && !expected.arguments.usingDX);
    EXPECT_EQ(info().usingGLCoreProfile(), expected.arguments.usingGLCoreProfile);
    EXPECT_EQ(info().useCLFinish(), expected.modes.second == 4);
    EXPECT_EQ(info().supportsThreadedSharing(), expected.threadedSharing);
}

} // namespace scripted
