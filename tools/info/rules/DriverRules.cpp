#include "tools/info/rules/DriverRules.h"

#include <exception>

namespace info {

std::optional<DriverVerdict> judgeChosenDriver(const Diagnostics& diagnostics,
                                               std::optional<int> ignoreVersion)
{
    const Device* device = chosenDevice(diagnostics);
    if (diagnostics.startUp.provider != kNVIDIAProvider || !device)
        return std::nullopt;
    try {
        return judgeDriver(parseDriverVersion(device->driverVersion), ignoreVersion);
    } catch (const std::exception&) {
        return std::nullopt;
    }
}

} // namespace info
