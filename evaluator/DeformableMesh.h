// One mesh with its chain of deformers.
#pragma once

#include "evaluator/Deformer.h"
#include "evaluator/EvaluatorExport.h"
#include "evaluator/Geometry.h"
#include "evaluator/Status.h"

#include <cstddef>
#include <memory>
#include <utility>
#include <vector>

namespace vyra {

struct MeshState; // device data and shared buffers, internal

// A mesh in its rest pose, its chain of deformers, and the vertex buffers that receive the result.
// Created by Evaluator::createMesh and owned by the evaluator.
//
// Used on the renderer's thread between evaluations.
class VYRA_EVALUATOR_API DeformableMesh {
public:
    ~DeformableMesh();
    DeformableMesh(const DeformableMesh&) = delete;
    DeformableMesh& operator=(const DeformableMesh&) = delete;

    // Appends a deformer to the chain, constructed from `arguments`. The mesh owns it.
    template <typename T, typename... Arguments>
    T& add(Arguments&&... arguments)
    {
        auto deformer = std::make_unique<T>(std::forward<Arguments>(arguments)...);
        T& added = *deformer;
        add(std::move(deformer));
        return added;
    }
    void add(std::unique_ptr<Deformer> deformer);

    const std::vector<std::unique_ptr<Deformer>>& deformers() const noexcept { return fDeformers; }
    const MeshGeometry& geometry() const noexcept { return *fGeometry; }

    // Returns whether kernels deform the mesh: false if it has fewer vertices than
    // TopenCLInfo::minimumBufferSize, and without OpenCL.
    bool usesOpenCL() const;
    // Returns the status of the last evaluation of this mesh, or of Evaluator::prepare. A mesh that
    // failed keeps its last good shape.
    const Status& status() const;

    // Returns the rest pose after all enabled deformers, computed on the CPU.
    Surface deformOnCpu() const;

    // Internal.
    MeshState& state() const noexcept { return *fState; }

private:
    friend class Evaluator;
    friend class EvaluatorImplementation;
    DeformableMesh(std::shared_ptr<const MeshGeometry> geometry, std::unique_ptr<MeshState> state);

    std::shared_ptr<const MeshGeometry> fGeometry;
    std::unique_ptr<MeshState> fState;
    std::vector<std::unique_ptr<Deformer>> fDeformers;
};

} // namespace vyra
