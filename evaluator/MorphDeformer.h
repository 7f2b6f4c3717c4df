// Morph targets.
#pragma once

#include "evaluator/ConstantArray.h"
#include "evaluator/Deformer.h"

#include <cstddef>
#include <string>
#include <vector>

namespace vyra {

// What a morph target adds to each vertex of a mesh at weight 1.
struct MorphTarget {
    std::vector<Vector3> positionDeltas;
    std::vector<Vector3> normalDeltas; // empty: normals stay
};

// The morph targets of a mesh. Copies share the arrays. Each target has device memory of its own,
// from the first evaluation in which its weight is not 0.
//
// Targets of different sizes are not an error here: problem() names the first, and the deformer
// reports it.
class VYRA_EVALUATOR_API MorphTargets {
public:
    // No targets.
    MorphTargets() = default;
    explicit MorphTargets(const std::vector<MorphTarget>& targets);

    std::size_t targetCount() const noexcept { return fDeltas.size(); }
    std::size_t vertexCount() const noexcept { return fVertexCount; }
    // Whether any target changes normals.
    bool hasNormals() const noexcept { return fHasNormals; }
    // Returns the error in the targets; empty if they can be used.
    const std::string& problem() const noexcept { return fProblem; }

    // The deltas of a target, one component after the other: x of all vertices, then y, then z,
    // and, with hasNormals(), the same of the normals.
    const ConstantArray& deltas(std::size_t target) const { return fDeltas[target]; }

private:
    std::vector<ConstantArray> fDeltas;
    std::size_t fVertexCount = 0;
    bool fHasNormals = false;
    std::string fProblem;
};

// Adds the deltas of each target times its weight to positions and normals, and gives the normals
// the length 1 again. Source: Khronos, glTF 2.0, section 3.7.2.2, "Morph Targets".
//
// Targets whose weight is 0 are not read. A kernel adds up to eight targets; more take more passes.
class VYRA_EVALUATOR_API MorphDeformer : public Deformer {
public:
    explicit MorphDeformer(MorphTargets targets);

    // One per target, 0 at first.
    std::vector<float> weights;
    // Multiplies all weights.
    float strength = 1;

    const MorphTargets& targets() const noexcept { return fTargets; }

    const char* name() const override { return "morph"; }
    [[nodiscard]] std::string mismatch(const MeshGeometry& geometry) const override;
    unsigned passCount() const override;
    KernelSource kernel(unsigned pass) const override;
    void setArguments(unsigned pass, KernelArguments& arguments) override;
    void deform(const MeshGeometry& geometry, Surface& surface) const override;
    // "strength".
    std::vector<DeformerParameter> parameters() override;

private:
    float effectiveWeight(std::size_t target) const { return strength * weights[target]; }

    MorphTargets fTargets;
};

} // namespace vyra
