// The evaluation of a scene with OpenCL, frame after frame: how a host drives the library.
#pragma once

#include "host/EvaluationId.h"
#include "viewer/Failure.h"
#include "viewer/KernelFiles.h"
#include "viewer/MeshEvaluator.h"
#include "viewer/OpenCLFunctions.h"
#include "viewer/Scene.h"
#include "viewer/WorkerQueues.h"

#include <functional>
#include <optional>
#include <string>
#include <vector>

#include <QOpenGLFunctions_3_3_Core>

namespace viewer {

struct EvaluationCounts {
    std::size_t evaluations = 0;
    // Commands, over all evaluations, by the events that they gave.
    std::size_t acquires = 0;
    std::size_t releases = 0;
    std::size_t programsBuilt = 0;
    std::size_t kernelsServed = 0;
    std::size_t buffersCreated = 0; // by the pools
    std::size_t buffersReused = 0;
};

// Needs the library to be valid. Everything is called on the renderer's thread, its context
// current; the deformers themselves run on the threads of TBB. One drawn frame is
//
//     evaluate, waitUntilDrawable, (draw), renderingComplete
class Evaluation {
public:
    Evaluation(QOpenGLFunctions_3_3_Core& gl, const OpenCLFunctions& cl, Scene& scene);
    ~Evaluation();
    Evaluation(const Evaluation&) = delete;
    Evaluation& operator=(const Evaluation&) = delete;

    // Takes over a mesh whose vertex buffers are new, unless it has fewer vertices than the library
    // wants: then it stays with the CPU. To be called for every mesh before the first evaluation.
    Status adopt(CharacterMesh& mesh);

    // Enqueues a frame. `whileOpen` is called when the evaluation is open and no deformer runs yet.
    Status evaluate(const em::Id& id, const std::function<Status()>& whileOpen);

    // Deforms with this text of a kernel file from the next frame on, unless it cannot be used:
    // then says why, and the last good one goes on. Between two frames.
    std::optional<std::string> replaceKernelFile(const std::string& file,
                                                 const std::string& source);

    // After this the renderer may draw what was evaluated: waits where the library leaves it to the
    // host.
    void waitUntilDrawable();

    // To be called after drawing.
    void renderingComplete();

    // Waits until nothing enqueued here uses a vertex buffer outside the batch.
    void waitForSingles();

    EvaluationCounts counts() const;
    // Vertex buffers that are acquired and released together.
    std::size_t batchSize() const;

private:
    void finishDrawingOfSingles();
    Status deformMeshes();
    Status releaseSingles();
    bool allBatched() const;
    void countCommands();

    QOpenGLFunctions_3_3_Core& fGL;
    const OpenCLFunctions& fCL;
    Scene& fScene;
    WorkerQueues fWorkers;
    Handover fHandover;
    const cl_event* fBatchReleased; // where the library keeps the event of its last release
    AutoCLObject<cl_event> fSinglesReleased; // of the last evaluation that had any
    std::uint64_t fMeshNumber = 0;
    KernelFiles fKernels;
    EvaluationCounts fCounts;
    std::vector<cl_event> fAcquires; // scratch of countCommands
};

} // namespace viewer
