#include "tools/info/rules/StartUpFailure.h"

#include "tools/info/rules/FailureTexts.h"
#include "tools/info/text/StatusCodes.h"

#include <algorithm>

namespace info {
namespace {

constexpr StepText kStepTexts[] = {
    {StartUpStep::kNotStarted, "renderer", "an OpenGL renderer", "there is no OpenGL renderer"},
    {StartUpStep::kSwitch, "switch", "OpenCL is not switched off", "it is switched off"},
    {StartUpStep::kLoader, "loader", "the OpenCL library", "the OpenCL library cannot be loaded"},
    {StartUpStep::kVendor, "vendor", "a vendor to look for", "the vendor to look for is unknown"},
    {StartUpStep::kPlatform, "platform", "a platform of that vendor",
     "no platform has the vendor that is looked for"},
    {StartUpStep::kDevice, "device", "a GPU that shares with OpenGL",
     "no GPU shares buffers with OpenGL"},
    {StartUpStep::kDriver, "driver", "a driver whose OpenCL works", "the GPU's driver is refused"},
    {StartUpStep::kContext, "context", "a context on the device",
     "no context can be created on the device"},
    {StartUpStep::kSharingFunctions, "sharing-functions", "the functions for shared buffers",
     "functions for shared buffers are missing"},
    {StartUpStep::kAvailability, "availability", "the device is available",
     "the device is not available"},
    {StartUpStep::kDoublePrecision, "double-precision", "double precision, if required",
     "double precision is required and missing"},
    {StartUpStep::kQueue, "queue", "a command queue", "no command queue can be created"},
};

StartUpStep failedStep(const Diagnostics& diagnostics)
{
    const StartUpStep step = diagnostics.startUp.lastStep;
    // On a machine without a platform, every vendor would have failed.
    const bool noPlatform = diagnostics.loader.loaded && diagnostics.platforms.empty();
    return step == StartUpStep::kVendor && noPlatform ? StartUpStep::kPlatform : step;
}

// Returns the status of the first call that failed in the step that stopped.
std::optional<int> failedStatus(const StartUp& startUp)
{
    const auto failed =
        std::find_if(startUp.warnings.begin(), startUp.warnings.end(), [&](const Warning& warning) {
            return warning.status != CL_SUCCESS && warning.step == startUp.lastStep;
        });
    return failed != startUp.warnings.end() ? std::optional<int>(failed->status) : std::nullopt;
}

} // namespace

std::span<const StepText> stepTexts() noexcept
{
    return kStepTexts;
}

const StepText& stepText(StartUpStep step) noexcept
{
    return *std::find_if(std::begin(kStepTexts), std::end(kStepTexts) - 1,
                         [step](const StepText& text) { return text.step == step; });
}

std::optional<StartUpFailure> findStartUpFailure(const Diagnostics& diagnostics)
{
    if (diagnostics.startUp.valid)
        return std::nullopt;
    StartUpFailure failure{failedStep(diagnostics), failedStatus(diagnostics.startUp), "", ""};
    explainFailure(diagnostics, failure);
    if (failure.status)
        failure.reason += " The call that failed returned " + describeStatus(*failure.status) + ".";
    return failure;
}

} // namespace info
