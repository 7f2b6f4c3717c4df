#include "evaluator/DeformationQueue.h"

#include "evaluator/Failure.h"
#include "evaluator/MeshState.h"

#include "host/Profiler.h"
#include "runtime/TopenCLInfo.h"

#include <algorithm>
#include <string>
#include <utility>

namespace vyra {
namespace {

// Runs the steps of one mesh unless an earlier one failed.
template <typename Steps>
void attempt(DeformableMesh& mesh, const Steps& steps) noexcept
{
    if (Status& status = mesh.state().status; status.ok())
        status = ofMesh(mesh, guarded(steps));
}

} // namespace

std::unique_ptr<DeformationQueue> DeformationQueue::create(const OpenCLFunctions& cl,
                                                           std::size_t number,
                                                           const EvaluatorSettings& settings,
                                                           Status& status)
{
    TopenCLInfo& info = TopenCLInfo::theOne();
    const bool traced = settings.traceCommand && settings.traceClock && profiler::samplingActive();
    std::unique_ptr<DeformationQueue> result(new DeformationQueue(cl));
    cl_int created = CL_OUT_OF_RESOURCES; // the library reports its own status as a warning
    result->fQueue = traced ? cl.clCreateCommandQueue(info.openCLContext(), info.openCLDevice(),
                                                      CL_QUEUE_PROFILING_ENABLE, &created)
                            : info.createOpenCLCommandQueue(nullptr);
    if (!result->fQueue) {
        status = Status("OpenCL creates no command queue; check the driver", created);
        return nullptr;
    }
    if (traced)
        result->fTimeline = std::make_unique<CommandTimeline>(
            cl, result->fQueue, "OpenCL queue " + std::to_string(number), settings);
    return result;
}

DeformationQueue::~DeformationQueue()
{
    if (!fQueue)
        return;
    // The destructor releases the memory of the pool, so no command may still use it.
    finish();
    fCL.clReleaseCommandQueue(fQueue);
}

void DeformationQueue::finish()
{
    fCL.clFinish(fQueue);
}

void DeformationQueue::recordTrace()
{
    if (fTimeline)
        fTimeline->record();
}

void DeformationQueue::addMesh(DeformableMesh& mesh)
{
    fAcquiredUnbatched.reserve(2 * (fMeshes.size() + 1)); // recording an acquire must not fail
    fMeshes.push_back(&mesh);
    mesh.state().queue = this;
}

void DeformationQueue::removeMesh(DeformableMesh& mesh)
{
    std::erase(fMeshes, &mesh);
}

std::size_t DeformationQueue::vertexCount() const
{
    std::size_t count = 0;
    for (const DeformableMesh* mesh : fMeshes)
        count += mesh->geometry().rest.vertexCount();
    return count;
}

void DeformationQueue::begin(cl_event unbatchedReleased)
{
    if (fLast.get())
        fFormerLast = std::move(fLast);
    fLast.reset();
    if (!fRetired.empty() && TopenCLInfo::IsEventComplete(fFormerLast.get()))
        fRetired.clear();
    fAcquiredUnbatched.clear();
    fUnbatchedReleased = unbatchedReleased;
}

// Collects passes, arguments and frame data of all meshes, and uploads the frame data.
void DeformationQueue::collect(KernelLibrary& library, unsigned leastPasses)
{
    fFrame.begin();
    for (DeformableMesh* mesh : fMeshes)
        attempt(*mesh, [&] { return collectMesh(*mesh, library, leastPasses); });
    AutoCLObject<cl_event> uploaded;
    fUpload = fFrame.upload(fQueue, uploaded);
    noteCommand("Upload", uploaded);
}

void DeformationQueue::deform(KernelLibrary& library)
{
    collect(library, 0);
    for (DeformableMesh* mesh : fMeshes) {
        attempt(*mesh, [&] { return enqueueMesh(*mesh); });
        // The next mesh may reuse the memory, since its commands run later.
        fPool.releaseBuffers();
    }
    // Other queues and the host wait for the last event; without a flush they might wait forever.
    if (fLast.get())
        fCL.clFlush(fQueue);
}

Status DeformationQueue::collectMesh(DeformableMesh& mesh, KernelLibrary& library,
                                     unsigned leastPasses)
{
    mesh.state().active.clear();
    mesh.state().passes.resize(mesh.deformers().size());
    for (std::size_t i = 0; i < mesh.deformers().size(); ++i) {
        const Deformer& deformer = *mesh.deformers()[i];
        if (!deformer.enabled)
            continue;
        Status status = guarded([&] { return collectPasses(mesh, i, library, leastPasses); });
        if (!status.ok())
            return ofDeformer(deformer, std::move(status));
    }
    return {};
}

// Creates the kernels of at least `leastPasses` passes of a deformer, even if its present settings
// need none.
Status DeformationQueue::collectPasses(DeformableMesh& mesh, std::size_t index,
                                       KernelLibrary& library, unsigned leastPasses)
{
    Deformer& deformer = *mesh.deformers()[index];
    auto& passes = mesh.state().passes[index];
    if (std::string text = deformer.mismatch(mesh.geometry()); !text.empty())
        return Status(std::move(text));
    const unsigned count = deformer.passCount();
    for (unsigned i = 0; i < std::max(count, leastPasses); ++i) {
        if (i == passes.size())
            passes.push_back(std::make_unique<KernelPass>(fCL, deformer, i, fRetired));
        Status status = passes[i]->prepare(library);
        if (status.ok() && i < count)
            status = passes[i]->setArguments(fFrame, library);
        if (!status.ok())
            return status;
        if (i < count)
            mesh.state().active.push_back({&deformer, passes[i].get()});
    }
    return {};
}

Status DeformationQueue::enqueueMesh(DeformableMesh& mesh)
{
    MeshState& state = mesh.state();
    const bool toRestPose = state.active.empty();
    if (toRestPose && state.showsRestPose)
        return {};
    state.showsRestPose = false;
    Status status = toRestPose ? enqueueRestPose(mesh) : enqueuePasses(mesh);
    state.showsRestPose = toRestPose && status.ok();
    return status;
}

// Only the last pass waits for the acquired vertex buffers: earlier passes may run while the
// renderer still draws.
Status DeformationQueue::enqueuePasses(DeformableMesh& mesh)
{
    VertexMemory input = mesh.state().restMemory;
    VertexMemory spare; // scratch that no later pass reads
    fWaits = AutoCLEventList();
    for (std::size_t i = 0; i < mesh.state().active.size(); ++i) {
        Status status = enqueuePass(mesh, i, input, spare);
        if (!status.ok())
            return ofDeformer(*mesh.state().active[i].deformer, std::move(status));
    }
    return {};
}

// `input` becomes the output of the pass.
Status DeformationQueue::enqueuePass(DeformableMesh& mesh, std::size_t index, VertexMemory& input,
                                     VertexMemory& spare)
{
    const MeshState& state = mesh.state();
    const auto& [deformer, pass] = state.active[index];
    const std::size_t vertexCount = mesh.geometry().rest.vertexCount();
    const bool inputIsScratch = index > 0;
    if (pass->usesFrame() && fUpload != CL_SUCCESS)
        return failureOf(fUpload, "uploading the frame data");
    VertexMemory output;
    Status status;
    if (index + 1 == state.active.size()) {
        status = acquireTarget(mesh);
        output = {state.positions->fMem.get(), state.normals->fMem.get()};
    } else if (inputIsScratch && !deformer->readsNeighbours()) {
        output = input;
    } else if (spare.positions) {
        output = std::exchange(spare, {});
    } else {
        status = createScratch(vertexCount, output);
    }
    if (!status.ok())
        return status;
    AutoCLObject<cl_event> enqueued;
    status = failureOf(pass->enqueue(fQueue, static_cast<cl_uint>(vertexCount), input, output,
                                     fFrame.memory(), fWaits, enqueued),
                       "enqueuing the kernel");
    noteCommand(deformer->name(), enqueued);
    if (inputIsScratch && output.positions != input.positions)
        spare = input;
    input = output;
    return status;
}

Status DeformationQueue::enqueueRestPose(DeformableMesh& mesh)
{
    MeshState& state = mesh.state();
    const std::size_t bytes = mesh.geometry().rest.vertexCount() * sizeof(Vector3);
    const auto copy = [&](cl_mem source, const TopenCLSharedBuffer& target) {
        AutoCLObject<cl_event> enqueued;
        Status status =
            failureOf(fCL.clEnqueueCopyBuffer(fQueue, source, target.fMem.get(), 0, 0, bytes,
                                              fWaits.size(), fWaits.array(), enqueued.receive()),
                      "copying the rest pose");
        noteCommand("Copy rest pose", enqueued);
        return status;
    };
    fWaits = AutoCLEventList();
    Status status = acquireTarget(mesh);
    if (status.ok())
        status = copy(state.restMemory.positions, *state.positions);
    if (status.ok())
        status = copy(state.restMemory.normals, *state.normals);
    return status;
}

// Acquires both vertex buffers and makes the next command wait for them.
Status DeformationQueue::acquireTarget(const DeformableMesh& mesh)
{
    Status status = acquire(*mesh.state().positions, fAcquiredPositions);
    if (status.ok())
        status = acquire(*mesh.state().normals, fAcquiredNormals);
    fWaits.add(fAcquiredPositions);
    if (fAcquiredNormals.get() != fAcquiredPositions.get()) // buffers of the batch share one event
        fWaits.add(fAcquiredNormals);
    return status;
}

Status DeformationQueue::acquire(const TopenCLSharedBuffer& buffer,
                                 AutoCLObject<cl_event>& acquired)
{
    cl_int status = CL_SUCCESS;
    if (buffer.fInBatch) {
        TopenCLInfo::theOne().sharedBufferMgr().EnqueueAcquireSharedCLBuffer(fQueue, &buffer,
                                                                             acquired.receive());
        // The acquire of the batch failed when the evaluation was opened.
        status = acquired.get() ? CL_SUCCESS : CL_INVALID_EVENT;
    } else {
        status = acquireUnbatched(buffer, acquired);
    }
    return failureOf(status, "acquiring a vertex buffer");
}

// The last release was enqueued on another queue, and the manager makes no acquire wait for it.
cl_int DeformationQueue::acquireUnbatched(const TopenCLSharedBuffer& buffer,
                                          AutoCLObject<cl_event>& acquired)
{
    if (fUnbatchedReleased) {
        const cl_int status =
            fCL.clEnqueueMarkerWithWaitList(fQueue, 1, &fUnbatchedReleased, nullptr);
        if (status != CL_SUCCESS)
            return status;
        fUnbatchedReleased = nullptr;
    }
    const cl_int status = TopenCLInfo::theOne().sharedBufferMgr().EnqueueAcquireSharedCLBuffer(
        fQueue, &buffer, acquired.receive());
    if (status != CL_SUCCESS)
        return status;
    fAcquiredUnbatched.push_back(buffer.fMem.get()); // has capacity
    AutoCLObject<cl_event> enqueued = acquired;
    noteCommand("Acquire", enqueued);
    return CL_SUCCESS;
}

Status DeformationQueue::createScratch(std::size_t vertexCount, VertexMemory& scratch)
{
    scratch = {createScratchArray(vertexCount), createScratchArray(vertexCount)};
    return failureOf(scratch.positions && scratch.normals ? CL_SUCCESS
                                                          : CL_MEM_OBJECT_ALLOCATION_FAILURE,
                     "creating memory between two deformers");
}

cl_mem DeformationQueue::createScratchArray(std::size_t vertexCount)
{
    TopenCLDataBufferDescriptor descriptor;
    descriptor.setElementSizeInBytes(sizeof(Vector3));
    descriptor.setElementCount(static_cast<unsigned>(vertexCount));
    const cl_mem memory = fPool.createBuffer(descriptor).buffer().get(); // kept by the pool
    if (memory)
        fReused += fSeen.insert(memory).second ? 0 : 1;
    return memory;
}

// The event of the last command covers all commands before it.
void DeformationQueue::noteCommand(const char* name, AutoCLObject<cl_event>& enqueued)
{
    if (!enqueued.get())
        return;
    if (fTimeline)
        fTimeline->add(name, enqueued);
    fLast = std::move(enqueued);
}

} // namespace vyra
