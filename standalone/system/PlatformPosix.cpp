#include "standalone/system/Platform.h"

#include <dlfcn.h>

#include <system_error>

namespace vyra::host {

void* symbolOfLoadedLibrary(const char* name, const char* symbol)
{
    void* const library = dlopen(name, RTLD_NOLOAD | RTLD_LAZY);
    if (library == nullptr) {
        return nullptr;
    }
    void* const address = dlsym(library, symbol);
    // Releases the reference of dlopen; the user of the library keeps it loaded.
    dlclose(library);
    return address;
}

std::filesystem::path fileOfThisLibrary()
{
    static const char addressInThisLibrary = 0;
    Dl_info info = {};
    if (dladdr(&addressInThisLibrary, &info) == 0 || info.dli_fname == nullptr) {
        return {};
    }
    std::error_code error;
    return std::filesystem::canonical(info.dli_fname, error);
}

} // namespace vyra::host
