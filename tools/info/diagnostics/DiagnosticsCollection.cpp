#include "tools/info/diagnostics/DiagnosticsCollection.h"

#include "host/Environment.h"
#include "runtime/EnvironmentVariables.h"
#include "standalone/OpenCLPlatforms.h"
#include "tools/info/diagnostics/Platform.h"
#include "tools/info/diagnostics/PlatformSurvey.h"
#include "tools/info/diagnostics/RenderWindow.h"
#include "tools/info/diagnostics/StartUpRun.h"
#include "tools/info/diagnostics/WarningLog.h"

#include <algorithm>
#include <cctype>
#include <cstdlib>
#include <string_view>

namespace info {
namespace {

// Variables of other components that select the OpenCL and the OpenGL in use. A name without "=" is
// a prefix.
constexpr std::string_view kSelectingVariables[] = {
    "OCL_ICD_",
    "OPENCL_LAYERS=",
    "OPENCL_VENDOR_PATH=",
    "POCL_DEVICES=",
    "DRI_PRIME=",
    "__NV_PRIME_RENDER_OFFLOAD=",
    "__GLX_VENDOR_LIBRARY_NAME=",
    "LIBGL_ALWAYS_SOFTWARE=",
    "CUDA_VISIBLE_DEVICES=",
};

// Compares without regard to case, since a name in the wrong case is worth a report. `prefix` is in
// upper case.
bool startsWith(std::string_view entry, std::string_view prefix)
{
    return entry.size() >= prefix.size() &&
           std::equal(prefix.begin(), prefix.end(), entry.begin(), [](char expected, char found) {
               return std::toupper(static_cast<unsigned char>(found)) == expected;
           });
}

bool isOfInterest(std::string_view entry)
{
    return startsWith(entry, "VYRA_") || startsWith(entry, "GLSHARE_") ||
           std::any_of(std::begin(kSelectingVariables), std::end(kSelectingVariables),
                       [entry](std::string_view prefix) { return entry.starts_with(prefix); });
}

std::vector<Variable> variablesOfInterest()
{
    std::vector<Variable> variables;
    for (const std::string_view text : environmentEntries()) {
        const std::size_t equals = text.find('=');
        if (equals == std::string_view::npos || !isOfInterest(text))
            continue;
        variables.push_back(
            {std::string(text.substr(0, equals)), std::string(text.substr(equals + 1))});
    }
    std::sort(variables.begin(), variables.end(),
              [](const Variable& one, const Variable& other) { return one.name < other.name; });
    return variables;
}

// Reads the variable as the library does.
std::optional<int> readIgnoreDriverVersion()
{
    const char* value = std::getenv(kIgnoreDriverVersionVariable);
    return value ? std::optional<int>(std::atoi(value)) : std::nullopt;
}

Environment readEnvironment(bool platformFromOption)
{
    Environment environment;
    environment.variables = variablesOfInterest();
    environment.platformFromOption = platformFromOption;
    environment.syncModes = readSyncModeVariables();
    environment.ignoreDriverVersion = readIgnoreDriverVersion();
    environment.requireDoublePrecision = TenvironmentVariable(kOffWithoutDoubleVariable).asInt32(0);
    return environment;
}

} // namespace

Diagnostics collectDiagnostics(const Options& options, RenderWindow& window, WarningLog& warnings)
{
    if (options.platform)
        setEnvironmentVariable(kPlatformVariable, *options.platform);
    Diagnostics diagnostics;
    diagnostics.environment = readEnvironment(options.platform.has_value());
    diagnostics.renderer = window.renderer();
    const bool isOpen = !options.deviceVendor && !diagnostics.environment.find(kPlatformVariable);
    if (diagnostics.renderer.usable && isOpen) {
        chooseOpenCLPlatform(window.context());
        diagnostics.environment.platformWasChosen = std::getenv(kPlatformVariable) != nullptr;
    }
    const unsigned adapter = diagnostics.renderer.adapterVendorId.value_or(0);
    const unsigned vendorId = options.deviceVendor.value_or(adapter);
    diagnostics.startUp = runStartUp(window, vendorId, warnings);
    diagnostics.wantedVendor = wantedVendor(vendorId);
    diagnostics.loader = surveyLoader();
    diagnostics.loader.missingLayers = missingOpenCLLayers();
    surveyPlatforms(window, diagnostics);
    return diagnostics;
}

} // namespace info
