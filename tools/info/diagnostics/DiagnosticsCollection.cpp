#include "tools/info/diagnostics/DiagnosticsCollection.h"

#include "host/Environment.h"
#include "standalone/OpenCLPlatforms.h"
#include "tools/info/diagnostics/PlatformSurvey.h"
#include "tools/info/diagnostics/RenderWindow.h"
#include "tools/info/diagnostics/StartUpRun.h"
#include "tools/info/diagnostics/WarningLog.h"
#include "tools/info/selftest/SelfTestRun.h"

#include <algorithm>
#include <cctype>
#include <cstdlib>
#include <string_view>

#include <unistd.h>

namespace info {
namespace {

constexpr char kPlatformVariable[] = "VYRA_OPENCL_PLATFORM";

// Not the library's variables: they decide which OpenCL and which OpenGL it meets.
constexpr std::string_view kSteering[] = {
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

// In any case, since one that is written in the wrong case has no effect.
bool startsWith(std::string_view entry, std::string_view prefix)
{
    return entry.size() >= prefix.size() &&
           std::equal(prefix.begin(), prefix.end(), entry.begin(), [](char wanted, char found) {
               return std::toupper(static_cast<unsigned char>(found)) == wanted;
           });
}

bool isOfInterest(std::string_view entry)
{
    return startsWith(entry, "VYRA_") || startsWith(entry, "GLSHARE_") ||
           std::any_of(std::begin(kSteering), std::end(kSteering),
                       [entry](std::string_view prefix) { return entry.starts_with(prefix); });
}

std::vector<Variable> variablesOfInterest()
{
    std::vector<Variable> variables;
    for (char** entry = environ; *entry; ++entry) {
        const std::string_view text = *entry;
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

// As the library reads it.
std::optional<int> readIgnoreDriverVersion()
{
    const char* value = std::getenv("VYRA_OPENCL_IGNORE_DRIVER_VERSION");
    return value ? std::optional<int>(std::atoi(value)) : std::nullopt;
}

Environment readEnvironment(bool platformFromOption)
{
    Environment environment;
    environment.variables = variablesOfInterest();
    environment.platformFromOption = platformFromOption;
    environment.syncModes = readSyncModeVariables();
    environment.ignoreDriverVersion = readIgnoreDriverVersion();
    environment.doubleDemanded =
        TenvironmentVariable("VYRA_OPENCL_OFF_WITHOUT_DOUBLE_SUPPORT").asInt32(0);
    return environment;
}

} // namespace

Facts gatherFacts(const Options& options)
{
    // The variable is how a host's user names a platform, too: there is one way to start the
    // library.
    if (options.platform)
        setenv(kPlatformVariable, options.platform->c_str(), 1);
    Facts facts;
    facts.environment = readEnvironment(options.platform.has_value());

    WarningLog warnings;
    RenderWindow window;
    facts.renderer = window.facts();
    const bool isOpen = !options.deviceVendor && !facts.environment.find(kPlatformVariable);
    if (facts.renderer.usable && isOpen) {
        chooseOpenCLPlatform(window.context());
        facts.environment.platformWasChosen = std::getenv(kPlatformVariable) != nullptr;
    }
    const unsigned adapter = facts.renderer.adapterVendorId.value_or(0);
    const unsigned vendorId = options.deviceVendor.value_or(adapter);
    facts.startUp = runStartUp(window, vendorId, warnings);
    facts.wantedVendor = wantedVendor(vendorId);
    facts.loader = surveyLoader();
    facts.loader.missingLayers = missingOpenCLLayers();
    surveyPlatforms(window, facts);
    if (facts.startUp.valid)
        facts.selfTest = runSelfTest(window, warnings);
    return facts;
}

} // namespace info
