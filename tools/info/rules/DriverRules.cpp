#include "tools/info/rules/DriverRules.h"

#include <exception>

namespace info {

std::optional<DriverVerdict> judgeChosenDriver(const Facts& facts, std::optional<int> ignoreVersion)
{
    const Device* device = chosenDevice(facts);
    if (facts.startUp.provider != kNVIDIAProvider || !device)
        return std::nullopt;
    try {
        return judgeDriver(parseDriverVersion(device->driverVersion), ignoreVersion);
    } catch (const std::exception&) {
        return std::nullopt;
    }
}

} // namespace info
