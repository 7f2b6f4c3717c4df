// The evaluation of deformable meshes with OpenCL, frame after frame.
#pragma once

#include "bridge/IDeformerEvaluatorBridgeAPI.h"
#include "evaluator/DeformableMesh.h"
#include "evaluator/EvaluatorExport.h"
#include "evaluator/Geometry.h"
#include "evaluator/Status.h"
#include "evaluator/VertexBuffers.h"

#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <string>
#include <vector>

namespace vyra {

class EvaluatorImplementation; // internal

// The functions and directories that the host supplies. The functions are called on the thread that
// evaluates, with the renderer's context current.
struct EvaluatorSettings {
    // Waits until the renderer's commands are complete: glFinish. Needed with OpenGL.
    std::function<void()> finishRenderer;
    // Submits the renderer's commands: glFlush. Called after drawing; optional.
    std::function<void()> flushRenderer;
    // Copies the vertices of a mesh that the CPU deformed into its vertex buffers; optional.
    std::function<void(DeformableMesh&, const Surface&)> writeVertices;

    // Directories of kernel files, searched in this order before the library's own,
    // TopenCLInfo::getAbsolutePathToResources() + "/kernels".
    std::vector<std::string> kernelDirectories;

    // Receives when the device ran each command, in nanoseconds of `traceClock`; both optional.
    // The queues record times only if the host's profiler samples when the evaluator is created.
    std::function<void(const std::string& track, const char* name, std::int64_t begin,
                       std::int64_t end)>
        traceCommand;
    std::function<std::int64_t()> traceClock;
};

// Counts since the evaluator was constructed.
struct EvaluatorCounts {
    std::size_t evaluations = 0;
    std::size_t acquires = 0; // commands
    std::size_t releases = 0; // commands
    std::size_t programsBuilt = 0;
    std::size_t kernelsCreated = 0;
    std::size_t buffersCreated = 0; // by the pools
    std::size_t buffersReused = 0;  // by the pools
};

// Deforms meshes straight into the renderer's vertex buffers. One drawn frame is
//
//     evaluate(id), waitUntilDrawable(), ... draw ..., renderingComplete()
//
// A failing mesh does not stop the others: it keeps its last good shape, and its status names the
// reason. Every acquired buffer is released, and nothing throws for an OpenCL failure.
//
// Constructed after TopenCLInfo::initialize; without OpenCL every mesh is deformed on the CPU. All
// functions are called on the renderer's thread with its context current; kernels are enqueued by
// worker threads. The destructor waits for OpenCL and destroys all meshes, so it runs before the
// renderer deletes its vertex buffers.
class VYRA_EVALUATOR_API Evaluator : public IDeformerEvaluatorBridgeAPI {
public:
    explicit Evaluator(EvaluatorSettings settings);
    // Withdraws itself from IDeformerEvaluatorBridge if it is published there.
    ~Evaluator() override;
    Evaluator(const Evaluator&) = delete;
    Evaluator& operator=(const Evaluator&) = delete;

    // Adds a mesh. The buffers hold the vertices to draw until the first evaluation, usually the
    // rest pose. The evaluator owns the mesh, whose status reports whether it can be deformed.
    DeformableMesh& createMesh(std::shared_ptr<const MeshGeometry> geometry,
                               const VertexBuffers& buffers);
    // Removes a mesh after its commands are complete; allowed between deform() and PostEvaluate.
    // During an evaluation (in a function of the settings), the mesh is removed when it ends.
    void destroyMesh(DeformableMesh& mesh);

    // Builds the kernels and uploads the constant data of meshes that are new or were changed;
    // evaluate does the same. Returns the first failure.
    Status prepare();

    // Opens evaluation `id`, deforms all meshes, and closes it; an evaluation that the host opened
    // with the same id stays open. 0xFFFE is not an evaluation: nothing is done. status() and
    // DeformableMesh::status report failures.
    void evaluate(const em::Id& id) override;

    // Deforms all meshes in an evaluation that the host opened with
    // TopenCLSharedBufferMgr::PreEvaluate and closes with PostEvaluate. Refused if none is open.
    // Afterwards every event is reported to the batch release, and buffers outside the batch are
    // released. Returns status().
    const Status& deform();

    // Waits until the renderer may draw the evaluated buffers, in the synchronisation modes that
    // leave this wait to the host.
    void waitUntilDrawable();
    // Reports that the renderer's drawing commands are issued. Called after drawing.
    void renderingComplete();
    // Waits until no enqueued command uses a vertex buffer.
    void finish();

    // Returns the first failure of the last evaluation.
    const Status& status() const;
    // Returns false if every mesh is deformed on the CPU, for lack of OpenCL.
    bool usesOpenCL() const;

    // Replaces the kernel file `file` by the text `source` from the next evaluation on. If the
    // text does not compile, or a kernel is missing or has other arguments, returns the reason with
    // the build log, and the former kernel stays in use. A file that no deformer uses is ignored.
    Status replaceKernelFile(const std::string& file, const std::string& source);
    // Returns the directory of the library's own kernels.
    static std::string kernelDirectory();

    EvaluatorCounts counts() const;
    // Returns the number of vertex buffers that are acquired and released together.
    std::size_t batchSize() const;

private:
    std::unique_ptr<EvaluatorImplementation> fImplementation;
};

} // namespace vyra
