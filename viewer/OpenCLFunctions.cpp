#include "viewer/OpenCLFunctions.h"

#include "loader/OpenCLLibraryName.h"

#include <QLibrary>

namespace viewer {
namespace {

template <typename Function>
bool resolve(QLibrary& library, const char* name, Function& function)
{
    function = reinterpret_cast<Function>(library.resolve(name));
    return function != nullptr;
}

bool resolveAll(QLibrary& library, OpenCLFunctions& cl)
{
    return resolve(library, "clGetPlatformIDs", cl.clGetPlatformIDs) &&
           resolve(library, "clGetPlatformInfo", cl.clGetPlatformInfo) &&
           resolve(library, "clGetDeviceInfo", cl.clGetDeviceInfo);
}

} // namespace

Result<OpenCLFunctions> loadOpenCLFunctions()
{
    QLibrary library(kOpenCLLibraryName);
    OpenCLFunctions cl;
    if (!library.load() || !resolveAll(library, cl))
        return Failure{ExitCode::kNoOpenCL,
                       "there is no OpenCL on this machine; install an OpenCL driver (on Debian "
                       "without a GPU: pocl-opencl-icd), or use --allow-cpu"};
    return cl;
}

} // namespace viewer
