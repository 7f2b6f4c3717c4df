#include "host/Application.h"

#include "standalone/system/Platform.h"

#include <filesystem>
#include <string>
#include <system_error>

namespace {

// Returns the resources installed next to this library if they exist, else those of the source
// tree.
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

// Returns a path without a trailing separator. Kernel sources are <resources>/kernels/NAME.cl.
Tstring TappLocale::getResourcesLocation()
{
    static const std::string resources = findResources();
    return Tstring(resources.c_str());
}
