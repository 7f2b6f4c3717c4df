#include "viewer/Evaluation.h"

#include "diagnostics/CLErrorCodes.h"
#include "runtime/TopenCLInfo.h"
#include "viewer/ProfileScope.h"

#include <algorithm>
#include <atomic>
#include <string>
#include <thread>

#include <tbb/parallel_for.h>

namespace viewer {
namespace {

Status statusOf(cl_int status, const char* what)
{
    if (status == CL_SUCCESS)
        return {};
    return Failure{ExitCode::kOpenCLError, std::string("OpenCL failed to ") + what + " (" +
                                               CLErrorCodeStr(status) +
                                               "); check the driver, or use --allow-cpu"};
}

void pollUntilComplete(cl_event event)
{
    while (!TopenCLInfo::IsEventComplete(event))
        std::this_thread::yield();
}

} // namespace

Evaluation::Evaluation(QOpenGLFunctions_3_3_Core& gl, const OpenCLFunctions& cl, Scene& scene)
    : fGL(gl), fCL(cl), fScene(scene), fWorkers(cl),
      fBatchReleased(
          TopenCLInfo::theOne().sharedBufferMgr().EnqueueReleaseBatchedSharedCLBuffer(0, nullptr)),
      fKernels(cl)
{
}

Evaluation::~Evaluation()
{
    TopenCLInfo::finish();
}

Status Evaluation::adopt(CharacterMesh& mesh)
{
    if (!fWorkers.valid())
        return Failure{ExitCode::kOpenCLError,
                       "OpenCL makes no command queues; check the driver, or use --allow-cpu"};
    const auto least = static_cast<std::size_t>(TopenCLInfo::theOne().minimumBufferSize());
    mesh.onOpenCL = mesh.mesh().vertexCount() >= least;
    if (!mesh.onOpenCL)
        return {};
    if (!mesh.evaluator) {
        mesh.evaluator =
            std::make_unique<MeshEvaluator>(fCL, ++fMeshNumber, mesh.mesh().hasBones(), fKernels);
        if (!mesh.evaluator->valid()) {
            const std::string& warnings = fKernels.warnings();
            return Failure{ExitCode::kOpenCLError,
                           "the kernels in " + KernelFiles::folder() +
                               " cannot be built; check that they are there and that the OpenCL "
                               "driver can compile" +
                               (warnings.empty() ? "" : ":\n" + warnings)};
        }
    }
    cl_int status = mesh.evaluator->setMesh(mesh.mesh(), fWorkers.all().front()->queue());
    if (status == CL_SUCCESS)
        status = mesh.positions.share();
    if (status == CL_SUCCESS)
        status = mesh.normals.share();
    return statusOf(status, "take over a vertex buffer");
}

std::optional<std::string> Evaluation::replaceKernelFile(const std::string& file,
                                                         const std::string& source)
{
    if (auto complaint = fKernels.replace(file, source))
        return complaint;
    for (CharacterMesh* mesh : fScene.meshes()) {
        if (mesh->evaluator)
            mesh->evaluator->renewKernels(fKernels);
    }
    return std::nullopt;
}

Status Evaluation::evaluate(const em::Id& id, const std::function<Status()>& whileOpen)
{
    const ProfileScope scope("Evaluate");
    TopenCLInfo& info = TopenCLInfo::theOne();
    TopenCLSharedBufferMgr& manager = info.sharedBufferMgr();

    // Opening takes every buffer of the batch from the renderer with one command.
    if (info.useGLFinish())
        fGL.glFinish();
    manager.PreEvaluate(id);

    // The deformers only enqueue, and hand over the events of their last commands.
    Status failure = whileOpen();
    finishDrawingOfSingles();
    if (!failure)
        failure = deformMeshes();

    // Closing gives every buffer back once those events are complete.
    if (Status unreleased = releaseSingles(); !failure)
        failure = unreleased;
    manager.PostEvaluate(id);
    TopenCLInfo::flush();

    countCommands();
    return failure;
}

// A buffer outside the batch is acquired on a thread without an OpenGL context, and no mode orders
// that behind the renderer's commands.
void Evaluation::finishDrawingOfSingles()
{
    if (!allBatched())
        fGL.glFinish();
}

Status Evaluation::deformMeshes()
{
    std::atomic<cl_int> firstError{CL_SUCCESS};
    fWorkers.arena().execute([&] {
        tbb::parallel_for(std::size_t{0}, fScene.meshes().size(), [&](std::size_t i) {
            CharacterMesh& mesh = *fScene.meshes()[i];
            if (!mesh.onOpenCL)
                return;
            const ProfileScope scope("Deform");
            const cl_int status = mesh.evaluator->evaluate(mesh.pose, fWorkers.forThisThread(),
                                                           mesh.positions, mesh.normals, fHandover);
            cl_int none = CL_SUCCESS;
            if (status != CL_SUCCESS)
                firstError.compare_exchange_strong(none, status);
        });
    });
    return statusOf(firstError, "deform a mesh");
}

// One command for all of them, on this thread, whose current context makes a release come before
// the drawing where the sharing extension orders the two; on the primary queue, which is the one
// that TopenCLInfo::finish waits for.
Status Evaluation::releaseSingles()
{
    if (fHandover.singles.empty())
        return {};
    std::vector<cl_mem> buffers;
    AutoCLEventList waits;
    for (const Handover::Single& single : fHandover.singles) {
        buffers.push_back(single.memory);
        waits.add(single.written);
    }
    TopenCLInfo& info = TopenCLInfo::theOne();
    const cl_int status = info.sharedBufferMgr().EnqueueReleaseSharedCLBuffer(
        info.openCLCommandQueue(), static_cast<unsigned>(buffers.size()), buffers.data(),
        waits.size(), waits.array(), fSinglesReleased.receive());
    fCounts.releases += 1;
    return statusOf(status, "release vertex buffers");
}

std::size_t Evaluation::batchSize() const
{
    std::size_t buffers = 0;
    for (const CharacterMesh* mesh : fScene.meshes()) {
        if (mesh->onOpenCL)
            buffers += std::size_t{mesh->positions.shared()->fInBatch} +
                       std::size_t{mesh->normals.shared()->fInBatch};
    }
    return buffers;
}

bool Evaluation::allBatched() const
{
    return std::all_of(fScene.meshes().begin(), fScene.meshes().end(), [](const auto* mesh) {
        return !mesh->onOpenCL ||
               (mesh->positions.shared()->fInBatch && mesh->normals.shared()->fInBatch);
    });
}

void Evaluation::countCommands()
{
    fAcquires.clear();
    for (const AutoCLObject<cl_event>& event : fHandover.acquired)
        fAcquires.push_back(event.get());
    std::sort(fAcquires.begin(), fAcquires.end());
    const auto distinct = std::unique(fAcquires.begin(), fAcquires.end()) - fAcquires.begin();
    fCounts.evaluations += 1;
    fCounts.acquires += static_cast<std::size_t>(distinct);
    fCounts.releases += *fBatchReleased ? 1 : 0;
    fHandover.singles.clear();
    fHandover.acquired.clear();
}

void Evaluation::waitUntilDrawable()
{
    const ProfileScope scope("Wait for OpenCL");
    switch (TopenCLInfo::theOne().clToGraphicsSyncMode()) {
    case TopenCLInfo::kCLToGraphicsImplicit:
        break; // the releases come before what this thread draws
    case TopenCLInfo::kCLToGraphicsEventQuery:
        pollUntilComplete(*fBatchReleased);
        pollUntilComplete(fSinglesReleased.get());
        break;
    case TopenCLInfo::kCLToGraphicsSyncObject:
        // PostEvaluate made the OpenGL stream wait, unless the library was told not to batch.
        if (!allBatched())
            waitForSingles();
        break;
    case TopenCLInfo::kCLToGraphicsFinish:
        TopenCLInfo::finish();
        break;
    }
}

void Evaluation::renderingComplete()
{
    TopenCLInfo::theOne().sharedBufferMgr().RenderingComplete();
    // A fence that nobody flushes may never be signalled.
    fGL.glFlush();
    fWorkers.recordCommands();
}

void Evaluation::waitForSingles()
{
    const cl_event event = fSinglesReleased.get();
    if (event)
        fCL.clWaitForEvents(1, &event);
}

EvaluationCounts Evaluation::counts() const
{
    EvaluationCounts counts = fCounts;
    counts.programsBuilt = fKernels.programsBuilt();
    counts.kernelsServed = fKernels.kernelsServed();
    for (const auto& worker : fWorkers.all()) {
        counts.buffersCreated += worker->buffersCreated();
        counts.buffersReused += worker->buffersReused();
    }
    return counts;
}

} // namespace viewer
