#include "tools/info/rules/StartUpFailure.h"

#include "tools/info/rules/FailureTexts.h"
#include "tools/info/text/StatusCodes.h"

#include <algorithm>

namespace info {
namespace {

constexpr StepName kStepNames[] = {
    {Step::kRenderer, "renderer", "an OpenGL renderer", "there is no OpenGL renderer"},
    {Step::kSwitch, "switch", "OpenCL is not switched off", "it is switched off"},
    {Step::kLoader, "loader", "the OpenCL library", "the OpenCL library cannot be loaded"},
    {Step::kVendor, "vendor", "a vendor to look for", "the vendor to look for is not known"},
    {Step::kPlatform, "platform", "a platform of that vendor",
     "no platform has the vendor that is looked for"},
    {Step::kDevice, "device", "a GPU that shares with OpenGL", "no GPU shares buffers with OpenGL"},
    {Step::kDriver, "driver", "a driver whose OpenCL works", "the GPU's driver is refused"},
    {Step::kContext, "context", "a context on the device", "no context can be made on the device"},
    {Step::kSharingFunctions, "sharing-functions", "the functions for shared buffers",
     "functions for shared buffers are missing"},
    {Step::kAvailability, "availability", "the device is available", "the device is not available"},
    {Step::kDoublePrecision, "double-precision", "double precision, where demanded",
     "double precision is demanded and missing"},
    {Step::kQueue, "queue", "a command queue", "no command queue can be made"},
};

// What start-up prints when it stops at a step.
struct StopMessage {
    Step step;
    const char* text;
};

constexpr StopMessage kStopMessages[] = {
    {Step::kSwitch, "OpenCL initialization has been disabled by user"},
    {Step::kLoader, "OpenCL evaluator failed to initialize clew."},
    {Step::kLoader, "CLEW failed to initialize"},
    {Step::kVendor, "OpenCL evaluator encountered an unknown vendor id"},
    {Step::kPlatform, "OpenCL evaluator failed to find OpenCL device with vendor"},
    {Step::kDevice, "OpenCL evaluator is unable to find a GPU device"},
    {Step::kDriver, "OpenCL is not supported by NVidia drivers between version"},
    {Step::kSharingFunctions, "Error: found cl_khr_gl_sharing but failed to get function"},
    {Step::kAvailability, "GL shared device is not available"},
    {Step::kDoublePrecision, "Vyra OpenCL is not supported on device because double precision"},
};

// The last two things that start-up prints when all goes well.
constexpr char kDeviceReported[] = "Device is available.\n";
constexpr char kQueuesMade[] = "Device is available.\n\n";

bool says(const StartUp& startUp, const char* text)
{
    return startUp.output.find(text) != std::string::npos;
}

// A failing query stops without a message: what is there tells how far start-up came.
Step stepOfSilentStop(const Facts& facts)
{
    const StartUp& startUp = facts.startUp;
    if (!startUp.hasDevice)
        return Step::kDevice;
    const Device* device = chosenDevice(facts);
    if (!startUp.hasContext) {
        const bool asksDriver = startUp.provider == kNVIDIAProvider;
        return asksDriver && device && device->driverVersion.empty() ? Step::kDriver
                                                                     : Step::kContext;
    }
    if (says(startUp, kQueuesMade))
        return Step::kQueue;
    return says(startUp, kDeviceReported) ? Step::kDoublePrecision : Step::kAvailability;
}

Step stepOfStop(const Facts& facts)
{
    if (!facts.renderer.usable)
        return Step::kRenderer;
    for (const StopMessage& message : kStopMessages) {
        if (!says(facts.startUp, message.text))
            continue;
        // Without a platform no vendor would have helped.
        const bool noPlatform = facts.loader.loaded && facts.platforms.empty();
        return message.step == Step::kVendor && noPlatform ? Step::kPlatform : message.step;
    }
    return stepOfSilentStop(facts);
}

// The call that failed last is the one that start-up stopped at.
std::optional<int> statusOfStop(const StartUp& startUp)
{
    const auto failed = std::find_if(
        startUp.warnings.rbegin(), startUp.warnings.rend(),
        [](const std::string& warning) { return statusInWarning(warning).has_value(); });
    return failed != startUp.warnings.rend() ? statusInWarning(*failed) : std::nullopt;
}

} // namespace

std::span<const StepName> stepNames()
{
    return kStepNames;
}

const StepName& stepName(Step step)
{
    return kStepNames[static_cast<std::size_t>(step)];
}

std::optional<Stop> findStop(const Facts& facts)
{
    if (facts.startUp.valid)
        return std::nullopt;
    Stop stop{stepOfStop(facts), statusOfStop(facts.startUp), "", ""};
    explainStop(facts, stop);
    if (stop.status)
        stop.reason += " The call that failed returned " + describeStatus(*stop.status) + ".";
    return stop;
}

} // namespace info
