// Implements the functions of GlContext.h for Linux.
#include "core/gl/GlContext.h"

namespace glshare {

bool isSupported(WindowSystem windowSystem) noexcept
{
    return windowSystem == WindowSystem::kGlx || windowSystem == WindowSystem::kEgl;
}

bool isShareable(const GlContextHandle& handle)
{
    return handle.windowSystem == WindowSystem::kGlx
               ? isShareableGlx(handle.display, handle.context)
               : isShareableEgl(handle.display, handle.context);
}

std::unique_ptr<GlContext> createSharedGlContext(const GlContextHandle& handle)
{
    return handle.windowSystem == WindowSystem::kGlx
               ? createGlxContext(handle.display, handle.context)
               : createEglContext(handle.display, handle.context);
}

} // namespace glshare
