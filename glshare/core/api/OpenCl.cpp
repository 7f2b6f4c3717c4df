#include "core/api/OpenCl.h"

namespace glshare {

namespace {
cl_icd_dispatch theRuntime{};
}

const cl_icd_dispatch& runtime() noexcept
{
    return theRuntime;
}

void setRuntime(const cl_icd_dispatch& table) noexcept
{
    theRuntime = table;
}

} // namespace glshare
