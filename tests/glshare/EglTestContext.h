// An OpenGL context for tests that needs no display server.
#pragma once

#include <CL/cl.h>
#include <EGL/egl.h>

#include <vector>

class EglTestContext {
public:
    // Returns the process's display, initialised; EGL_NO_DISPLAY if there is none.
    static EGLDisplay display();

    // Shares its objects with `share`, which may be null. Not current on any thread. valid()
    // returns false on failure.
    explicit EglTestContext(const EglTestContext* share = nullptr, EGLenum api = EGL_OPENGL_API);
    ~EglTestContext();

    EglTestContext(const EglTestContext&) = delete;
    EglTestContext& operator=(const EglTestContext&) = delete;

    [[nodiscard]] bool valid() const { return fContext != EGL_NO_CONTEXT; }

    // Returns the entries for the property list of an OpenCL context.
    [[nodiscard]] std::vector<cl_context_properties> entries() const;

    // On the calling thread.
    void makeCurrent() const;
    static void releaseCurrent();

    // Destroys the context before the destructor does.
    void destroy();

private:
    EGLenum fApi;
    EGLContext fContext = EGL_NO_CONTEXT;
};
