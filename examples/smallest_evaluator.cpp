// The smallest evaluator: one vertex buffer, one kernel, one evaluation, drawn by OpenGL.
#include "diagnostics/CLWarningSink.h"
#include "host/EvaluationId.h"
#include "kernels/TopenCLKernelStore.h"
#include "runtime/TopenCLInfo.h"
#include "standalone/GLHost.h"
#include "standalone/NativeContext.h"
#include "standalone/OpenCLPlatforms.h"

#include <CL/cl.h>
#include <QGuiApplication>
#include <QOffscreenSurface>
#include <QOpenGLContext>
#include <QOpenGLExtraFunctions>
#include <cstdio>
#include <cstdlib>
#include <vector>

constexpr const char* kSource = R"(
__kernel void raise(__global float* heights, float amount, uint count)
{
    const size_t index = get_global_id(0);
    if (index < count) // the work-items beyond the count are padding
        heights[index] += amount;
})";

constexpr const char* kNoOpenGL = "No OpenGL: start this where there is a display.\n";

int main(int argc, char** argv)
{
    // Qt ends the process if there is no display.
    qInstallMessageHandler([](QtMsgType type, const QMessageLogContext&, const QString&) {
        if (type == QtFatalMsg)
            std::fputs(kNoOpenGL, stderr), std::_Exit(1);
    });
    // The renderer, here a hidden one. GLHost passes its OpenGL functions to the library.
    QGuiApplication application(argc, argv);
    qInstallMessageHandler(nullptr);
    QOffscreenSurface surface;
    surface.create();
    QOpenGLContext context;
    if (!context.create() || !context.makeCurrent(&surface))
        return std::fputs(kNoOpenGL, stderr), 1;
    const GLHost host(context);

    // Without a sink, failed OpenCL calls and the logs of kernels that do not compile are dropped.
    setCLWarningSink([](const char* text) { std::fprintf(stderr, "%s\n", text); });

    // Once per process. The vendor id is the PCI id of the renderer's adapter; for a software
    // renderer the host library chooses the platform that shares with it.
    if (!TopenCLInfo::initialize(nullptr, nativeContext(context), nullptr, false, true,
                                 chooseOpenCLPlatform(context)))
        return std::fprintf(stderr, "OpenCL is off; the lines above name the reason.\n"), 1;
    TopenCLInfo& info = TopenCLInfo::theOne();
    TopenCLSharedBufferMgr& buffers = info.sharedBufferMgr();

    // The renderer's vertex buffer, and the OpenCL memory object that shares its storage.
    std::vector<float> heights(1000, 1.0F);
    const auto bytes = static_cast<GLsizeiptr>(heights.size() * sizeof(float));
    QOpenGLExtraFunctions& gl = *context.extraFunctions();
    unsigned vertexBuffer = 0;
    gl.glGenBuffers(1, &vertexBuffer);
    gl.glBindBuffer(GL_ARRAY_BUFFER, vertexBuffer);
    gl.glBufferData(GL_ARRAY_BUFFER, bytes, heights.data(), GL_DYNAMIC_DRAW);
    int error = CL_SUCCESS;
    const TopenCLSharedBuffer* shared = buffers.CreateSharedCLBuffer(
        info.openCLContext(), CL_MEM_READ_WRITE, &vertexBuffer, &error);
    AutoCLObject<cl_kernel> kernel =
        info.kernelStore().getKernelFromString(kSource, "raise.cl", nullptr, "raise", nullptr);
    if (!shared || !kernel.get())
        return std::fprintf(stderr, "The buffer or the kernel could not be created.\n"), 1;

    // One evaluation. All shared buffers are acquired at its start and released at its end.
    if (info.useGLFinish())
        gl.glFinish();
    const em::Id evaluation(1);
    buffers.PreEvaluate(evaluation);
    {
        const cl_command_queue queue = info.openCLCommandQueue();
        AutoCLObject<cl_event> acquired;
        buffers.EnqueueAcquireSharedCLBuffer(queue, shared, acquired.receive());

        const cl_mem memory = shared->fMem.get();
        const float amount = 0.5F;
        const auto count = static_cast<cl_uint>(heights.size());
        clSetKernelArg(kernel.get(), 0, sizeof memory, &memory);
        clSetKernelArg(kernel.get(), 1, sizeof amount, &amount);
        clSetKernelArg(kernel.get(), 2, sizeof count, &count);
        std::size_t global = 0;
        std::size_t local = 0;
        info.getWorkGroupSizes(kernel.get(), count, global, local);
        AutoCLObject<cl_event> raised;
        const cl_event waitFor = acquired.get();
        clEnqueueNDRangeKernel(queue, kernel.get(), 1, nullptr, &global, &local, 1, &waitFor,
                               raised.receive());

        const cl_event last = raised.get();
        buffers.EnqueueReleaseBatchedSharedCLBuffer(1, &last);
    }
    buffers.PostEvaluate(evaluation);
    TopenCLInfo::finish(); // the simplest way to wait; hosts follow the synchronisation mode
                           // instead

    // The renderer draws from its buffer; here it only reads the result.
    const void* drawn = gl.glMapBufferRange(GL_ARRAY_BUFFER, 0, bytes, GL_MAP_READ_BIT);
    const float result = drawn ? static_cast<const float*>(drawn)[heights.size() - 1] : 0.0F;
    gl.glUnmapBuffer(GL_ARRAY_BUFFER);
    std::printf("1 raised by 0.5 is %g\n", static_cast<double>(result));
    buffers.RenderingComplete();

    // Shared buffers are destroyed before the OpenGL context.
    info.kernelStore().freeKernel(kernel);
    buffers.DestroySharedCLBuffer(shared);
    return result == 1.5F ? 0 : 1;
}
