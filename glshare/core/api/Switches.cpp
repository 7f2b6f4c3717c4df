#include "core/api/Switches.h"

#include <cstdlib>
#include <string_view>

namespace glshare {

namespace {

bool isHostMemoryForbidden = false;

// Whether the variable is set to `value`.
bool is(const char* variable, std::string_view value)
{
    const char* text = std::getenv(variable);
    return text != nullptr && text == value;
}

} // namespace

void forbidHostMemory()
{
    isHostMemoryForbidden = true;
}

bool isHostMemoryAllowed()
{
    return !isHostMemoryForbidden;
}

const Switches& switches()
{
    static const Switches theSwitches{!is("GLSHARE_GL_EVENT", "0"), !is("GLSHARE_CPU_AS_GPU", "0"),
                                      is("GLSHARE_ZERO_COPY", "1")};
    return theSwitches;
}

} // namespace glshare
