// Makes Qt's platform plug-in for EGL without a window system draw into pbuffers, for servers whose
// EGL reaches the GPU but has no screen to draw on. Loaded before EGL (LD_PRELOAD), it replaces two
// of its functions.
#include <EGL/egl.h>

#include <array>
#include <cstddef>

#include <dlfcn.h>

namespace {

constexpr EGLint kWidth = 1280;
constexpr EGLint kHeight = 720;

} // namespace

extern "C" {

// Requires pbuffers instead of windows.
EGLBoolean eglChooseConfig(EGLDisplay display, const EGLint* attributes, EGLConfig* configs,
                           EGLint capacity, EGLint* count)
{
    std::array<EGLint, 128> changed{};
    std::size_t size = 0;
    for (; attributes && attributes[size] != EGL_NONE && size + 2 < changed.size(); size += 2) {
        changed[size] = attributes[size];
        changed[size + 1] =
            attributes[size] == EGL_SURFACE_TYPE ? EGL_PBUFFER_BIT : attributes[size + 1];
    }
    changed[size] = EGL_NONE;
    const auto next =
        reinterpret_cast<decltype(&eglChooseConfig)>(dlsym(RTLD_NEXT, "eglChooseConfig"));
    return next(display, changed.data(), configs, capacity, count);
}

EGLSurface eglCreateWindowSurface(EGLDisplay display, EGLConfig config,
                                  EGLNativeWindowType /*window*/, const EGLint* /*attributes*/)
{
    const std::array<EGLint, 5> size{EGL_WIDTH, kWidth, EGL_HEIGHT, kHeight, EGL_NONE};
    return eglCreatePbufferSurface(display, config, size.data());
}

} // extern "C"
