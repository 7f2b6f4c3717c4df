#include "core/api/OpenCl.h"

namespace glshare {

namespace {
cl_icd_dispatch theRuntime{};
}

const cl_icd_dispatch& runtime()
{
    return theRuntime;
}

void setRuntime(const cl_icd_dispatch& table)
{
    theRuntime = table;
}

} // namespace glshare
