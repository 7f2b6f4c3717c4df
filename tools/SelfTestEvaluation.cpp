#include "tools/SelfTestEvaluation.h"

#include "host/EvaluationId.h"
#include "loader/OpenCLLoader.h"

#include <thread>

#include <QOpenGLContext>
#include <QOpenGLFunctions>

namespace info {
namespace {

TopenCLSharedBufferMgr& manager()
{
    return TopenCLInfo::theOne().sharedBufferMgr();
}

cl_command_queue queue()
{
    return TopenCLInfo::theOne().openCLCommandQueue();
}

// Small whole numbers, which floats hold exactly, other ones in each evaluation.
std::vector<float> inputOf(int index, std::size_t count)
{
    constexpr std::size_t kDifferent = 1000;
    std::vector<float> values(count);
    for (std::size_t i = 0; i < count; ++i)
        values[i] = static_cast<float>((i + static_cast<std::size_t>(index)) % kDifferent);
    return values;
}

} // namespace

SelfTestEvaluation::SelfTestEvaluation(SharedVertices& vertices, cl_kernel kernel,
                                       std::size_t floats)
    : fVertices(vertices), fKernel(kernel), fFloats(floats)
{
    if (!fCalls.clSetKernelArg || !fCalls.clEnqueueNDRangeKernel)
        fProblem = "the OpenCL library lacks the functions that run a kernel";
}

EvaluationTimes SelfTestEvaluation::run(int index, bool inStages)
{
    EvaluationTimes times;
    if (!fProblem.empty())
        return times;
    const std::vector<float> input = inputOf(index, fFloats);
    const auto offset = static_cast<float>(index + 1);
    fVertices.write(input);
    manager().RenderingComplete();
    QOpenGLContext::currentContext()->functions()->glFlush();
    if (TopenCLInfo::theOne().useGLFinish())
        QOpenGLContext::currentContext()->functions()->glFinish();
    const Stopwatch whole;
    if (!evaluate(offset, inStages, times))
        return times;
    const Stopwatch reading;
    const std::vector<float> output = fVertices.read();
    times.read = reading.milliseconds();
    times.whole = whole.milliseconds();
    compare(input, output, offset);
    return times;
}

bool SelfTestEvaluation::evaluate(float offset, bool inStages, EvaluationTimes& times)
{
    const Stopwatch open;
    const AutoCLObject<cl_event> acquired = acquire();
    if (!acquired.get() || (inStages && !waitFor(acquired.get())))
        return false;
    times.acquire = open.milliseconds();

    const Stopwatch kernel;
    const AutoCLObject<cl_event> deformed = enqueueKernel(offset, acquired.get());
    if (!deformed.get() || (inStages && !waitFor(deformed.get())))
        return false;
    times.kernel = kernel.milliseconds();

    const Stopwatch close;
    const AutoCLObject<cl_event> released = release(deformed.get());
    if (!released.get() || (inStages && !waitFor(released.get())))
        return false;
    waitAsTheHostDoes(released.get());
    times.release = close.milliseconds();
    return true;
}

AutoCLObject<cl_event> SelfTestEvaluation::acquire()
{
    manager().PreEvaluate(em::Id(++fEvaluationId));
    AutoCLObject<cl_event> acquired;
    const int status =
        manager().EnqueueAcquireSharedCLBuffer(queue(), fVertices.record(), acquired.receive());
    if (succeeded(status, "the shared buffer cannot be acquired") && !acquired.get())
        fProblem = "the shared buffer cannot be acquired; the warnings say why";
    return acquired;
}

AutoCLObject<cl_event> SelfTestEvaluation::enqueueKernel(float offset, cl_event acquired)
{
    const cl_mem memory = fVertices.record()->fMem.get();
    const auto count = static_cast<cl_uint>(fFloats);
    std::size_t global = 0;
    std::size_t local = 0;
    AutoCLObject<cl_event> deformed;
    if (succeeded(fCalls.clSetKernelArg(fKernel, 0, sizeof(cl_mem), &memory), "argument refused") &&
        succeeded(fCalls.clSetKernelArg(fKernel, 1, sizeof offset, &offset), "argument refused") &&
        succeeded(fCalls.clSetKernelArg(fKernel, 2, sizeof count, &count), "argument refused") &&
        succeeded(TopenCLInfo::theOne().getWorkGroupSizes(fKernel, fFloats, global, local),
                  "the kernel has no work-group size"))
        succeeded(fCalls.clEnqueueNDRangeKernel(queue(), fKernel, 1, nullptr, &global, &local, 1,
                                                &acquired, deformed.receive()),
                  "the kernel cannot be run");
    return deformed;
}

// With the batch, or on its own where nothing is batched.
AutoCLObject<cl_event> SelfTestEvaluation::release(cl_event deformed)
{
    AutoCLObject<cl_event> released;
    const em::Id id(fEvaluationId);
    if (fVertices.record()->fInBatch) {
        const cl_event* batch = manager().EnqueueReleaseBatchedSharedCLBuffer(1, &deformed);
        manager().PostEvaluate(id);
        if (*batch) {
            retainCLObject(*batch); // the holder pays it back
            released.adopt(*batch);
        } else {
            fProblem = "the shared buffer cannot be released; the warnings say why";
        }
        return released;
    }
    const cl_mem memory = fVertices.record()->fMem.get();
    succeeded(manager().EnqueueReleaseSharedCLBuffer(queue(), 1, &memory, 1, &deformed,
                                                     released.receive()),
              "the shared buffer cannot be released");
    manager().PostEvaluate(id);
    return released;
}

// What the modes leave to the host before it draws.
void SelfTestEvaluation::waitAsTheHostDoes(cl_event released)
{
    const TopenCLInfo& library = TopenCLInfo::theOne();
    TopenCLInfo::flush();
    if (library.clToGraphicsSyncMode() == TopenCLInfo::kCLToGraphicsEventQuery) {
        while (!TopenCLInfo::IsEventComplete(released))
            std::this_thread::yield();
    }
    if (library.useCLFinish())
        TopenCLInfo::finish();
}

void SelfTestEvaluation::compare(const std::vector<float>& input, const std::vector<float>& output,
                                 float offset)
{
    if (output.empty()) {
        fProblem = "OpenGL does not let the vertex buffer be read";
        return;
    }
    std::size_t wrong = 0;
    for (std::size_t i = 0; i < input.size(); ++i)
        wrong += output[i] != 2.0F * input[i] + offset ? 1 : 0;
    if (wrong > 0)
        fProblem = std::to_string(wrong) + " of " + std::to_string(input.size()) +
                   " numbers in OpenGL's memory are wrong in evaluation " +
                   std::to_string(fEvaluationId);
}

bool SelfTestEvaluation::succeeded(int status, const char* what)
{
    if (status == CL_SUCCESS)
        return true;
    fProblem = what;
    fStatus = status;
    return false;
}

bool SelfTestEvaluation::waitFor(cl_event event)
{
    return succeeded(ocl.clWaitForEvents(1, &event), "a command failed while it ran");
}

} // namespace info
