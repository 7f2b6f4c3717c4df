#include "core/gl/GlContext.h"

namespace glshare {

bool isSupported(WindowSystem windowSystem)
{
    return windowSystem == WindowSystem::kGlx || windowSystem == WindowSystem::kEgl;
}

bool isShareable(const GlBinding& binding)
{
    return binding.windowSystem == WindowSystem::kGlx
               ? isShareableGlx(binding.display, binding.context)
               : isShareableEgl(binding.display, binding.context);
}

std::unique_ptr<GlContext> createSharingContext(const GlBinding& binding)
{
    return binding.windowSystem == WindowSystem::kGlx
               ? createGlxContext(binding.display, binding.context)
               : createEglContext(binding.display, binding.context);
}

} // namespace glshare
