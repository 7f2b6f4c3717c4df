#include "viewer/OpenCLStart.h"

#include "host/Environment.h"
#include "runtime/TopenCLInfo.h"
#include "standalone/NativeContext.h"
#include "viewer/GraphicsVendor.h"
#include "viewer/OpenCLPlatforms.h"

#include <optional>

#include <QByteArray>
#include <QOpenGLContext>
#include <QOpenGLFunctions>
#include <QOpenGLWindow>

namespace viewer {
namespace {

constexpr char kPlatformVariable[] = "VYRA_OPENCL_PLATFORM";

std::string glText(QOpenGLContext& context, unsigned name)
{
    const auto* text = context.functions()->glGetString(name);
    return text ? reinterpret_cast<const char*>(text) : "";
}

// Sets the variable from which the library takes the platform, where the adapter does not tell it.
Status choosePlatform(const OpenCLFunctions& cl, const std::string& platform, bool adapterIsKnown)
{
    if (!platform.empty()) {
        qputenv(kPlatformVariable, QByteArray::fromStdString(platform));
        return {};
    }
    if (adapterIsKnown || VyraGetEnv(kPlatformVariable))
        return {};
    const Result<std::string> vendor = sharingVendor(openCLPlatforms(cl));
    if (!vendor)
        return vendor.failure();
    qputenv(kPlatformVariable, QByteArray::fromStdString(vendor.value()));
    return {};
}

} // namespace

Status startOpenCL(QOpenGLWindow& window, const OpenCLFunctions& cl, const std::string& platform)
{
    QOpenGLContext& context = *window.context();
    const std::optional<unsigned> vendorId =
        pciVendorId(glText(context, GL_VENDOR), glText(context, GL_RENDERER));
    if (Status failure = choosePlatform(cl, platform, vendorId.has_value()))
        return failure;

    constexpr bool kUsingDirect3D = false;
    constexpr bool kUsingCoreProfile = true;
    // NOLINTNEXTLINE(performance-no-int-to-ptr): the library takes a window's number as a pointer
    void* const nativeWindow = reinterpret_cast<void*>(window.winId());
    if (!TopenCLInfo::initialize(nativeWindow, nativeContext(context), nullptr, kUsingDirect3D,
                                 kUsingCoreProfile, vendorId.value_or(0)))
        return Failure{ExitCode::kNoOpenCL,
                       "OpenCL cannot be used with this renderer, for the reason above; name "
                       "another platform with --platform, or use --allow-cpu"};
    return {};
}

} // namespace viewer
