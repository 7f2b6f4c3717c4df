// The library, initialised on the machine's OpenCL runtime, with a hidden OpenGL context and the
// stand-in host around it.
#pragma once

#include "harness/Timing.h"
#include "standalone/GLHost.h"

#include <functional>
#include <memory>
#include <string>

#include <CL/cl.h>
#include <QGuiApplication>
#include <QOffscreenSurface>
#include <QOpenGLContext>
#include <QOpenGLExtraFunctions>

class Runtime {
public:
    // What happens before the library is initialised; given the native OpenGL context.
    using BeforeStart = std::function<void(void* graphicsContext)>;

    // Throws std::runtime_error, with the reason, when a piece of the machine is missing.
    Runtime(int& argumentCount, char** arguments, const BeforeStart& beforeStart = {});
    ~Runtime();
    Runtime(const Runtime&) = delete;
    Runtime& operator=(const Runtime&) = delete;

    // Of the thread that made the runtime.
    QOpenGLExtraFunctions& gl() { return *fContext.extraFunctions(); }

    static cl_context context();
    static cl_device_id device();
    static cl_command_queue queue();
    static std::string platformName(); // and version
    static std::string deviceName();

    // That TopenCLInfo::initialize took.
    Nanoseconds startTime() const { return fStartTime; }

private:
    QGuiApplication fApplication;
    QOffscreenSurface fSurface;
    QOpenGLContext fContext;
    std::unique_ptr<GLHost> fHost;
    Nanoseconds fStartTime{0};
};
