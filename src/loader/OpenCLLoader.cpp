#include "loader/OpenCLLoader.h"

#include "loader/OpenCLLibraryName.h"
#include "loader/SharedLibrary.h"

constinit OpenCLEntryPoints ocl;

namespace {

// Fills `entry` and returns whether it was found.
template <typename Function>
bool resolve(void* library, const char* name, Function& entry)
{
    void* address = findSymbol(library, name);
    if (!address && ocl.clGetExtensionFunctionAddress)
        address = ocl.clGetExtensionFunctionAddress(name);
    entry = reinterpret_cast<Function>(address);
    return entry != nullptr;
}

} // namespace

OpenCLLoadStatus loadOpenCL()
{
    void* library = openSharedLibrary(kOpenCLLibraryName);
    if (!library)
        return OpenCLLoadStatus::kNoLibrary;

    // First, since it may resolve the others.
    resolve(library, "clGetExtensionFunctionAddress", ocl.clGetExtensionFunctionAddress);

    bool complete = true;
#define VYRA_RESOLVE_CORE(entry) complete = resolve(library, #entry, ocl.entry) && complete;
#define VYRA_RESOLVE(entry) resolve(library, #entry, ocl.entry);
#define VYRA_RESOLVE_TYPED(type, entry) resolve(library, #entry, ocl.entry);
    VYRA_OPENCL_CORE_ENTRY_POINTS(VYRA_RESOLVE_CORE)
    VYRA_OPENCL_GL_ENTRY_POINTS(VYRA_RESOLVE)
    VYRA_OPENCL_D3D11_ENTRY_POINTS(VYRA_RESOLVE_TYPED)
#undef VYRA_RESOLVE_CORE
#undef VYRA_RESOLVE
#undef VYRA_RESOLVE_TYPED

    return complete ? OpenCLLoadStatus::kLoaded : OpenCLLoadStatus::kNoCoreEntryPoint;
}
