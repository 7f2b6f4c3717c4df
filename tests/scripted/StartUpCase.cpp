#include "StartUpCase.h"

namespace scripted {

std::string listing(const World& world, std::size_t taken)
{
    std::string text =
        "Detected " + std::to_string(world.platforms.size()) + " OpenCL Platforms: \n";
    for (std::size_t i = 0; i < world.platforms.size(); ++i) {
        const PlatformScript& p = world.platforms[i];
        text +=
            ' ' + std::to_string(i) + ": " + p.vendor + ". " + p.name + ". " + p.version + ".\n";
        text += " Supported extensions: " + p.extensions + " \n";
        if (i == taken)
            text += " Selected matching OpenCL Platform: " + p.vendor + ' ' + p.name + ' ' +
                    p.version + ".\n";
    }
    return text;
}

std::string StartUp::platformText(const std::string& vendor) const
{
    std::size_t taken = 0;
    while (taken < world.platforms.size() && world.platforms[taken].vendor != vendor)
        ++taken;
    return kAttempt + listing(world, taken) + "OpenCL evaluator choosing OpenCL platform " +
           vendor + ".\n";
}

std::string StartUp::deviceText(const std::string& name) const
{
    return "Choosing OpenCL Device " + name + ".  Device Type: GPU  Device is available.\n\n";
}

void StartUp::stopsBeforePlatform(const std::string& text)
{
    stopsBeforeDevice("");
    error = kAttempt + text;
    provider = kUnknownProvider;
    minimumBufferSize = 0;
}

void StartUp::stopsBeforeDevice(const std::string& text)
{
    stopsWithContext("");
    error = platformText(world.platforms.empty() ? "" : world.platforms[0].vendor) + text;
    device = "null";
    asyncReadback = false;
    modes = arguments.usingDX ? std::pair{1, 1} : std::pair{3, 4};
    left = {};
}

void StartUp::stopsWithContext(const std::string& text)
{
    error = platformText(world.platforms[0].vendor) + text;
    valid = false;
    doublePrecision = false;
    left = {"context#1 x1"};
}

void StartUp::fails(const std::string& function, unsigned nth)
{
    faults.push_back({.function = function, .nth = nth});
    warnings = {kOutOfResources};
}

void StartUpTest::run(const StartUp& expected)
{
    world = expected.world;
    arguments = expected.arguments;
    for (const auto& [name, value] : expected.environment)
        setEnvironment(name, value);
    faults = expected.faults;

    EXPECT_EQ(startWatched(), expected.valid);

    EXPECT_EQ(printedError, expected.error);
    EXPECT_EQ(printedOutput, expected.output);
    EXPECT_EQ(warnings(), expected.warnings);
    EXPECT_EQ(leftByStart, expected.left);
    const TopenCLInfo& info = TopenCLInfo::theOne();
    EXPECT_EQ(TopenCLInfo::isValid(), expected.valid);
    EXPECT_EQ(info.openCLProvider(), expected.provider);
    EXPECT_EQ(info.minimumBufferSize(), expected.minimumBufferSize);
    EXPECT_EQ(info.supportsAsyncReadback(), expected.asyncReadback);
    EXPECT_EQ(info.platformSupportsDoublePrecision(), expected.doublePrecision);
    EXPECT_EQ(runtime().name(info.openCLDevice()), expected.device);
    EXPECT_EQ(info.graphicsToCLSyncMode(), expected.modes.first);
    EXPECT_EQ(info.clToGraphicsSyncMode(), expected.modes.second);
    for (const std::string& note : expected.misuse)
        expectMisuse(note);
}

} // namespace scripted
