// The window and the OpenGL context that stand for the host application.
#pragma once

#include "standalone/GLHost.h"
#include "tools/info/diagnostics/Diagnostics.h"

#include <memory>
#include <string>

#include <QGuiApplication>
#include <QOpenGLContext>
#include <QWindow>

namespace info {

// A window that is never shown, with an OpenGL context that is current on the main thread. Owns the
// application object of Qt. A part that is missing on this machine is reported by renderer() and is
// not an error: without a display Qt falls back to a window system that has no OpenGL.
//
// One object in a process, on the main thread.
class RenderWindow {
public:
    RenderWindow();
    ~RenderWindow();
    RenderWindow(const RenderWindow&) = delete;
    RenderWindow& operator=(const RenderWindow&) = delete;

    const Renderer& renderer() const noexcept { return fRenderer; }
    // Returns the window system's handle of the context, as TopenCLInfo::initialize takes it. Null
    // if the renderer is not usable.
    void* nativeContext() const;
    // The same for the window. Null if there is none.
    void* nativeWindow() const;

    QOpenGLContext& context() noexcept { return *fContext; }

private:
    void open();

    Renderer fRenderer;
    // Destroyed last, since it must outlive all other objects of Qt.
    std::unique_ptr<QGuiApplication> fApplication;
    std::unique_ptr<QWindow> fWindow;
    std::unique_ptr<QOpenGLContext> fContext;
    std::unique_ptr<GLHost> fHost;
};

} // namespace info
