#include "tools/info/diagnostics/OpenCLCalls.h"

#include "loader/OpenCLLibraryName.h"
#include "loader/SharedLibrary.h"

namespace info {
namespace {

template <typename Function>
void resolve(void* library, const char* name, Function& function)
{
    function = reinterpret_cast<Function>(findSymbol(library, name));
}

} // namespace

OpenCLCalls findOpenCLCalls()
{
    OpenCLCalls calls;
    void* library = openSharedLibrary(kOpenCLLibraryName);
    if (!library)
        return calls;
    resolve(library, "clGetDeviceIDs", calls.clGetDeviceIDs);
    return calls;
}

} // namespace info
