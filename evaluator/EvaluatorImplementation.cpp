#include "evaluator/EvaluatorImplementation.h"

#include "evaluator/ConstantStorage.h"
#include "evaluator/Failure.h"
#include "evaluator/OpenEvaluation.h"
#include "evaluator/ProfileScope.h"

#include "diagnostics/CLErrorCodes.h"
#include "host/EvaluationId.h"
#include "runtime/TopenCLInfo.h"

#include <algorithm>
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
    try {
        if (state.creation.ok())
            state.creation = Status(findProblem(added.geometry()));
        if (state.creation.ok() && usesOpenCL() &&
            added.geometry().rest.vertexCount() >=
                static_cast<std::size_t>(TopenCLInfo::theOne().minimumBufferSize())) {
            state.usesOpenCL = true;
            state.creation = share(added, buffers);
        }
        state.creation = ofMesh(added, std::move(state.creation));
        state.status = state.creation;
    } catch (...) {
        destroy(added);
        throw;
    }
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
        return Status(std::string("its rest pose has no room on the device (") +
                          CLErrorCodeStr(status) + ")",
                      status);
    Status shared =
        shareBuffer(buffers.positions, buffers.d3d11Positions, bytes, "positions", state.positions);
    if (shared.ok())
        shared =
            shareBuffer(buffers.normals, buffers.d3d11Normals, bytes, "normals", state.normals);
    if (!shared.ok()) {
        unshare(state); // a batch acquires no buffer that is never written
        return shared;
    }
    const auto fewest =
        std::min_element(fQueues.begin(), fQueues.end(), [](const auto& a, const auto& b) {
            return a->vertexCount() < b->vertexCount();
        });
    (*fewest)->addMesh(mesh);
    return {};
}

Status EvaluatorImplementation::shareBuffer(std::uint32_t name, void* d3d11Buffer,
                                            std::size_t bytes, const char* what,
                                            const TopenCLSharedBuffer*& record)
{
    const std::string itsBuffer = std::string("its buffer of ") + what;
    cl_int status = CL_SUCCESS;
    record =
        manager().CreateSharedCLBuffer(TopenCLInfo::theOne().openCLContext(), CL_MEM_READ_WRITE,
                                       d3d11Buffer ? d3d11Buffer : &name, &status);
    if (!record) {
        if (status == CL_SUCCESS)
            status = CL_INVALID_GL_OBJECT; // the runtime gave no reason
        return Status("OpenCL cannot share " + itsBuffer + " (" + CLErrorCodeStr(status) +
                          "); check that the renderer created it",
                      status);
    }
    std::size_t size = 0;
    status = fCL->clGetMemObjectInfo(record->fMem.get(), CL_MEM_SIZE, sizeof(size), &size, nullptr);
    if (status != CL_SUCCESS)
        return Status("the size of " + itsBuffer + " is unknown (" + CLErrorCodeStr(status) +
                          "); check the OpenCL driver",
                      status);
    if (size < bytes)
        return Status(itsBuffer + " has " + std::to_string(size) +
                          " bytes, and the vertices need " + std::to_string(bytes),
                      CL_INVALID_BUFFER_SIZE);
    return {};
}

// Takes the vertex buffers back from OpenCL; no command uses them.
void EvaluatorImplementation::unshare(MeshState& state)
{
    for (const TopenCLSharedBuffer** record : {&state.positions, &state.normals}) {
        if (*record)
            manager().DestroyBatchedSharedCLBuffer(std::exchange(*record, nullptr));
    }
}

RestPose& EvaluatorImplementation::restPose(const std::shared_ptr<const MeshGeometry>& geometry)
{
    dropUnusedRestPoses(); // also one at the address of the new geometry
    const auto [known, isNew] = fRestPoses.try_emplace(geometry.get());
    if (isNew) {
        known->second.geometry = geometry;
        known->second.rest = {ConstantArray(geometry->rest.positions),
                              ConstantArray(geometry->rest.normals)};
    }
    return known->second.rest;
}

void EvaluatorImplementation::dropUnusedRestPoses()
{
    std::erase_if(fRestPoses, [](const auto& entry) { return entry.second.geometry.expired(); });
}

void EvaluatorImplementation::remove(DeformableMesh& mesh)
{
    if (fBusy)
        mesh.state().removed = true;
    else
        destroy(mesh);
}

// No command is enqueued meanwhile, and every event is reported to the batch release.
void EvaluatorImplementation::destroy(DeformableMesh& mesh)
{
    MeshState& state = mesh.state();
    if (state.queue) {
        state.queue->finish();
        state.queue->removeMesh(mesh);
    }
    if (state.positions || state.normals) {
        releaseLeftOver();
        // The release follows the queue's commands, and the renderer may delete its buffers as soon
        // as this function returns.
        for (const cl_event released : {*fBatchReleased, fReleasedAlone.get()}) {
            if (released)
                fCL->clWaitForEvents(1, &released);
        }
        for (const TopenCLSharedBuffer* record : {state.positions, state.normals}) {
            if (record)
                std::erase(fAlone, record->fMem.get());
        }
        unshare(state);
    }
    std::erase_if(fMeshes, [&mesh](const auto& other) { return other.get() == &mesh; });
    dropUnusedRestPoses();
}

Status EvaluatorImplementation::prepare()
{
    resetStatuses();
    for (const auto& queue : fQueues)
        queue->prepare(*fLibrary);
    Status first = fStartStatus;
    for (const auto& mesh : fMeshes) {
        if (first.ok())
            first = mesh->status();
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
    {
        const FlagScope busy(fBusy);
        if (usesOpenCL())
            evaluateWithOpenCL(id);
        else
            deformMeshes();
    }
    destroyRemovedMeshes();
}

void EvaluatorImplementation::evaluateWithOpenCL(const em::Id& id)
{
    if (TopenCLInfo::theOne().useGLFinish())
        fSettings.finishRenderer();
    finishIfUnordered();
    bool closed = false;
    bool acquired = false;
    {
        const OpenEvaluation evaluation(id, findWitness());
        fCounts.acquires += evaluation.acquiredBatch() ? 1 : 0;
        if (evaluation.isOpen())
            deformMeshes();
        else
            refuse("there is no memory to open the evaluation", CL_OUT_OF_HOST_MEMORY);
        closed = evaluation.isOwn();
        acquired = evaluation.acquiredBatch();
    }
    fUnordered = fUnordered || (acquired && !*fBatchReleased);
    if (!closed)
        return;
    TopenCLInfo::flush();
    fCounts.releases += *fBatchReleased ? 1 : 0;
}

// A vertex buffer outside the batch if there is one, else one in the batch, else null.
const TopenCLSharedBuffer* EvaluatorImplementation::findWitness() const
{
    const TopenCLSharedBuffer* found = nullptr;
    for (const auto& mesh : fMeshes) {
        if (const TopenCLSharedBuffer* buffer = mesh->state().positions)
            found = buffer;
        if (found && !found->fInBatch)
            break;
    }
    return found;
}

// Whether meshes can be deformed; a refusal is in the status.
bool EvaluatorImplementation::mayDeform()
{
    if (fBusy)
        refuse("an evaluation was asked for inside an evaluation; wait for its end");
    else if (usesOpenCL() && !TopenCLInfo::theOne().usingDX() && !fSettings.finishRenderer)
        refuse("EvaluatorSettings::finishRenderer is not set; with OpenGL it calls glFinish");
    else
        return true;
    return false;
}

void EvaluatorImplementation::refuse(const char* reason, cl_int status)
{
    fStatus =
        guarded([&] { return Status(std::string("nothing was evaluated: ") + reason, status); });
}

void EvaluatorImplementation::deform()
{
    if (!mayDeform())
        return;
    // A release event stands from PostEvaluate to the next PreEvaluate.
    if (usesOpenCL() && *fBatchReleased && batchSize() > 0) {
        refuse("no evaluation is open; call TopenCLSharedBufferMgr::PreEvaluate before");
        return;
    }
    {
        const FlagScope busy(fBusy);
        deformMeshes();
    }
    destroyRemovedMeshes();
}

void EvaluatorImplementation::deformMeshes()
{
    fStatus = {};
    fFailure = {};
    fCounts.evaluations += 1;
    finishIfUnordered();
    if (!anyOutsideBatch())
        fReleasedAlone.reset();
    // A buffer outside the batch is acquired on a thread without an OpenGL context, and no mode
    // orders that after the renderer's commands.
    if (anyOutsideBatch() && fSettings.finishRenderer)
        fSettings.finishRenderer();
    fail(guarded([this] {
        fAlone.reserve(2 * fMeshes.size()); // releasing them must not fail
        collectWork();
        resetStatuses();
        return Status();
    }));
    if (fFailure.ok()) {
        releaseLeftOver();
        deformAll();
        reportLastEvents();
        releaseAlone();
        collectStatus();
        writeCpuSurfaces();
    }
    if (!fFailure.ok())
        fStatus = std::move(fFailure);
}

void EvaluatorImplementation::resetStatuses()
{
    for (const auto& mesh : fMeshes)
        mesh->state().status = mesh->state().creation;
}

// Isolated, so that a deformer that waits for tasks of its own does not run another mesh meanwhile.
void EvaluatorImplementation::deformAll()
{
    for (const auto& queue : fQueues)
        queue->begin(fReleasedAlone.get());
    const auto deformOne = [this](std::size_t i) {
        tbb::this_task_arena::isolate([&] {
            const ProfileScope scope("Deform");
            const auto& [queue, mesh] = fWork[i];
            if (queue)
                queue->deform(*fLibrary);
            else
                deformOnCpu(*mesh);
        });
    };
    // Deforming never throws; the tasks need memory.
    fail(guarded([&] {
        fArena.execute([&] {
            if (fWork.size() == 1)
                deformOne(0); // waking another thread would cost more
            else
                tbb::parallel_for(std::size_t{0}, fWork.size(), deformOne);
        });
        return Status();
    }));
}

// The queues that have meshes, and the meshes of the CPU.
void EvaluatorImplementation::collectWork()
{
    fWork.clear();
    for (const auto& queue : fQueues) {
        if (queue->hasMeshes())
            fWork.push_back({queue.get(), nullptr});
    }
    for (const auto& mesh : fMeshes) {
        if (!mesh->state().usesOpenCL)
            fWork.push_back({nullptr, mesh.get()});
    }
}

void EvaluatorImplementation::deformOnCpu(DeformableMesh& mesh)
{
    MeshState& state = mesh.state();
    if (!state.status.ok())
        return;
    state.status = ofMesh(mesh, guarded([&] {
                              Surface surface = mesh.geometry().rest;
                              for (const auto& deformer : mesh.deformers()) {
                                  Status status = deformOnCpu(mesh, *deformer, surface);
                                  if (!status.ok())
                                      return ofDeformer(*deformer, std::move(status));
                              }
                              state.surface = std::move(surface);
                              return Status();
                          }));
}

Status EvaluatorImplementation::deformOnCpu(const DeformableMesh& mesh, const Deformer& deformer,
                                            Surface& surface)
{
    if (!deformer.enabled)
        return {};
    return guarded([&] {
        std::string text = deformer.mismatch(mesh.geometry());
        if (text.empty())
            deformer.deform(mesh.geometry(), surface);
        return Status(std::move(text));
    });
}

// One event per queue: it covers all commands of the queue.
void EvaluatorImplementation::reportLastEvents()
{
    if (batchSize() == 0)
        return; // there is no release
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

// Releases what the queues acquired outside the batch.
void EvaluatorImplementation::releaseAlone()
{
    fAloneWaits = AutoCLEventList(); // keeps its storage
    for (const auto& queue : fQueues) {
        const std::vector<cl_mem>& acquired = queue->acquiredAlone();
        if (acquired.empty())
            continue;
        fAlone.insert(fAlone.end(), acquired.begin(), acquired.end()); // has capacity
        fCounts.acquires += acquired.size();
        const bool isListed = guarded([&] {
                                  fAloneWaits.add(queue->lastEvent());
                                  return Status();
                              }).ok();
        if (!isListed || !queue->lastEvent().get())
            queue->finish(); // then the release need not wait
    }
    enqueueReleaseAlone();
}

// Releases what an earlier release left acquired because it failed.
void EvaluatorImplementation::releaseLeftOver()
{
    if (fAlone.empty())
        return;
    finish();
    fAloneWaits = AutoCLEventList();
    enqueueReleaseAlone();
}

// With one command on this thread, whose current context orders the release before the drawing if
// the sharing extension orders the two; on the primary queue, which TopenCLInfo::finish waits for.
void EvaluatorImplementation::enqueueReleaseAlone()
{
    if (fAlone.empty())
        return;
    const TopenCLInfo& info = TopenCLInfo::theOne();
    const cl_command_queue queue = info.openCLCommandQueue();
    // In this mode the manager borrows the event until PostEvaluate, and this object may go before.
    const bool borrowed = info.clToGraphicsSyncMode() == TopenCLInfo::kCLToGraphicsSyncObject;
    fReleasedAlone.reset();
    const cl_int status = manager().EnqueueReleaseSharedCLBuffer(
        queue, static_cast<unsigned>(fAlone.size()), fAlone.data(), fAloneWaits.size(),
        fAloneWaits.array(), borrowed ? nullptr : fReleasedAlone.receive());
    if (status != CL_SUCCESS) {
        fail(guarded([status] {
            return Status(std::string("releasing vertex buffers outside the batch failed (") +
                              CLErrorCodeStr(status) + "); check the OpenCL driver",
                          status);
        }));
        return;
    }
    fAlone.clear();
    fCounts.releases += 1;
    if (borrowed)
        fCL->clEnqueueMarkerWithWaitList(queue, 0, nullptr, fReleasedAlone.receive());
    fUnordered = !fReleasedAlone.get();
    if (fUnordered)
        TopenCLInfo::finish(); // then nothing need wait for the release
}

// A release that failed or gave no event is one that nothing can wait for.
void EvaluatorImplementation::finishIfUnordered()
{
    if (std::exchange(fUnordered, false))
        finish();
}

void EvaluatorImplementation::writeCpuSurfaces()
{
    if (!fSettings.writeVertices)
        return;
    // By index, since the function may add meshes.
    for (std::size_t i = 0; i < fMeshes.size(); ++i) { // NOLINT(modernize-loop-convert)
        DeformableMesh& mesh = *fMeshes[i];
        if (!mesh.usesOpenCL() && mesh.status().ok() && !mesh.state().removed)
            fSettings.writeVertices(mesh, mesh.state().surface);
    }
}

void EvaluatorImplementation::collectStatus()
{
    fail(guarded([this] { return fStartStatus; }));
    for (const auto& mesh : fMeshes) {
        if (!mesh->status().ok())
            fail(guarded([&mesh] { return mesh->status(); }));
    }
}

// The first failure counts.
void EvaluatorImplementation::fail(Status status)
{
    if (fFailure.ok())
        fFailure = std::move(status);
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
    const cl_event releasedAlone = fReleasedAlone.get();
    switch (TopenCLInfo::theOne().clToGraphicsSyncMode()) {
    case TopenCLInfo::kCLToGraphicsImplicit:
        return; // the releases come before what this thread draws
    case TopenCLInfo::kCLToGraphicsEventQuery:
        TopenCLInfo::flush(); // a command that is never submitted is never complete
        pollUntilComplete(*fBatchReleased);
        pollUntilComplete(releasedAlone);
        break;
    case TopenCLInfo::kCLToGraphicsSyncObject:
        // PostEvaluate made the OpenGL stream wait for the batch.
        if (releasedAlone)
            fCL->clWaitForEvents(1, &releasedAlone);
        break;
    case TopenCLInfo::kCLToGraphicsFinish:
        TopenCLInfo::finish();
        break;
    }
}

// Returns also if the command failed, which TopenCLInfo::IsEventComplete does not count.
void EvaluatorImplementation::pollUntilComplete(cl_event event) const
{
    const auto failed = [&] {
        cl_int status = CL_COMPLETE;
        fCL->clGetEventInfo(event, CL_EVENT_COMMAND_EXECUTION_STATUS, sizeof(status), &status,
                            nullptr);
        return status < 0;
    };
    while (!TopenCLInfo::IsEventComplete(event) && !failed())
        std::this_thread::yield();
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
