#include "evaluator/DeformableMesh.h"

#include "evaluator/MeshState.h"

namespace vyra {

DeformableMesh::DeformableMesh(std::shared_ptr<const MeshGeometry> geometry,
                               std::unique_ptr<MeshState> state)
    : fGeometry(std::move(geometry)), fState(std::move(state))
{
}

DeformableMesh::~DeformableMesh() = default;

void DeformableMesh::add(std::unique_ptr<Deformer> deformer)
{
    fDeformers.push_back(std::move(deformer));
}

bool DeformableMesh::usesOpenCL() const
{
    return fState->usesOpenCL;
}

const Status& DeformableMesh::status() const
{
    return fState->status;
}

Surface DeformableMesh::deformOnCpu() const
{
    Surface surface = fGeometry->rest;
    for (const auto& deformer : fDeformers) {
        if (deformer->enabled)
            deformer->deform(*fGeometry, surface);
    }
    return surface;
}

} // namespace vyra
