#include "standalone/OpenCLPlatforms.h"

#include "loader/OpenCLLibraryName.h"
#include "runtime/EnvironmentVariables.h"

#include <algorithm>

#include <CL/cl.h>
#include <QDir>
#include <QFileInfo>
#include <QLibrary>
#include <QOpenGLContext>
#include <QOpenGLFunctions>
#include <QString>
#include <QStringList>

namespace {

constexpr char kSharingExtension[] = "cl_khr_gl_sharing";

struct Adapter {
    std::string_view mark; // in either text
    unsigned pciId;
};

// Vendors' own drivers name themselves in GL_VENDOR, Mesa's name the hardware in GL_RENDERER.
constexpr Adapter kAdapters[] = {
    {"NVIDIA", 0x10DE}, {"ATI Technologies", 0x1002}, {"AMD", 0x1002}, {"Radeon", 0x1002},
    {"Intel", 0x8086},
};

// Mesa's software renderers may name the CPU that they run on, an AMD or Intel one.
constexpr std::string_view kSoftwareRenderers[] = {"llvmpipe", "softpipe", "swrast", "Software"};

bool contains(std::string_view text, std::string_view part)
{
    return text.find(part) != std::string_view::npos;
}

template <typename Function>
bool resolve(QLibrary& library, const char* name, Function& function)
{
    function = reinterpret_cast<Function>(library.resolve(name));
    return function != nullptr;
}

// The functions of the OpenCL library that are called here, which stays loaded.
struct Functions {
    decltype(&::clGetPlatformIDs) platformIds = nullptr;
    decltype(&::clGetPlatformInfo) platformInfo = nullptr;
    decltype(&::clGetDeviceIDs) deviceIds = nullptr;

    bool load()
    {
        QLibrary library(kOpenCLLibraryName);
        return library.load() && resolve(library, "clGetPlatformIDs", platformIds) &&
               resolve(library, "clGetPlatformInfo", platformInfo) &&
               resolve(library, "clGetDeviceIDs", deviceIds);
    }

    // Empty if the question fails.
    std::string text(cl_platform_id platform, cl_platform_info name) const
    {
        std::size_t size = 0;
        if (platformInfo(platform, name, 0, nullptr, &size) != CL_SUCCESS || size == 0)
            return {};
        std::string value(size, '\0');
        if (platformInfo(platform, name, size, value.data(), nullptr) != CL_SUCCESS)
            return {};
        value.resize(size - 1); // without the terminator
        return value;
    }

    unsigned deviceCount(cl_platform_id platform) const
    {
        cl_uint count = 0;
        const cl_int status = deviceIds(platform, CL_DEVICE_TYPE_ALL, 0, nullptr, &count);
        return status == CL_SUCCESS ? count : 0;
    }
};

std::string glText(QOpenGLContext& context, unsigned name)
{
    const auto* text = context.functions()->glGetString(name);
    return text ? reinterpret_cast<const char*>(text) : "";
}

// The vendor of the platforms that share; empty if there is none or several.
std::string sharingVendor()
{
    std::string vendor;
    for (const OpenCLPlatform& platform : openCLPlatforms()) {
        if (!platform.sharesWithOpenGL || platform.vendor == vendor)
            continue;
        if (!vendor.empty())
            return {};
        vendor = platform.vendor;
    }
    return vendor;
}

} // namespace

std::vector<OpenCLPlatform> openCLPlatforms()
{
    Functions cl;
    cl_uint count = 0;
    if (!cl.load() || cl.platformIds(0, nullptr, &count) != CL_SUCCESS || count == 0)
        return {};
    std::vector<cl_platform_id> ids(count);
    if (cl.platformIds(count, ids.data(), nullptr) != CL_SUCCESS)
        return {};
    std::vector<OpenCLPlatform> platforms;
    platforms.reserve(count);
    for (cl_platform_id id : ids)
        platforms.push_back({cl.text(id, CL_PLATFORM_VENDOR), cl.text(id, CL_PLATFORM_NAME),
                             contains(cl.text(id, CL_PLATFORM_EXTENSIONS), kSharingExtension),
                             cl.deviceCount(id)});
    return platforms;
}

std::vector<std::string> missingOpenCLLayers()
{
    std::vector<std::string> missing;
    const QStringList layers =
        qEnvironmentVariable("OPENCL_LAYERS").split(QDir::listSeparator(), Qt::SkipEmptyParts);
    for (const QString& layer : layers) {
        if (QDir::fromNativeSeparators(layer).contains('/') && !QFileInfo(layer).isFile())
            missing.push_back(layer.toStdString());
    }
    return missing;
}

std::optional<unsigned> adapterVendorId(std::string_view glVendor, std::string_view glRenderer)
{
    if (std::any_of(
            std::begin(kSoftwareRenderers), std::end(kSoftwareRenderers),
            [glRenderer](std::string_view software) { return contains(glRenderer, software); }))
        return std::nullopt;
    for (const Adapter& adapter : kAdapters) {
        if (contains(glVendor, adapter.mark) || contains(glRenderer, adapter.mark))
            return adapter.pciId;
    }
    return std::nullopt;
}

unsigned chooseOpenCLPlatform(QOpenGLContext& context)
{
    const std::optional<unsigned> id =
        adapterVendorId(glText(context, GL_VENDOR), glText(context, GL_RENDERER));
    if (!id && !qEnvironmentVariableIsSet(kPlatformVariable)) {
        const std::string vendor = sharingVendor();
        if (!vendor.empty())
            qputenv(kPlatformVariable, QByteArray::fromStdString(vendor));
    }
    return id.value_or(0);
}
