#include "evaluator/EvaluatorImplementation.h"

#include "evaluator/ConstantStorage.h"
#include "evaluator/ProfileScope.h"

#include "diagnostics/CLErrorCodes.h"
#include "host/EvaluationId.h"
#include "runtime/TopenCLInfo.h"

#include <algorithm>
#include <exception>
#include <new>
#include <string>
#include <thread>
#include <utility>

#include <tbb/parallel_for.h>

namespace vyra {
namespace {

constexpr std::uint16_t kNoEvaluation = 0xFFFE; // never names an evaluation

TopenCLSharedBufferMgr& manager()
{
    return TopenCLInfo::theOne().sharedBufferMgr();
}

void pollUntilComplete(cl_event event)
{
    while (!TopenCLInfo::IsEventComplete(event))
        std::this_thread::yield();
}

// Closes an evaluation, also if a function of the settings throws.
class OpenEvaluation {
public:
    explicit OpenEvaluation(const em::Id& id) : fId(id) {}
    ~OpenEvaluation() { manager().PostEvaluate(fId); }
    OpenEvaluation(const OpenEvaluation&) = delete;
    OpenEvaluation& operator=(const OpenEvaluation&) = delete;

private:
    const em::Id& fId;
};

// Sets a flag while a scope is open.
class FlagScope {
public:
    explicit FlagScope(bool& flag) : fFlag(flag) { fFlag = true; }
    ~FlagScope() { fFlag = false; }
    FlagScope(const FlagScope&) = delete;
    FlagScope& operator=(const FlagScope&) = delete;

private:
    bool& fFlag;
};

Status ofMesh(const DeformableMesh& mesh, const std::string& text, cl_int status = CL_SUCCESS)
{
    return Status("mesh '" + mesh.geometry().name + "': " + text, status);
}

} // namespace

EvaluatorImplementation::EvaluatorImplementation(EvaluatorSettings settings)
    : fSettings(std::move(settings))
{
    fArena.initialize();
    if (TopenCLInfo::isValid())
        startOpenCL();
}

void EvaluatorImplementation::startOpenCL()
{
    fCL = openCLFunctions();
    if (!fCL) {
        fStartStatus =
            Status("the OpenCL library lacks a function that the evaluator calls; update "
                   "the OpenCL loader");
        return;
    }
    std::vector<std::string> directories = fSettings.kernelDirectories;
    directories.push_back(Evaluator::kernelDirectory());
    fLibrary = std::make_unique<KernelLibrary>(*fCL, directories);
    fBatchReleased = manager().EnqueueReleaseBatchedSharedCLBuffer(0, nullptr);
    for (int i = 1; i <= fArena.max_concurrency(); ++i) {
        auto queue =
            DeformationQueue::create(*fCL, static_cast<std::size_t>(i), fSettings, fStartStatus);
        if (queue)
            fQueues.push_back(std::move(queue));
    }
    if (!fQueues.empty())
        fStartStatus = {};
}

EvaluatorImplementation::~EvaluatorImplementation()
{
    finish();
    while (!fMeshes.empty())
        destroy(*fMeshes.back());
}

DeformableMesh& EvaluatorImplementation::add(std::unique_ptr<DeformableMesh> mesh,
                                             const VertexBuffers& buffers)
{
    DeformableMesh& added = *fMeshes.emplace_back(std::move(mesh));
    MeshState& state = added.state();
    if (const std::string problem = findProblem(added.geometry()); !problem.empty()) {
        state.creation = ofMesh(added, problem);
    } else if (usesOpenCL() &&
               added.geometry().rest.vertexCount() >=
                   static_cast<std::size_t>(TopenCLInfo::theOne().minimumBufferSize())) {
        state.usesOpenCL = true;
        state.creation = share(added, buffers);
    }
    state.status = state.creation;
    return added;
}

// Makes the vertex buffers and the rest pose known to OpenCL, and chooses a queue.
Status EvaluatorImplementation::share(DeformableMesh& mesh, const VertexBuffers& buffers)
{
    MeshState& state = mesh.state();
    const std::size_t bytes = mesh.geometry().rest.vertexCount() * sizeof(Vector3);
    cl_int status = CL_SUCCESS;
    state.rest = restPose(mesh.fGeometry);
    state.restMemory.positions = state.rest.positions.storage()->memory(status);
    if (status == CL_SUCCESS)
        state.restMemory.normals = state.rest.normals.storage()->memory(status);
    if (status != CL_SUCCESS)
        return ofMesh(mesh,
                      std::string("its rest pose has no room on the device (") +
                          CLErrorCodeStr(status) + ")",
                      status);

    const auto shareBuffer = [&](std::uint32_t name, void* d3d11Buffer, const char* what,
                                 const TopenCLSharedBuffer*& record) {
        record =
            manager().CreateSharedCLBuffer(TopenCLInfo::theOne().openCLContext(), CL_MEM_READ_WRITE,
                                           d3d11Buffer ? d3d11Buffer : &name, &status);
        if (!record)
            return ofMesh(mesh,
                          std::string("OpenCL cannot share its buffer of ") + what + " (" +
                              CLErrorCodeStr(status) + "); check that the renderer created it",
                          status == CL_SUCCESS ? CL_INVALID_GL_OBJECT : status);
        std::size_t size = 0;
        status =
            fCL->clGetMemObjectInfo(record->fMem.get(), CL_MEM_SIZE, sizeof(size), &size, nullptr);
        if (status == CL_SUCCESS && size < bytes)
            return ofMesh(mesh, std::string("its buffer of ") + what + " has " +
                                    std::to_string(size) + " bytes, and the vertices need " +
                                    std::to_string(bytes));
        return Status();
    };
    Status shared =
        shareBuffer(buffers.positions, buffers.d3d11Positions, "positions", state.positions);
    if (shared.ok())
        shared = shareBuffer(buffers.normals, buffers.d3d11Normals, "normals", state.normals);
    if (!shared.ok())
        return shared;

    const auto fewest =
        std::min_element(fQueues.begin(), fQueues.end(), [](const auto& a, const auto& b) {
            return a->vertexCount() < b->vertexCount();
        });
    (*fewest)->addMesh(mesh);
    return {};
}

RestPose& EvaluatorImplementation::restPose(const std::shared_ptr<const MeshGeometry>& geometry)
{
    std::erase_if(fRestPoses, [](const auto& entry) { return entry.second.geometry.expired(); });
    const auto [known, isNew] = fRestPoses.try_emplace(geometry.get());
    if (isNew) {
        known->second.geometry = geometry;
        known->second.rest = {ConstantArray(geometry->rest.positions),
                              ConstantArray(geometry->rest.normals)};
    }
    return known->second.rest;
}

void EvaluatorImplementation::remove(DeformableMesh& mesh)
{
    if (fDeforming)
        mesh.state().removed = true;
    else
        destroy(mesh);
}

// Outside deform(): no command is enqueued meanwhile, and every event is reported to the batch
// release.
void EvaluatorImplementation::destroy(DeformableMesh& mesh)
{
    MeshState& state = mesh.state();
    if (state.queue) {
        state.queue->finish();
        state.queue->removeMesh(mesh);
    }
    if (state.positions || state.normals) {
        // The release follows the queue's commands, and the renderer may delete its buffers as soon
        // as this function returns.
        for (const cl_event released : {*fBatchReleased, fReleasedAlone.get()}) {
            if (released)
                fCL->clWaitForEvents(1, &released);
        }
    }
    if (state.positions)
        manager().DestroyBatchedSharedCLBuffer(state.positions);
    if (state.normals)
        manager().DestroyBatchedSharedCLBuffer(state.normals);
    std::erase_if(fMeshes, [&mesh](const auto& other) { return other.get() == &mesh; });
}

Status EvaluatorImplementation::prepare()
{
    Status first = fStartStatus;
    for (const auto& mesh : fMeshes) {
        Status status = mesh->state().creation;
        if (status.ok() && mesh->state().queue)
            status = mesh->state().queue->prepare(*mesh, *fLibrary);
        if (!status.ok() && mesh->state().creation.ok())
            status = ofMesh(*mesh, status.message, status.openCL);
        if (first.ok())
            first = std::move(status);
    }
    return first;
}

void EvaluatorImplementation::evaluate(const em::Id& id)
{
    if (id.value() == kNoEvaluation) {
        refuse("65534 never names an evaluation; number evaluations from 0");
        return;
    }
    if (!mayDeform())
        return;
    if (!usesOpenCL()) {
        deform();
        return;
    }
    if (TopenCLInfo::theOne().useGLFinish())
        fSettings.finishRenderer();
    // An evaluation that the host has opened with the same id stays open: opening it once more
    // changes nothing, and the acquire event stays the same.
    const AutoCLObject<cl_event> before = batchAcquireEvent();
    manager().PreEvaluate(id);
    const AutoCLObject<cl_event> acquired = batchAcquireEvent();
    if (before.get() && before.get() == acquired.get()) {
        deform();
        return;
    }
    {
        const OpenEvaluation open(id);
        const FlagScope evaluating(fEvaluating);
        fCounts.acquires += acquired.get() ? 1 : 0;
        deform();
    }
    TopenCLInfo::flush();
    fCounts.releases += *fBatchReleased ? 1 : 0;
    destroyRemovedMeshes();
}

// Whether deform() can run; a refusal is in the status.
bool EvaluatorImplementation::mayDeform()
{
    if (fDeforming)
        refuse("an evaluation was asked for inside an evaluation; wait for its end");
    else if (usesOpenCL() && !TopenCLInfo::theOne().usingDX() && !fSettings.finishRenderer)
        refuse("EvaluatorSettings::finishRenderer is not set; with OpenGL it calls glFinish");
    else
        return true;
    return false;
}

void EvaluatorImplementation::refuse(const char* reason)
{
    fStatus = Status(std::string("nothing was evaluated: ") + reason);
}

// The event of the batch's last acquire, with a reference; empty if no buffer is in the batch.
AutoCLObject<cl_event> EvaluatorImplementation::batchAcquireEvent()
{
    AutoCLObject<cl_event> event;
    for (const auto& mesh : fMeshes) {
        const TopenCLSharedBuffer* buffer = mesh->state().positions;
        if (buffer && buffer->fInBatch) {
            manager().EnqueueAcquireSharedCLBuffer(nullptr, buffer, event.receive());
            break;
        }
    }
    return event;
}

void EvaluatorImplementation::deform()
{
    if (!mayDeform())
        return;
    {
        const FlagScope deforming(fDeforming);
        fStatus = fStartStatus;
        fCounts.evaluations += 1;
        fAlone.reserve(2 * fMeshes.size()); // releasing them must not fail
        // A buffer outside the batch is acquired on a thread without an OpenGL context, and no mode
        // orders that after the renderer's commands.
        if (anyOutsideBatch() && fSettings.finishRenderer)
            fSettings.finishRenderer();
        for (const auto& mesh : fMeshes)
            mesh->state().status = mesh->state().creation;
        deformAll();
        reportLastEvents();
        releaseAlone();
        writeCpuSurfaces();
        collectStatus();
    }
    if (!fEvaluating)
        destroyRemovedMeshes();
}

// Isolated, so that a deformer that waits for tasks of its own does not run another mesh meanwhile.
void EvaluatorImplementation::deformAll()
{
    fArena.execute([this] {
        tbb::parallel_for(std::size_t{0}, fQueues.size() + fMeshes.size(), [this](std::size_t i) {
            tbb::this_task_arena::isolate([this, i] {
                const ProfileScope scope("Deform");
                if (i < fQueues.size())
                    fQueues[i]->deform(*fLibrary);
                else if (!fMeshes[i - fQueues.size()]->state().usesOpenCL)
                    deformOnCpu(*fMeshes[i - fQueues.size()]);
            });
        });
    });
}

void EvaluatorImplementation::deformOnCpu(DeformableMesh& mesh)
{
    MeshState& state = mesh.state();
    if (!state.status.ok())
        return;
    for (const auto& deformer : mesh.deformers()) {
        const std::string text =
            deformer->enabled ? deformer->mismatch(mesh.geometry()) : std::string();
        if (!text.empty()) {
            state.status =
                ofMesh(mesh, std::string("deformer '") + deformer->name() + "': " + text);
            return;
        }
    }
    try {
        state.surface = mesh.deformOnCpu();
    } catch (const std::exception& error) {
        state.status = ofMesh(mesh, std::string("a deformer threw an exception: ") + error.what());
    }
}

// One event per queue: it covers all commands of the queue.
void EvaluatorImplementation::reportLastEvents()
{
    for (const auto& queue : fQueues) {
        const cl_event last = queue->lastEvent().get();
        if (!last)
            continue;
        try {
            manager().EnqueueReleaseBatchedSharedCLBuffer(1, &last);
        } catch (const std::bad_alloc&) {
            fCL->clWaitForEvents(1, &last); // then the release need not wait
        }
    }
}

// Releases with one command on this thread, whose current context orders the release before the
// drawing if the sharing extension orders the two; on the primary queue, which
// TopenCLInfo::finish waits for.
void EvaluatorImplementation::releaseAlone()
{
    fAlone.clear();
    fAloneWaits = AutoCLEventList(); // keeps its storage
    for (const auto& queue : fQueues) {
        if (queue->acquiredAlone().empty())
            continue;
        fAlone.insert(fAlone.end(), queue->acquiredAlone().begin(), queue->acquiredAlone().end());
        try {
            fAloneWaits.add(queue->lastEvent());
        } catch (const std::bad_alloc&) {
            queue->finish(); // then the release need not wait
        }
    }
    if (fAlone.empty())
        return;
    const cl_int status = manager().EnqueueReleaseSharedCLBuffer(
        TopenCLInfo::theOne().openCLCommandQueue(), static_cast<unsigned>(fAlone.size()),
        fAlone.data(), fAloneWaits.size(), fAloneWaits.array(), fReleasedAlone.receive());
    fCounts.acquires += fAlone.size();
    fCounts.releases += 1;
    if (status != CL_SUCCESS)
        fail(Status(std::string("releasing vertex buffers outside the batch failed (") +
                        CLErrorCodeStr(status) + "); check the OpenCL driver",
                    status));
}

void EvaluatorImplementation::writeCpuSurfaces()
{
    if (!fSettings.writeVertices)
        return;
    for (std::size_t i = 0; i < fMeshes.size(); ++i) { // the function may add meshes
        DeformableMesh& mesh = *fMeshes[i];
        if (!mesh.usesOpenCL() && mesh.status().ok())
            fSettings.writeVertices(mesh, mesh.state().surface);
    }
}

void EvaluatorImplementation::collectStatus()
{
    for (const auto& mesh : fMeshes) {
        if (!mesh->status().ok())
            fail(mesh->status());
    }
}

void EvaluatorImplementation::fail(Status status)
{
    if (fStatus.ok())
        fStatus = std::move(status);
}

void EvaluatorImplementation::destroyRemovedMeshes()
{
    for (std::size_t i = fMeshes.size(); i-- > 0;) {
        if (fMeshes[i]->state().removed)
            destroy(*fMeshes[i]);
    }
}

bool EvaluatorImplementation::anyOutsideBatch() const
{
    return std::any_of(fMeshes.begin(), fMeshes.end(), [](const auto& mesh) {
        const MeshState& state = mesh->state();
        return state.queue && !(state.positions->fInBatch && state.normals->fInBatch);
    });
}

std::size_t EvaluatorImplementation::batchSize() const
{
    std::size_t buffers = 0;
    for (const auto& mesh : fMeshes) {
        for (const TopenCLSharedBuffer* buffer : {mesh->state().positions, mesh->state().normals})
            buffers += buffer && buffer->fInBatch ? 1 : 0;
    }
    return buffers;
}

void EvaluatorImplementation::waitUntilDrawable()
{
    if (!usesOpenCL())
        return;
    switch (TopenCLInfo::theOne().clToGraphicsSyncMode()) {
    case TopenCLInfo::kCLToGraphicsImplicit:
        break; // the releases come before what this thread draws
    case TopenCLInfo::kCLToGraphicsEventQuery:
        pollUntilComplete(*fBatchReleased);
        pollUntilComplete(fReleasedAlone.get());
        break;
    case TopenCLInfo::kCLToGraphicsSyncObject:
        // PostEvaluate made the OpenGL stream wait for the batch, and for releases outside it
        // unless batching is disabled.
        if (const cl_event event = fReleasedAlone.get(); event && anyOutsideBatch())
            fCL->clWaitForEvents(1, &event);
        break;
    case TopenCLInfo::kCLToGraphicsFinish:
        TopenCLInfo::finish();
        break;
    }
}

void EvaluatorImplementation::renderingComplete()
{
    if (!usesOpenCL())
        return;
    manager().RenderingComplete();
    // A fence that is never flushed may never be signalled.
    if (fSettings.flushRenderer)
        fSettings.flushRenderer();
    for (const auto& queue : fQueues)
        queue->recordTrace();
}

void EvaluatorImplementation::finish()
{
    for (const auto& queue : fQueues)
        queue->finish();
    TopenCLInfo::finish();
}

Status EvaluatorImplementation::replaceKernelFile(const std::string& file,
                                                  const std::string& source)
{
    return fLibrary ? fLibrary->replaceFile(file, source) : Status();
}

EvaluatorCounts EvaluatorImplementation::counts() const
{
    EvaluatorCounts counts = fCounts;
    if (fLibrary) {
        counts.programsBuilt = fLibrary->programsBuilt();
        counts.kernelsCreated = fLibrary->kernelsCreated();
    }
    for (const auto& queue : fQueues) {
        counts.buffersCreated += queue->buffersCreated();
        counts.buffersReused += queue->buffersReused();
    }
    return counts;
}

} // namespace vyra
