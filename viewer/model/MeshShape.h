// A mesh of the model as the evaluator and its deformers take it.
#pragma once

#include "evaluator/Geometry.h"
#include "evaluator/MorphDeformer.h"
#include "evaluator/SkinDeformer.h"
#include "evaluator/SmoothDeformer.h"
#include "viewer/model/Model.h"

#include <memory>

namespace viewer {

// What all characters share of one mesh.
struct MeshShape {
    std::shared_ptr<const vyra::MeshGeometry> geometry;
    vyra::SkinWeights skinWeights;   // empty in a mesh without bones
    vyra::MorphTargets morphTargets; // empty in a mesh without targets
    vyra::SmoothTopology topology;
};

MeshShape shapeOf(const Mesh& mesh);

} // namespace viewer
