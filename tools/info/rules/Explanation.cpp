#include "tools/info/rules/Explanation.h"

#include "tools/info/text/TextFormatting.h"

#include <utility>

namespace info {
namespace {

ExitCode exitCodeOf(const Explanation& explanation)
{
    if (explanation.failure)
        return explanation.failure->step == StartUpStep::kNotStarted ? ExitCode::kNoGraphics
                                                                     : ExitCode::kOff;
    const std::optional<SelfTest>& test = explanation.diagnostics.selfTest;
    return test && test->passed ? ExitCode::kOn : ExitCode::kSelfTestFailed;
}

std::string summaryOf(const Explanation& explanation)
{
    if (explanation.failure) {
        const Diagnostics& diagnostics = explanation.diagnostics;
        const bool noPlatform =
            explanation.failure->step == StartUpStep::kPlatform && diagnostics.platforms.empty();
        return std::string("OpenCL is off: ") +
               (noPlatform ? "this machine has no OpenCL platform"
                           : stepText(explanation.failure->step).failure) +
               ".";
    }
    const Platform* platform = chosenPlatform(explanation.diagnostics);
    const Device* device = chosenDevice(explanation.diagnostics);
    const std::string where = " (" + (device ? device->name : "unknown device") + " of " +
                              (platform ? platform->vendor : "unknown vendor") + ")";
    return explanation.exitCode == ExitCode::kOn
               ? "OpenCL is on" + where + ", and the self-test passed."
               : "OpenCL is on" + where + ", but the self-test failed.";
}

} // namespace

Explanation explain(Diagnostics diagnostics)
{
    Explanation explanation;
    explanation.diagnostics = std::move(diagnostics);
    explanation.failure = findStartUpFailure(explanation.diagnostics);
    explanation.decisions = explainDecisions(explanation.diagnostics);
    explanation.variables = explainVariables(explanation.diagnostics);
    explanation.exitCode = exitCodeOf(explanation);
    explanation.summary = summaryOf(explanation);
    return explanation;
}

} // namespace info
