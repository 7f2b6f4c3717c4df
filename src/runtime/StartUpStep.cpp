#include "runtime/StartUpStep.h"

namespace {

constinit StartUpStep sfStartUpStep = StartUpStep::kNotStarted;

} // namespace

StartUpStep startUpStep() noexcept
{
    return sfStartUpStep;
}

void enterStartUpStep(StartUpStep step) noexcept
{
    sfStartUpStep = step;
}
