#include "standalone/NativeContext.h"

#include <QOpenGLContext>
#include <qopenglcontext_platform.h>

void* nativeContext(const QOpenGLContext& context)
{
#if defined(Q_OS_WIN)
    if (auto* wgl = context.nativeInterface<QNativeInterface::QWGLContext>())
        return wgl->nativeContext();
#else
#if QT_CONFIG(xcb_glx_plugin)
    if (auto* glx = context.nativeInterface<QNativeInterface::QGLXContext>())
        return glx->nativeContext();
#endif
#if QT_CONFIG(egl)
    if (auto* egl = context.nativeInterface<QNativeInterface::QEGLContext>())
        return egl->nativeContext();
#endif
#endif
    return nullptr;
}
