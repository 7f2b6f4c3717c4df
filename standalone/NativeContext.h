// The window system's own handle of an OpenGL context.
#pragma once

#include "host/HostExport.h"

class QOpenGLContext;

// Returns the handle of `context` in GLX, EGL or WGL, as TopenCLInfo::initialize takes it. The
// context owns it. Null if the context has not been created.
[[nodiscard]] VYRA_HOST_API void* nativeContext(const QOpenGLContext& context);
