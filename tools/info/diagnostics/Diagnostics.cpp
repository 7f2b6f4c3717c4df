#include "tools/info/diagnostics/Diagnostics.h"

#include <algorithm>

namespace info {

const std::string* Environment::find(const std::string& name) const
{
    for (const Variable& variable : variables) {
        if (variable.name == name)
            return &variable.value;
    }
    return nullptr;
}

const Platform* chosenPlatform(const Diagnostics& diagnostics)
{
    const auto found = std::find_if(diagnostics.platforms.begin(), diagnostics.platforms.end(),
                                    [](const Platform& platform) { return platform.chosen; });
    return found != diagnostics.platforms.end() ? &*found : nullptr;
}

const Device* chosenDevice(const Diagnostics& diagnostics)
{
    const Platform* platform = chosenPlatform(diagnostics);
    if (!platform)
        return nullptr;
    const auto found = std::find_if(platform->devices.begin(), platform->devices.end(),
                                    [](const Device& device) { return device.chosen; });
    return found != platform->devices.end() ? &*found : nullptr;
}

bool listsExtension(const std::string& extensions, const char* name)
{
    return extensions.find(name) != std::string::npos;
}

} // namespace info
