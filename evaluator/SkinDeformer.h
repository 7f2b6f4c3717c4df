// Linear-blend skinning.
#pragma once

#include "evaluator/ConstantArray.h"
#include "evaluator/Deformer.h"

#include <array>
#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

namespace vyra {

// The bones that each vertex of a mesh follows: four per vertex, with weights that add up to 1.
// Copies share the arrays, so meshes that are drawn several times share their device memory.
//
// Weights that cannot be used are not an error here: problem() names the first, and the deformer
// reports it.
class VYRA_EVALUATOR_API SkinWeights {
public:
    static constexpr std::size_t kInfluences = 4;
    using BoneIndices = std::array<std::uint32_t, kInfluences>;
    using BoneWeights = std::array<float, kInfluences>;

    struct Influence {
        std::uint32_t bone = 0;
        float weight = 0;
    };

    // How far the sum of four given weights may be from 1. Weights that a file holds in 8 bits
    // differ by up to 4 * 0.5 / 255.
    static constexpr float kTolerance = 0.01f;

    // No vertices.
    SkinWeights() = default;

    // A list of influences for each vertex. Keeps the heaviest four, of equal ones the first, and
    // scales them so that they add up to 1. A problem: a list whose weights are all 0, a weight
    // that is negative or not a number.
    explicit SkinWeights(const std::vector<std::vector<Influence>>& influences);

    // Four influences for each vertex, as files hold them; unused ones have the weight 0. The
    // weights are scaled so that they add up to 1. A problem: arrays of different lengths, weights
    // whose sum is not within kTolerance of 1, a weight that is negative or not a number.
    SkinWeights(const std::vector<BoneIndices>& bones, const std::vector<BoneWeights>& weights);

    std::size_t vertexCount() const;
    // The highest index of a bone with a weight above 0; 0 without vertices.
    std::uint32_t highestBone() const noexcept { return fHighestBone; }
    // Returns the error in the weights; empty if they can be used.
    const std::string& problem() const noexcept { return fProblem; }

    // BoneIndices and BoneWeights, one per vertex. Influences of weight 0 refer to a bone that the
    // vertex follows.
    const ConstantArray& bones() const noexcept { return fBones; }
    const ConstantArray& weights() const noexcept { return fWeights; }

private:
    void store(std::vector<BoneIndices>&& bones, std::vector<BoneWeights>&& weights);

    ConstantArray fBones;
    ConstantArray fWeights;
    std::uint32_t fHighestBone = 0;
    std::string fProblem;
};

// Linear-blend skinning: with weights w and matrices M of its four bones, a point p becomes the sum
// of w M p. Normals go through the cofactors of the blended matrix, so that they stay perpendicular
// where bones stretch or shear, and outside where they mirror. Source: J. P. Lewis, M. Cordner and
// N. Fong, Pose Space Deformation, SIGGRAPH 2000, section 2.1.
//
// The kernel computes in single precision unless `precision` asks for double. In single precision
// each coordinate of a position deviates from the exact one by at most
//
//     8.01 * 2^-24 * S,    S = sum of w (|m . p| + |t|) over the bones,
//
// where m is the row of the bone's matrix for that coordinate, |m . p| the sum of the products'
// magnitudes, and t the translation: eight roundings, in any order, fused or not (N. J. Higham,
// Accuracy and Stability of Numerical Algorithms, 2002, section 3.1). So the error grows with the
// distance from the origin: 0.5 mm at 1 km if the bones move the mesh there from its own origin.
// Normals depend on the linear part only, so their error does not grow: with P the matrix of
// cofactors in which all terms are positive, it is at most 15 * 2^-24 * |P n| / |cofactors n| +
// 6 * 2^-24. That holds for matrices that scale by factors from 1e-9 to 1e9.
class VYRA_EVALUATOR_API SkinDeformer : public Deformer {
public:
    enum Precision : unsigned { kSingle, kDouble };

    explicit SkinDeformer(SkinWeights weights);

    // For each bone the transform from the mesh's rest pose to its present place. Set per
    // evaluation.
    std::vector<MatrixRows> bones;
    // A Precision. Double needs a device that supports it.
    unsigned precision = kSingle;

    const SkinWeights& weights() const noexcept { return fWeights; }

    const char* name() const override { return "skin"; }
    [[nodiscard]] std::string mismatch(const MeshGeometry& geometry) const override;
    KernelSource kernel(unsigned pass) const override;
    void setArguments(unsigned pass, KernelArguments& arguments) override;
    void deform(const MeshGeometry& geometry, Surface& surface) const override;
    // "precision".
    std::vector<DeformerParameter> parameters() override;

private:
    SkinWeights fWeights;
    std::vector<float> fColumns; // of all bones, for the kernel; kept for its memory
};

} // namespace vyra
