// vyra-opencl-info: tells whether the library's OpenCL is on, and why.
#include "tools/info/Options.h"
#include "tools/info/diagnostics/DiagnosticsCollection.h"
#include "tools/info/report/JsonReport.h"
#include "tools/info/report/TextReport.h"

#include <cstdio>

namespace {

int answer(info::ExitCode code)
{
    return static_cast<int>(code);
}

} // namespace

int main(int argc, char* argv[])
{
    std::string problem;
    const std::optional<info::Options> options =
        info::parseOptions(std::vector<std::string>(argv + 1, argv + argc), problem);
    if (!options) {
        std::fprintf(stderr, "vyra-opencl-info: %s; see vyra-opencl-info --help\n",
                     problem.c_str());
        return answer(info::ExitCode::kUsage);
    }
    if (options->help || options->version) {
        std::fputs(options->help ? info::helpText() : "vyra-opencl-info " VYRA_VERSION "\n",
                   stdout);
        return answer(info::ExitCode::kOn);
    }
    const info::Explanation explanation = info::explain(info::gatherFacts(*options));
    const std::string report =
        options->json ? info::jsonReport(explanation) : info::textReport(explanation);
    std::fputs(report.c_str(), stdout);
    return answer(explanation.exitCode);
}
