#include "DeformerCases.h"

#include "evaluator/SmoothDeformer.h"
#include "evaluator/VectorMath.h"
#include "evaluator/WaveDeformer.h"

#include <cmath>
#include <utility>

#include <gtest/gtest.h>

using namespace vyra;

namespace {

using ::skin, ::morph;

// Neither a rotation nor symmetrical, and not at the origin.
constexpr MatrixRows kSpace{0.5f, 0.1f, 0, 1, 0, 0.7f, 0.2f, -1, 0.3f, 0, 0.9f, 0.5f};

std::unique_ptr<SkinDeformer> skin(const MeshGeometry& geometry, float side, unsigned precision = 0)
{
    std::vector<SkinWeights::BoneIndices> indices;
    std::vector<SkinWeights::BoneWeights> weights;
    for (unsigned i = 0; i < geometry.rest.vertexCount(); ++i) {
        const unsigned group = i / kProbes;
        const float part = static_cast<float>(group % 5) / 8;
        indices.push_back({group % 3, 2, 0, 1});
        weights.push_back({0.125f, part, 0.625f - part, 0.25f});
    }
    auto result = skin(SkinWeights(indices, weights),
                       {{side * 0.8f, -0.6f, 0, 1, side * 0.6f, 0.8f, 0, 2, 0, 0, 1, 3},
                        {side, 0.5f, 0, 0, 0, 1, 0, -1, 0, 0.2f, 1, 0},
                        {side * 2, 0, 0, 0, 0, 0.7f, -0.7f, 0, 0, 0.7f, 0.7f, 1}});
    if (side == 0) // all bones move all vertices to one point, which has no normal
        result->bones.assign(3, {0, 0, 0, 1, 0, 0, 0, 2, 0, 0, 0, 3});
    result->precision = precision;
    return result;
}

std::unique_ptr<WaveDeformer> wave(WaveDeformer::Axis displacement, float amplitude)
{
    auto result = std::make_unique<WaveDeformer>();
    result->amplitude = amplitude;
    result->phase = 50000.7f; // grows with the time that a host runs
    result->displacement = displacement;
    result->space = kSpace;
    return result;
}

// `targets` morph targets, the second of which has the weight 0 and is not a number.
std::unique_ptr<MorphDeformer> morph(const MeshGeometry& geometry, unsigned targets,
                                     bool withNormals)
{
    std::vector<MorphTarget> list(targets);
    std::vector<float> weights(targets);
    for (unsigned t = 0; t < targets; ++t) {
        weights[t] = t == 1 ? 0 : 0.1f + 0.05f * static_cast<float>(t);
        for (const Vector3& p : geometry.rest.positions) {
            const float x = t == 1 ? NAN : std::sin(static_cast<float>(t + 1) * p.x);
            list[t].positionDeltas.push_back({x, p.y, p.z * x});
            if (withNormals && t % 3 == 0)
                list[t].normalDeltas.push_back({p.y, x, p.z});
        }
    }
    auto result = morph(list, std::move(weights));
    result->strength = 0.5f;
    return result;
}

std::unique_ptr<SmoothDeformer> smooth(const MeshGeometry& geometry, unsigned iterations)
{
    auto result = std::make_unique<SmoothDeformer>(SmoothTopology(geometry));
    result->iterations = iterations;
    result->weight = 0.75f;
    return result;
}

} // namespace

const std::vector<DeformerCase>& deformerCases()
{
    using Mesh = const MeshGeometry&;
    static const std::vector<DeformerCase> cases = {
        {"skin", [](Mesh m) { return skin(m, 1); }, true},
        {"skinMirrored", [](Mesh m) { return skin(m, -1); }, true},
        {"skinInDouble", [](Mesh m) { return skin(m, 1, SkinDeformer::kDouble); }, true},
        {"skinCollapsed", [](Mesh m) { return skin(m, 0); }, false},
        {"twist", [](Mesh) { return twist(2, kSpace); }, true},
        {"wave", [](Mesh) { return wave(WaveDeformer::kY, 0.05f); }, true},
        {"waveOfCompression", [](Mesh) { return wave(WaveDeformer::kX, 0.05f); }, true},
        {"waveInsideOut", [](Mesh) { return wave(WaveDeformer::kX, 0.3f); }, true},
        {"morphInOnePass", [](Mesh m) { return morph(m, 5, true); }, false},
        {"morphInThreePasses", [](Mesh m) { return morph(m, 18, true); }, false},
        {"morphPositions", [](Mesh m) { return morph(m, 10, false); }, false},
        {"smoothOnce", [](Mesh m) { return smooth(m, 1); }, false},
        {"smoothSevenTimes", [](Mesh m) { return smooth(m, 7); }, false}};
    return cases;
}

std::unique_ptr<SkinDeformer> skin(const SkinWeights& weights, std::vector<MatrixRows> bones)
{
    auto result = std::make_unique<SkinDeformer>(weights);
    result->bones = std::move(bones);
    return result;
}

std::unique_ptr<TwistDeformer> twist(float angle, const MatrixRows& space)
{
    auto result = std::make_unique<TwistDeformer>();
    result->angle = angle;
    result->space = space;
    return result;
}

std::unique_ptr<MorphDeformer> morph(const std::vector<MorphTarget>& targets,
                                     std::vector<float> weights)
{
    auto result = std::make_unique<MorphDeformer>(MorphTargets(targets));
    result->weights = std::move(weights);
    return result;
}

void expectNear(const Vector3& actual, const Vector3& expected)
{
    EXPECT_LT(length(wide(actual) - wide(expected)), kTolerance)
        << actual.x << ' ' << actual.y << ' ' << actual.z << ", expected " << expected.x << ' '
        << expected.y << ' ' << expected.z;
}

MeshGeometry makeSheet(unsigned side)
{
    MeshGeometry sheet;
    for (unsigned i = 0; i < side * side; ++i) {
        const float x = static_cast<float>(i % side) / static_cast<float>(side - 1);
        const unsigned row = i / side;
        const float z = static_cast<float>(row) / static_cast<float>(side - 1);
        const float slope = 1.5f * std::cos(5 * x);
        const float length = std::sqrt(1 + slope * slope);
        sheet.rest.positions.push_back({x, 0.3f * std::sin(5 * x), z});
        sheet.rest.normals.push_back({-slope / length, 1 / length, 0});
        if (i % side + 1 < side && row + 1 < side)
            for (const unsigned corner : {0U, side, 1U, 1U, side, side + 1})
                sheet.triangles.push_back(i + corner);
    }
    sheet.triangles.resize(sheet.triangles.size() - 3);
    sheet.triangles.insert(sheet.triangles.end(), {0, 1, side});
    return sheet;
}
