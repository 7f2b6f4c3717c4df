#include "host/Application.h"

#include "standalone/Platform.h"

#include <filesystem>
#include <string>
#include <system_error>

namespace {

// The installed resources beside this library when they are there, else those of the source tree.
std::string findResources()
{
    namespace fs = std::filesystem;
    const fs::path library = vyra::host::fileOfThisLibrary();
    const fs::path installed =
        (library.parent_path() / VYRA_RESOURCES_FROM_LIBRARY).lexically_normal();
    std::error_code error;
    return fs::is_directory(installed, error) ? installed.string() : VYRA_SOURCE_RESOURCES;
}

} // namespace

// Without a trailing separator. Kernel sources are <resources>/kernels/NAME.cl.
Tstring TappLocale::getResourcesLocation()
{
    static const std::string resources = findResources();
    return Tstring(resources.c_str());
}
