#include "evaluator/DeformationQueue.h"

#include "evaluator/MeshState.h"

#include "diagnostics/CLErrorCodes.h"
#include "host/Profiler.h"
#include "runtime/TopenCLInfo.h"

#include <algorithm>
#include <exception>
#include <new>
#include <string>
#include <utility>

namespace vyra {
namespace {

// Success, or a status that names the operation.
Status statusOf(cl_int status, const char* operation)
{
    if (status == CL_SUCCESS)
        return {};
    return Status(std::string(operation) + " failed (" + CLErrorCodeStr(status) +
                      "); the vertex buffers keep their last shape",
                  status);
}

// Runs the steps of one mesh unless an earlier one failed. Deformers of the host may throw.
template <typename Steps>
void attempt(DeformableMesh& mesh, const Steps& steps)
{
    Status& status = mesh.state().status;
    if (!status.ok())
        return;
    try {
        status = steps();
    } catch (const std::bad_alloc&) {
        status = Status("there is no memory left", CL_OUT_OF_HOST_MEMORY);
    } catch (const std::exception& error) {
        status = Status(std::string("a deformer threw an exception: ") + error.what());
    }
    if (!status.ok())
        status.message = "mesh '" + mesh.geometry().name + "': " + status.message;
}

// Names the deformer that failed.
Status ofDeformer(const Deformer& deformer, Status status)
{
    if (!status.ok())
        status.message = std::string("deformer '") + deformer.name() + "': " + status.message;
    return status;
}

} // namespace

std::unique_ptr<DeformationQueue> DeformationQueue::create(const OpenCLFunctions& cl,
                                                           std::size_t number,
                                                           const EvaluatorSettings& settings,
                                                           Status& status)
{
    TopenCLInfo& info = TopenCLInfo::theOne();
    const bool traced = settings.traceCommand && settings.traceClock && profiler::samplingActive();
    cl_int created = CL_OUT_OF_RESOURCES; // the library reports its own status as a warning
    cl_command_queue queue =
        traced ? cl.clCreateCommandQueue(info.openCLContext(), info.openCLDevice(),
                                         CL_QUEUE_PROFILING_ENABLE, &created)
               : info.createOpenCLCommandQueue(nullptr);
    if (!queue) {
        status = Status("OpenCL creates no command queue; check the driver", created);
        return nullptr;
    }
    std::unique_ptr<DeformationQueue> result(new DeformationQueue(cl, queue));
    if (traced)
        result->fTimeline = std::make_unique<CommandTimeline>(
            cl, queue, "OpenCL queue " + std::to_string(number), settings);
    return result;
}

DeformationQueue::DeformationQueue(const OpenCLFunctions& cl, cl_command_queue queue)
    : fCL(cl), fQueue(queue)
{
}

DeformationQueue::~DeformationQueue()
{
    // The memory of the pool is released with this object, so nothing may use it any more.
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
    fAcquiredAlone.reserve(2 * (fMeshes.size() + 1)); // recording an acquire must not fail
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

void DeformationQueue::deform(KernelLibrary& library)
{
    fLast.reset();
    fAcquiredAlone.clear();
    fFrame.begin();
    for (DeformableMesh* mesh : fMeshes)
        attempt(*mesh, [&] { return collectArguments(*mesh, library); });

    AutoCLObject<cl_event> uploaded;
    const cl_int upload = fFrame.upload(fQueue, uploaded);
    noteCommand("Upload", uploaded);
    for (DeformableMesh* mesh : fMeshes) {
        attempt(*mesh, [&] {
            return upload == CL_SUCCESS
                       ? enqueueMesh(*mesh)
                       : statusOf(upload, "uploading the numbers of the evaluation");
        });
        // The next mesh may reuse the memory, since its commands run later.
        fPool.releaseBuffers();
    }
    // Others wait for the last event; without a flush they could wait forever.
    fCL.clFlush(fQueue);
}

Status DeformationQueue::collectArguments(DeformableMesh& mesh, KernelLibrary& library)
{
    Status status = collectPasses(mesh, library, 0);
    for (const auto& [deformer, pass] : mesh.state().active) {
        if (status.ok())
            status = ofDeformer(*deformer, pass->setArguments(fFrame));
    }
    return status;
}

Status DeformationQueue::prepare(DeformableMesh& mesh, KernelLibrary& library)
{
    return collectPasses(mesh, library, 1);
}

// Creates the kernels of at least `leastPasses` passes of each deformer, also of one whose present
// settings need none.
Status DeformationQueue::collectPasses(DeformableMesh& mesh, KernelLibrary& library,
                                       unsigned leastPasses)
{
    MeshState& state = mesh.state();
    state.active.clear();
    state.passes.resize(mesh.deformers().size());
    for (std::size_t i = 0; i < mesh.deformers().size(); ++i) {
        Deformer& deformer = *mesh.deformers()[i];
        if (!deformer.enabled)
            continue;
        if (std::string text = deformer.mismatch(mesh.geometry()); !text.empty())
            return ofDeformer(deformer, Status(std::move(text)));
        const unsigned count = deformer.passCount();
        for (unsigned pass = 0; pass < std::max(count, leastPasses); ++pass) {
            if (pass == state.passes[i].size())
                state.passes[i].push_back(std::make_unique<KernelPass>(fCL, deformer, pass));
            KernelPass& kernel = *state.passes[i][pass];
            if (Status status = kernel.prepare(library); !status.ok())
                return ofDeformer(deformer, std::move(status));
            if (pass < count)
                state.active.push_back({&deformer, &kernel});
        }
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

// Only the last pass waits for the acquired vertex buffers: those before may run while the renderer
// still draws.
Status DeformationQueue::enqueuePasses(DeformableMesh& mesh)
{
    MeshState& state = mesh.state();
    const std::size_t vertexCount = mesh.geometry().rest.vertexCount();
    VertexMemory input = state.restMemory;
    VertexMemory spare; // scratch that no later pass reads
    fWaits = AutoCLEventList();
    for (std::size_t i = 0; i < state.active.size(); ++i) {
        const auto& [deformer, pass] = state.active[i];
        const bool inputIsScratch = i > 0;
        VertexMemory output;
        Status status;
        if (i + 1 == state.active.size()) {
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
        status = statusOf(pass->enqueue(fQueue, static_cast<cl_uint>(vertexCount), input, output,
                                        fFrame.memory(), fWaits, enqueued),
                          "enqueuing the kernel");
        if (!status.ok())
            return ofDeformer(*deformer, std::move(status));
        noteCommand(deformer->name(), enqueued);
        if (inputIsScratch && output.positions != input.positions)
            spare = input;
        input = output;
    }
    return {};
}

Status DeformationQueue::enqueueRestPose(DeformableMesh& mesh)
{
    MeshState& state = mesh.state();
    const std::size_t bytes = mesh.geometry().rest.vertexCount() * sizeof(Vector3);
    const auto copy = [&](cl_mem source, const TopenCLSharedBuffer& target) {
        AutoCLObject<cl_event> enqueued;
        Status status =
            statusOf(fCL.clEnqueueCopyBuffer(fQueue, source, target.fMem.get(), 0, 0, bytes,
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
    if (fAcquiredNormals.get() != fAcquiredPositions.get()) // those of the batch have one event
        fWaits.add(fAcquiredNormals);
    return status;
}

Status DeformationQueue::acquire(const TopenCLSharedBuffer& buffer,
                                 AutoCLObject<cl_event>& acquired)
{
    TopenCLSharedBufferMgr& manager = TopenCLInfo::theOne().sharedBufferMgr();
    cl_int status = manager.EnqueueAcquireSharedCLBuffer(fQueue, &buffer, acquired.receive());
    if (status == CL_SUCCESS && !buffer.fInBatch) {
        fAcquiredAlone.push_back(buffer.fMem.get());
        AutoCLObject<cl_event> enqueued = acquired;
        noteCommand("Acquire", enqueued);
    }
    // The acquire of the batch failed when the evaluation was opened.
    if (status == CL_SUCCESS && buffer.fInBatch && !acquired.get())
        status = CL_INVALID_EVENT;
    return statusOf(status, "acquiring a vertex buffer");
}

Status DeformationQueue::createScratch(std::size_t vertexCount, VertexMemory& scratch)
{
    scratch = {createScratchArray(vertexCount), createScratchArray(vertexCount)};
    return statusOf(scratch.positions && scratch.normals ? CL_SUCCESS
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

// The last command that was enqueued covers all before it.
void DeformationQueue::noteCommand(const char* name, AutoCLObject<cl_event>& enqueued)
{
    if (!enqueued.get())
        return;
    if (fTimeline)
        fTimeline->add(name, enqueued);
    fLast = std::move(enqueued);
}

} // namespace vyra
