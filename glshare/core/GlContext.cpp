#include "core/GlContext.h"

namespace glshare {

bool isSupported(WindowSystem windowSystem)
{
    return windowSystem == WindowSystem::Glx || windowSystem == WindowSystem::Egl;
}

bool isShareable(const GlBinding& binding)
{
    return binding.windowSystem == WindowSystem::Glx
               ? isShareableGlx(binding.display, binding.context)
               : isShareableEgl(binding.display, binding.context);
}

std::unique_ptr<GlContext> createSharingContext(const GlBinding& binding)
{
    return binding.windowSystem == WindowSystem::Glx
               ? createGlxContext(binding.display, binding.context)
               : createEglContext(binding.display, binding.context);
}

} // namespace glshare
