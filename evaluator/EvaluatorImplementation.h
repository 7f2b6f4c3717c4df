// The implementation of Evaluator. Internal.
#pragma once

#include "evaluator/DeformationQueue.h"
#include "evaluator/Evaluator.h"
#include "evaluator/KernelLibrary.h"
#include "evaluator/MeshState.h"

#include "diagnostics/AutoCLEventList.h"
#include "diagnostics/AutoCLObject.h"

#include <cstddef>
#include <cstdint>
#include <memory>
#include <unordered_map>
#include <vector>

#include <CL/cl.h>
#include <tbb/task_arena.h>

namespace vyra {

// The operations have the contracts of the operations of Evaluator.
class EvaluatorImplementation {
public:
    explicit EvaluatorImplementation(EvaluatorSettings settings);
    ~EvaluatorImplementation();

    DeformableMesh& add(std::unique_ptr<DeformableMesh> mesh, const VertexBuffers& buffers);
    void remove(DeformableMesh& mesh);
    Status prepare();
    void evaluate(const em::Id& id);
    void deform();
    void waitUntilDrawable();
    void renderingComplete();
    void finish();
    const Status& status() const noexcept { return fStatus; }
    bool usesOpenCL() const { return !fQueues.empty(); }
    Status replaceKernelFile(const std::string& file, const std::string& source);
    EvaluatorCounts counts() const;
    std::size_t batchSize() const;

private:
    static TopenCLSharedBufferMgr& manager();
    void startOpenCL();
    Status share(DeformableMesh& mesh, const VertexBuffers& buffers);
    Status shareBuffer(std::uint32_t name, void* d3d11Buffer, std::size_t bytes, const char* what,
                       const TopenCLSharedBuffer*& record);
    static void unshare(MeshState& state);
    RestPose& restPose(const std::shared_ptr<const MeshGeometry>& geometry);
    void dropUnusedRestPoses();
    void destroy(DeformableMesh& mesh);

    [[nodiscard]] bool mayDeform();
    void refuse(const char* reason, cl_int status = CL_SUCCESS);
    void evaluateWithOpenCL(const em::Id& id);
    const TopenCLSharedBuffer* findProbe() const;
    void deformMeshes();
    void resetStatuses();
    void deformAll();
    void collectWork();
    static void deformOnCpu(DeformableMesh& mesh);
    static Status deformOnCpu(const DeformableMesh& mesh, const Deformer& deformer,
                              Surface& surface);
    void reportLastEvents();
    void releaseUnbatched();
    void releaseLeftOver();
    void enqueueUnbatchedRelease();
    void writeCpuSurfaces();
    void collectStatus();
    void destroyRemovedMeshes();
    void finishIfUnordered();
    bool anyOutsideBatch() const;
    void pollUntilComplete(cl_event event) const;
    void fail(Status status);

    EvaluatorSettings fSettings;
    const OpenCLFunctions* fCL = nullptr; // null without OpenCL
    Status fStatus;
    Status fFailure;     // of the evaluation that runs
    Status fStartStatus; // why OpenCL is off although the library runs
    tbb::task_arena fArena;
    std::unique_ptr<KernelLibrary> fLibrary;
    std::vector<std::unique_ptr<DeformationQueue>> fQueues;

    // The rest poses on the device, by geometry; the weak pointer shows that the geometry was
    // destroyed.
    struct SharedRestPose {
        std::weak_ptr<const MeshGeometry> geometry;
        RestPose rest;
    };
    std::unordered_map<const MeshGeometry*, SharedRestPose> fRestPoses;
    std::vector<std::unique_ptr<DeformableMesh>> fMeshes;
    // One task of an evaluation: all meshes of a queue, or one mesh on the CPU.
    struct Work {
        DeformationQueue* queue = nullptr;
        DeformableMesh* mesh = nullptr;
    };
    std::vector<Work> fWork; // of this evaluation

    const cl_event* fBatchReleased = nullptr;  // where the manager stores its last release event
    AutoCLObject<cl_event> fUnbatchedReleased; // of the last release outside the batch
    std::vector<cl_mem> fUnbatched;            // acquired outside the batch, to be released
    AutoCLEventList fUnbatchedWaits;           // of that release
    bool fBusy = false;                        // an evaluation runs
    bool fUnordered = false;                   // the last release failed, or gave no event
    EvaluatorCounts fCounts;
};

} // namespace vyra
