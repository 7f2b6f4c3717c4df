// An OpenGL context for tests, which needs no display.
#pragma once

#include <CL/cl.h>
#include <EGL/egl.h>

#include <vector>

class EglTestContext {
public:
    // The process's one display without a window system, initialised; EGL_NO_DISPLAY if there is
    // none.
    static EGLDisplay display();

    // Shares its objects with `share`, which may be null. Not current on any thread; valid() tells.
    explicit EglTestContext(const EglTestContext* share = nullptr, EGLenum api = EGL_OPENGL_API);
    ~EglTestContext();

    EglTestContext(const EglTestContext&) = delete;
    EglTestContext& operator=(const EglTestContext&) = delete;

    [[nodiscard]] bool valid() const { return fContext != EGL_NO_CONTEXT; }

    // What the properties of an OpenCL context say of it.
    [[nodiscard]] std::vector<cl_context_properties> entries() const;

    // On the calling thread.
    void makeCurrent() const;
    static void releaseCurrent();

    // Destroys the context early.
    void destroy();

private:
    EGLenum fApi;
    EGLContext fContext = EGL_NO_CONTEXT;
};
