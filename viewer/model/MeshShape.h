// Data of a mesh in the form that the evaluator and its deformers take.
#pragma once

#include "evaluator/Geometry.h"
#include "evaluator/MorphDeformer.h"
#include "evaluator/SkinDeformer.h"
#include "evaluator/SmoothDeformer.h"
#include "viewer/model/Model.h"

#include <memory>

namespace viewer {

// Constant data of one mesh, shared by all characters.
struct MeshShape {
    std::shared_ptr<const vyra::MeshGeometry> geometry;
    vyra::SkinWeights skinWeights;   // empty in a mesh without bones
    vyra::MorphTargets morphTargets; // empty in a mesh without targets
    vyra::SmoothTopology topology;
};

// Converts the geometry, weights and targets of `mesh`, and computes its topology.
[[nodiscard]] MeshShape shapeOf(const Mesh& mesh);

} // namespace viewer
