#include "core/Switches.h"

#include <cstdlib>
#include <string_view>

namespace glshare {

namespace {

bool isZeroCopyAllowed = true;

bool isOn(const char* variable)
{
    const char* value = std::getenv(variable);
    return value == nullptr || std::string_view(value) != "0";
}

} // namespace

void forbidZeroCopy()
{
    isZeroCopyAllowed = false;
}

const Switches& switches()
{
    static const Switches theSwitches{isOn("GLSHARE_GL_EVENT"), isOn("GLSHARE_CPU_AS_GPU"),
                                      isZeroCopyAllowed && isOn("GLSHARE_ZERO_COPY")};
    return theSwitches;
}

} // namespace glshare
