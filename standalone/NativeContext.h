// The window system's own handle of an OpenGL context.
#pragma once

#include "host/HostExport.h"

class QOpenGLContext;

// What TopenCLInfo::initialize takes as the graphics context: the handle that GLX, EGL or WGL gave
// to `context`. Borrowed from it. Null when the context has not been created.
VYRA_HOST_API void* nativeContext(const QOpenGLContext& context);
