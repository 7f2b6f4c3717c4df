// The parts behind the Evaluator. Internal.
#pragma once

#include "evaluator/DeformationQueue.h"
#include "evaluator/Evaluator.h"
#include "evaluator/KernelLibrary.h"
#include "evaluator/MeshState.h"

#include "diagnostics/AutoCLEventList.h"
#include "diagnostics/AutoCLObject.h"

#include <cstddef>
#include <memory>
#include <unordered_map>
#include <vector>

#include <CL/cl.h>
#include <tbb/task_arena.h>

namespace vyra {

// The operations have the contracts of the Evaluator's.
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
    const Status& status() const { return fStatus; }
    bool usesOpenCL() const { return !fQueues.empty(); }
    Status replaceKernelFile(const std::string& file, const std::string& source);
    EvaluatorCounts counts() const;
    std::size_t batchSize() const;

private:
    void startOpenCL();
    Status share(DeformableMesh& mesh, const VertexBuffers& buffers);
    RestPose& restPose(const std::shared_ptr<const MeshGeometry>& geometry);
    void destroy(DeformableMesh& mesh);

    bool mayDeform();
    void refuse(const char* reason);
    AutoCLObject<cl_event> batchAcquireEvent();
    void deformAll();
    void deformOnCpu(DeformableMesh& mesh);
    void reportLastEvents();
    void releaseAlone();
    void writeCpuSurfaces();
    void collectStatus();
    void destroyRemovedMeshes();
    bool anyOutsideBatch() const;
    void fail(Status status);

    EvaluatorSettings fSettings;
    const OpenCLFunctions* fCL = nullptr; // null without OpenCL
    Status fStatus;
    Status fStartStatus; // why there is no OpenCL although the library runs
    tbb::task_arena fArena;
    std::unique_ptr<KernelLibrary> fLibrary;
    std::vector<std::unique_ptr<DeformationQueue>> fQueues;

    // The rest poses on the device, by geometry; the weak pointer shows that the geometry is gone.
    struct SharedRestPose {
        std::weak_ptr<const MeshGeometry> geometry;
        RestPose rest;
    };
    std::unordered_map<const MeshGeometry*, SharedRestPose> fRestPoses;
    std::vector<std::unique_ptr<DeformableMesh>> fMeshes;

    const cl_event* fBatchReleased = nullptr; // where the manager stores its last release event
    AutoCLObject<cl_event> fReleasedAlone;    // of the last release outside the batch
    std::vector<cl_mem> fAlone;               // of one release outside the batch
    AutoCLEventList fAloneWaits;
    bool fDeforming = false;
    bool fEvaluating = false;
    EvaluatorCounts fCounts;
};

} // namespace vyra
