// Deformers with settings that use all of their parts, for tests that run over all of them.
#pragma once

#include "evaluator/MorphDeformer.h"
#include "evaluator/SkinDeformer.h"
#include "evaluator/TwistDeformer.h"
#include "tests/support/Named.h"

#include <functional>
#include <memory>
#include <vector>

struct DeformerCase : Named {
    std::function<std::unique_ptr<vyra::Deformer>(const vyra::MeshGeometry&)> make;
    // Whether a point's movement depends on its position only, and normals follow the moved
    // surface. Vertices that belong together are kProbes in a row.
    bool isSmoothMap;
};

inline constexpr unsigned kProbes = 6;

const std::vector<DeformerCase>& deformerCases();

std::unique_ptr<vyra::SkinDeformer> skin(const vyra::SkinWeights& weights,
                                         std::vector<vyra::MatrixRows> bones);
std::unique_ptr<vyra::TwistDeformer> twist(float angle,
                                           const vyra::MatrixRows& space = vyra::kIdentityRows);
std::unique_ptr<vyra::MorphDeformer> morph(const std::vector<vyra::MorphTarget>& targets,
                                           std::vector<float> weights);

constexpr double kTolerance = 1e-6;

void expectNear(const vyra::Vector3& actual, const vyra::Vector3& expected);

// A wavy sheet with `side` vertices along each edge. The last vertex has no triangle, and the first
// has two that cancel.
vyra::MeshGeometry makeSheet(unsigned side);
