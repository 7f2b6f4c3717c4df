// Ends a process in the order named by its argument; the exit code tells whether it ended well. A
// crash or a hang on the way out is what these runs look for.
#define GL_GLEXT_PROTOTYPES 1

#include "EglTestContext.h"

#include <CL/cl.h>
#include <CL/cl_gl.h>
#include <GL/gl.h>
#include <GL/glext.h>

#include <array>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <functional>
#include <string_view>
#include <thread>
#include <vector>

namespace {

constexpr int kSkipped = 77;
constexpr std::size_t kBytes = std::size_t{1} << 20;

[[noreturn]] void leave(int code, const char* why)
{
    std::fputs(why, stderr);
    std::fputs("\n", stderr);
    std::_Exit(code);
}

void expect(bool holds, const char* what)
{
    if (!holds)
        leave(1, what);
}

// One of everything. The members are public and left to the scenario.
struct Everything {
    EglTestContext* gl = nullptr;
    GLuint buffer = 0;
    cl_context context = nullptr;
    cl_command_queue queue = nullptr;
    cl_mem memory = nullptr;

    void open()
    {
        cl_platform_id platform = nullptr;
        if (EglTestContext::display() == EGL_NO_DISPLAY ||
            clGetPlatformIDs(1, &platform, nullptr) != CL_SUCCESS)
            leave(kSkipped, "no EGL without a window system, or no OpenCL runtime");
        gl = new EglTestContext;
        gl->makeCurrent();
        glGenBuffers(1, &buffer);
        glBindBuffer(GL_ARRAY_BUFFER, buffer);
        glBufferData(GL_ARRAY_BUFFER, kBytes, nullptr, GL_DYNAMIC_DRAW);
        const std::array<cl_context_properties, 7> properties{
            CL_CONTEXT_PLATFORM,
            reinterpret_cast<cl_context_properties>(platform),
            CL_GL_CONTEXT_KHR,
            reinterpret_cast<cl_context_properties>(gl->handle()),
            CL_EGL_DISPLAY_KHR,
            reinterpret_cast<cl_context_properties>(EglTestContext::display()),
            0};
        cl_device_id device = nullptr;
        clGetDeviceIDs(platform, CL_DEVICE_TYPE_GPU, 1, &device, nullptr);
        cl_int error = CL_SUCCESS;
        context = clCreateContext(properties.data(), 1, &device, nullptr, nullptr, &error);
        expect(error == CL_SUCCESS, "no context: is the layer active?");
        queue = clCreateCommandQueue(context, device, 0, nullptr);
        memory = clCreateFromGLBuffer(context, CL_MEM_READ_WRITE, buffer, &error);
        expect(error == CL_SUCCESS, "no shared buffer");
        expect(acquire() == CL_SUCCESS && release() == CL_SUCCESS, "the buffer is not shared");
    }

    void closeCl()
    {
        clReleaseMemObject(memory);
        clReleaseCommandQueue(queue);
        clReleaseContext(context);
    }

    void closeGl()
    {
        gl->destroy();
        eglTerminate(EglTestContext::display());
    }

    cl_int acquire(cl_event after = nullptr) const
    {
        return clEnqueueAcquireGLObjects(queue, 1, &memory, after == nullptr ? 0 : 1,
                                         after == nullptr ? nullptr : &after, nullptr);
    }
    cl_int release() const
    {
        return clEnqueueReleaseGLObjects(queue, 1, &memory, 0, nullptr, nullptr);
    }
};

Everything theEverything;

// Released by a static object, after the exit handlers that came later than it.
struct StaticOwner {
    bool owns = false;
    ~StaticOwner()
    {
        if (owns)
            theEverything.closeCl();
    }
};

StaticOwner theOwner;

void nothingReleased()
{
    theEverything.open();
}

void everythingReleased()
{
    theEverything.open();
    theEverything.closeCl();
    theEverything.closeGl();
}

void glFirst()
{
    theEverything.open();
    theEverything.closeGl();
    theEverything.acquire(); // may succeed or fail, as the driver keeps its objects or not
    theEverything.release();
    theEverything.closeCl();
}

void glOnly()
{
    theEverything.open();
    theEverything.closeGl();
}

void staticOwner()
{
    theEverything.open();
    theOwner.owns = true;
}

void exitHandler()
{
    std::atexit([] { theEverything.closeCl(); });
    theEverything.open();
    std::atexit([] { theEverything.closeGl(); });
}

void pendingCommands()
{
    theEverything.open();
    EglTestContext::releaseCurrent();
    cl_event gate = clCreateUserEvent(theEverything.context, nullptr);
    expect(theEverything.acquire(gate) == CL_SUCCESS, "the acquire was refused");
    expect(theEverything.release() == CL_SUCCESS, "the release was refused");
    clFlush(theEverything.queue);
}

// The process ends while another thread is in the middle of its work.
void busyThread()
{
    theEverything.open();
    EglTestContext::releaseCurrent();
    std::thread([] {
        for (;;) {
            theEverything.acquire();
            theEverything.release();
            clFinish(theEverything.queue);
        }
    }).detach();
    std::this_thread::sleep_for(std::chrono::milliseconds(50));
}

void exitOnOtherThread()
{
    theEverything.open();
    std::thread([] { std::exit(0); }).join();
}

struct Scenario {
    std::string_view name;
    void (*run)();
};

constexpr std::array kScenarios{
    Scenario{"nothing-released", nothingReleased},
    Scenario{"everything-released", everythingReleased},
    Scenario{"gl-first", glFirst},
    Scenario{"gl-only", glOnly},
    Scenario{"static-owner", staticOwner},
    Scenario{"exit-handler", exitHandler},
    Scenario{"pending-commands", pendingCommands},
    Scenario{"busy-thread", busyThread},
    Scenario{"exit-on-other-thread", exitOnOtherThread},
};

} // namespace

// The arguments: a scenario, and environment variables of the form NAME=VALUE.
int main(int argc, char** argv)
{
    setenv("OPENCL_LAYERS", GLSHARE_LAYER, 1);
    for (int i = 2; i < argc; ++i)
        putenv(argv[i]);
    const std::string_view wanted = argc > 1 ? argv[1] : "";
    for (const Scenario& scenario : kScenarios) {
        if (scenario.name == wanted) {
            scenario.run();
            return 0;
        }
    }
    leave(2, "no such scenario");
}
