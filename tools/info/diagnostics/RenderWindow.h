// The OpenGL side of the host: a window that is never shown, with a context.
#pragma once

#include "standalone/GLHost.h"
#include "tools/info/diagnostics/Diagnostics.h"

#include <memory>
#include <string>

#include <QGuiApplication>
#include <QOpenGLContext>
#include <QWindow>

namespace info {

// Makes the application object, the window and the context, and makes the context current. What is
// missing on this machine is told by facts(), never fatal: without a display Qt falls back to a
// window system that has no OpenGL.
//
// On the main thread, once.
class RenderWindow {
public:
    RenderWindow();
    ~RenderWindow();
    RenderWindow(const RenderWindow&) = delete;
    RenderWindow& operator=(const RenderWindow&) = delete;

    const Renderer& facts() const { return fFacts; }
    // The window system's own handle, as the library's start-up takes it; null where the renderer
    // is not usable.
    void* nativeContext() const;

    QOpenGLContext& context() { return *fContext; }

private:
    void open();

    Renderer fFacts;
    // The first members go last: the application outlives everything of Qt's.
    std::unique_ptr<QGuiApplication> fApplication;
    std::unique_ptr<QWindow> fWindow;
    std::unique_ptr<QOpenGLContext> fContext;
    std::unique_ptr<GLHost> fHost;
};

} // namespace info
