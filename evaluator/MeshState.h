// The evaluator's internal data of one mesh. Internal.
#pragma once

#include "evaluator/ConstantArray.h"
#include "evaluator/DeformableMesh.h"
#include "evaluator/KernelPass.h"

#include "interop/TopenCLSharedBuffer.h"

#include <memory>
#include <string>
#include <vector>

namespace vyra {

class DeformationQueue;

// The rest pose of a geometry, shared by all meshes that refer to it.
struct RestPose {
    ConstantArray positions;
    ConstantArray normals;
};

struct MeshState {
    bool usesOpenCL = false;
    Status creation;      // why the mesh can never be deformed
    Status status;        // of the last evaluation
    bool removed = false; // to be destroyed when the evaluation ends

    // Used with OpenCL only.
    RestPose rest;
    VertexMemory restMemory;                        // of `rest`
    const TopenCLSharedBuffer* positions = nullptr; // records of the manager
    const TopenCLSharedBuffer* normals = nullptr;
    DeformationQueue* queue = nullptr;
    // By deformer of the mesh, then by pass. Kept while a deformer is not enabled.
    std::vector<std::vector<std::unique_ptr<KernelPass>>> passes;
    struct ActivePass {
        const Deformer* deformer = nullptr;
        KernelPass* pass = nullptr;
    };
    std::vector<ActivePass> active; // in the order of this evaluation
    bool showsRestPose = false;     // the vertex buffers hold it: nothing to do without deformers

    // Used without OpenCL only.
    Surface surface; // the result of the last evaluation
};

// Returns why a mesh of this geometry cannot be deformed; empty if it can. Examines every vertex.
std::string findProblem(const MeshGeometry& geometry);

} // namespace vyra
