#include "tools/info/rules/Explanation.h"

#include "tools/info/text/TextFormatting.h"

#include <utility>

namespace info {
namespace {

ExitCode exitCodeOf(const Explanation& explanation)
{
    if (explanation.stop)
        return explanation.stop->step == Step::kRenderer ? ExitCode::kNoGraphics : ExitCode::kOff;
    const std::optional<SelfTest>& test = explanation.facts.selfTest;
    return test && test->passed ? ExitCode::kOn : ExitCode::kSelfTestFailed;
}

std::string summaryOf(const Explanation& explanation)
{
    if (explanation.stop) {
        const Facts& facts = explanation.facts;
        const bool noPlatform =
            explanation.stop->step == Step::kPlatform && facts.platforms.empty();
        return std::string("OpenCL is off: ") +
               (noPlatform ? "this machine has no OpenCL platform"
                           : stepName(explanation.stop->step).failure) +
               ".";
    }
    const Platform* platform = chosenPlatform(explanation.facts);
    const Device* device = chosenDevice(explanation.facts);
    const std::string where = " (" + (device ? device->name : "unknown device") + " of " +
                              (platform ? platform->vendor : "unknown vendor") + ")";
    return explanation.exitCode == ExitCode::kOn
               ? "OpenCL is on" + where + ", and the self-test is right."
               : "OpenCL is on" + where + ", but the self-test failed.";
}

} // namespace

Explanation explain(Facts facts)
{
    Explanation explanation;
    explanation.facts = std::move(facts);
    explanation.stop = findStop(explanation.facts);
    explanation.decisions = explainDecisions(explanation.facts);
    explanation.variables = explainVariables(explanation.facts);
    explanation.exitCode = exitCodeOf(explanation);
    explanation.summary = summaryOf(explanation);
    return explanation;
}

} // namespace info
