#include "core/api/Settings.h"

#include "core/api/VariableNames.h"

#include <cstdlib>
#include <string_view>

namespace glshare {

namespace {

bool theHostMemoryIsForbidden = false;

bool isSetTo(const char* variable, std::string_view value)
{
    const char* text = std::getenv(variable);
    return text != nullptr && text == value;
}

} // namespace

const Settings& settings()
{
    static const Settings theSettings{!isSetTo(kGlEventVariable, "0"),
                                      !isSetTo(kCpuAsGpuVariable, "0"),
                                      isSetTo(kZeroCopyVariable, "1")};
    return theSettings;
}

void forbidHostMemory() noexcept
{
    theHostMemoryIsForbidden = true;
}

bool isHostMemoryAllowed() noexcept
{
    return !theHostMemoryIsForbidden;
}

} // namespace glshare
