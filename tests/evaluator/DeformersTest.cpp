// The CPU sides of skin, morph, twist and wave against closed forms and finite differences, and the
// settings that deformers reject.
#include "DeformerCases.h"
#include "evaluator/SmoothDeformer.h"
#include "evaluator/VectorMath.h"
#include "evaluator/WaveDeformer.h"

#include <cmath>
#include <limits>
#include <numbers>
#include <random>
#include <utility>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using namespace vyra;
using ::skin, testing::HasSubstr;

constexpr float kNan = std::numeric_limits<float>::quiet_NaN();
constexpr float kInfinity = std::numeric_limits<float>::infinity();
constexpr float kPi = std::numbers::pi_v<float>;

MatrixRows moved(float x, float y, float z)
{
    return {1, 0, 0, x, 0, 1, 0, y, 0, 0, 1, z};
}

std::unique_ptr<SkinDeformer> skin(const MatrixRows& bone)
{
    return skin(SkinWeights({{0, 0, 0, 0}}, {{1, 0, 0, 0}}), {bone});
}

// Along x, 4 long, 0.5 high along y.
std::unique_ptr<WaveDeformer> wave(float phase, const MatrixRows& space = kIdentityRows)
{
    auto result = std::make_unique<WaveDeformer>();
    result->amplitude = 0.5f;
    result->wavelength = 4;
    result->phase = phase;
    result->space = space;
    return result;
}

// Checks the position to which the deformer moves the one vertex of a mesh.
void expectVertex(const char* what, const std::unique_ptr<Deformer>& deformer, const Surface& rest,
                  const Surface& expected)
{
    SCOPED_TRACE(what);
    MeshGeometry mesh;
    mesh.rest = rest;
    ASSERT_EQ(deformer->mismatch(mesh), "");
    Surface surface = rest;
    deformer->deform(mesh, surface);
    expectNear(surface.positions[0], expected.positions[0]);
    expectNear(surface.normals[0], expected.normals[0]);
}

TEST(Deformers, DeformMovesVertexAccordingToFormula)
{
    const Vector3 up{0, 1, 0};
    const Surface rest{{{1, 2, 3}}, {up}};
    const float slope = kPi / 4; // of the wave where it crosses 0
    const float slant = std::hypot(1.0f, slope);
    const float twisted = std::hypot(1.0f, kPi / 2);
    // As rounded in a file: in sum 0.995.
    const SkinWeights fourBones({{4, 0, 2, 1}}, {{0.4975f, 0.24875f, 0.124375f, 0.124375f}});
    const std::vector<MatrixRows> fiveBones = {moved(8, 0, 0), moved(0, 8, 0), moved(0, 0, 8),
                                               moved(99, 99, 99), moved(-4, 4, 0)};
    const std::vector<MorphTarget> targets = {
        {{{1, 0, 0}}, {{0, 0, 3}}}, {{{0, 2, 0}}, {}}, {{{kNan, 0, 0}}, {}}};
    expectVertex("translation", skin(moved(5, 6, 7)), rest, {{{6, 8, 10}}, {up}});
    expectVertex("rotation", skin({0, -1, 0, 0, 1, 0, 0, 0, 0, 0, 1, 0}), rest,
                 {{{-2, 1, 3}}, {{-1, 0, 0}}});
    expectVertex("collapse", skin({0, 0, 0, 1, 0, 0, 0, 2, 0, 0, 0, 3}), rest, {{{1, 2, 3}}, {{}}});
    // Half of (-4, 4, 0), a quarter of (8, 0, 0), an eighth of (0, 0, 8) and of (0, 8, 0).
    expectVertex("four bones", skin(fourBones, fiveBones), rest, {{{1, 5, 4}}, {up}});
    expectVertex("quarter turn", twist(kPi / 2), {{{1, 1, 0}}, {{0, 0, 1}}},
                 {{{0, 1, -1}}, {{1 / twisted, kPi / 2 / twisted, 0}}});
    // Half as large, with the axis at x = 1.
    expectVertex("quarter turn in a space",
                 twist(kPi / 2, {0.5f, 0, 0, -0.5f, 0, 0.5f, 0, 0, 0, 0, 0.5f, 0}),
                 {{{2, 2, 0}}, {up}}, {{{1, 2, -1}}, {up}});
    expectVertex("crossing", wave(kPi / 2), rest, {{{1, 2, 3}}, {{-slope / slant, 1 / slant, 0}}});
    expectVertex("crest in a space", wave(0, {0.5f, 0, 0, 0, 0, 0.5f, 0, 0, 0, 0, 0.5f, 0}),
                 {{{2, 2, 3}}, {up}}, {{{2, 3, 3}}, {up}});
    expectVertex("two targets of three", morph(targets, {0.5f, 2, 0}), {{{1, 2, 3}}, {{0, 0, -1}}},
                 {{{1.5f, 6, 3}}, {{0, 0, 1}}});
}

// Appends a point, four points next to it in the plane of its normal, and one above.
void appendProbe(Surface& surface, std::mt19937& random)
{
    constexpr double kStep = 0.01;
    std::uniform_real_distribution<double> number(-1, 1);
    const auto next = [&] { return Vector{number(random), number(random), number(random)}; };
    const Vector position = next();
    const Vector normal = normalised(next());
    const Vector along = normalised(cross(normal, next()));
    const Vector across = cross(normal, along);
    for (const Vector& offset : {Vector{}, along, -1 * along, across, -1 * across, normal}) {
        surface.positions.push_back(narrow(position + kStep * offset));
        surface.normals.push_back(narrow(normal));
    }
}

// The normal of the deformed points, which begin at `first`.
Vector probedNormal(const Surface& surface, std::size_t first)
{
    const auto point = [&](std::size_t i) { return wide(surface.positions[first + i]); };
    const Vector normal = normalised(cross(point(1) - point(2), point(3) - point(4)));
    return (dot(normal, point(5) - point(0)) < 0 ? -1 : 1) * normal;
}

TEST(Deformers, NormalsMatchFiniteDifferencesOfTheDeformedSurface)
{
    constexpr unsigned kSamples = 200;
    std::mt19937 random(1);
    MeshGeometry mesh;
    for (unsigned i = 0; i < kSamples; ++i)
        appendProbe(mesh.rest, random);
    ASSERT_EQ(mesh.rest.vertexCount(), kSamples * kProbes);
    for (const DeformerCase& row : deformerCases()) {
        if (!row.isSmoothMap)
            continue;
        SCOPED_TRACE(row.name);
        Surface surface = mesh.rest;
        row.make(mesh)->deform(mesh, surface);
        unsigned near = 0;
        for (std::size_t first = 0; first < surface.vertexCount(); first += kProbes) {
            const Vector normal = wide(surface.normals[first]);
            near += length(normal - probedNormal(surface, first)) < 0.02 ? 1 : 0;
            EXPECT_NEAR(length(normal), 1, kTolerance);
        }
        // Near a fold, the probe's points lie on both sides of it.
        EXPECT_GE(near, std::string(row.name) == "waveInsideOut" ? kSamples - 20 : kSamples);
    }
}

TEST(SkinWeights, HeaviestFourAreKeptAndSumToOne)
{
    const std::tuple<std::vector<SkinWeights::Influence>, SkinWeights::BoneIndices,
                     SkinWeights::BoneWeights>
        rows[] = {
            {{{7, 2}}, {7, 7, 7, 7}, {1, 0, 0, 0}},
            {{{1, 0.2f}, {2, 0.6f}}, {2, 1, 2, 2}, {0.75f, 0.25f, 0, 0}},
            {{{1, 1}, {2, 4}, {3, 2}, {4, .5f}, {5, 1}, {6, 1}},
             {2, 3, 1, 5},
             {.5f, .25f, .125f, .125f}},
            {{{9, 0}, {3, 1}}, {3, 3, 3, 3}, {1, 0, 0, 0}},
        };
    for (const auto& [given, bones, expected] : rows) {
        const SkinWeights weights({given});
        EXPECT_EQ(weights.problem(), "");
        EXPECT_EQ(weights.bones().values<SkinWeights::BoneIndices>()[0], bones);
        EXPECT_THAT(weights.weights().values<SkinWeights::BoneWeights>()[0],
                    testing::Pointwise(testing::FloatNear(1e-7f), expected));
        EXPECT_EQ(weights.highestBone(), *std::max_element(bones.begin(), bones.end()));
    }
}

TEST(Deformers, MismatchNamesInvalidSettings)
{
    using Lists = std::vector<std::vector<SkinWeights::Influence>>;
    const MatrixRows flat{1, 0, 0, 0, 0, 1, 0, 0, 0, 0, 0, 0};
    const SkinWeights one({{0, 2, 0, 0}}, {{0.5f, 0.5f, 0, 0}});
    MeshGeometry mesh;
    mesh.rest = {{{}}, {{}}};
    auto smooth = [mesh](std::vector<std::uint32_t> triangles) mutable {
        mesh.triangles = std::move(triangles);
        return std::make_unique<SmoothDeformer>(SmoothTopology(mesh));
    };
    const auto with = [](auto deformer, auto&& change) {
        change(*deformer);
        return deformer;
    };
    const std::pair<std::unique_ptr<Deformer>, const char*> rows[] = {
        {skin(SkinWeights(), {}), "skin weights for 0 vertices, and the mesh has 1"},
        {skin(one, {moved(0, 0, 0), moved(0, 0, 0)}), "refer to bone 2, and there are 2"},
        {skin(SkinWeights({{}, {}}, {{1, 0, 0, 0}}), {}), "for 2 vertices and weights for 1"},
        {skin(SkinWeights({{}}, {{0.5f, 0.4f, 0, 0}}), {}), "vertex 0 add up to 0.9"},
        {skin(SkinWeights({{}}, {{1.5f, -0.5f, 0, 0}}), {}), "0 is negative or not a number"},
        {skin(SkinWeights({{}}, {{kInfinity, 1, 0, 0}}), {}), "0 is negative or not a number"},
        {skin(SkinWeights(Lists{{{0, 1}}, {{0, kNan}}}), {}), "1 is negative or not a number"},
        {skin(SkinWeights(Lists{{{0, 1}}, {}}), {}), "the weights of vertex 1 are all 0"},
        {with(skin(moved(0, 0, 0)), [](auto& d) { d.precision = 2; }), "not 2"},
        {morph({{{{}}, {}}}, {}), "0 weights and 1 morph targets"},
        {morph({{{{}, {}}, {}}}, {1}), "targets have 2 vertices, and the mesh has 1"},
        {morph({{{{}}, {}}, {{{}, {}}, {}}}, {1, 1}), "target 1 has 2 positions"},
        {morph({{{{}}, {{}, {}}}}, {1}), "target 0 has 2 normals and 1 positions"},
        {morph({{{{}}, {}}}, {kNan}), "not a finite number"},
        {with(morph({}, {}), [](auto& d) { d.strength = kNan; }), "not a finite number"},
        {twist(1, flat), "no inverse"},
        {wave(0, {kNan, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1, 0}), "no inverse"},
        {with(wave(0), [](auto& d) { d.wavelength = 0; }), "the wavelength is 0"},
        {with(wave(0), [](auto& d) { d.direction = 3; }), "axes from 0 to 2"},
        {std::make_unique<SmoothDeformer>(SmoothTopology()), "topology has 0 vertices"},
        {smooth({0, 0}), "2 vertex indices"},
        {smooth({0, 0, 0, 0, 1, 0}), "triangle 1 refers to vertex 1"},
        {with(smooth({}), [](auto& d) { d.weight = kNan; }), "the weight is nan"},
        {with(smooth({}), [](auto& d) { d.iterations = 101; }), "101 iterations"},
    };
    for (const auto& [deformer, text] : rows)
        EXPECT_THAT(deformer->mismatch(mesh), HasSubstr(text));
}

TEST(Deformers, NeutralSettingsNeedNoPass)
{
    const MeshGeometry sheet = makeSheet(3);
    SmoothDeformer smooth{SmoothTopology(sheet)};
    EXPECT_EQ(smooth.passCount(), 2u);
    smooth.weight = 0;
    EXPECT_EQ(smooth.passCount(), 0u);
    smooth.weight = 1;
    smooth.iterations = 0;
    EXPECT_EQ(smooth.passCount(), 0u);
    EXPECT_EQ(twist(0)->passCount(), 0u);
    const auto targets = morph(std::vector<MorphTarget>(17, {{{}}, {}}), {});
    for (const auto& [active, passes] : {std::pair(0u, 0u), {1u, 1u}, {8u, 1u}, {9u, 2u}}) {
        targets->weights.assign(17, 0);
        std::fill_n(targets->weights.rbegin(), active, 1.0f);
        EXPECT_EQ(targets->passCount(), passes) << active;
    }
    targets->strength = 0;
    EXPECT_EQ(targets->passCount(), 0u);
}

TEST(Deformers, SetParameterAcceptsValuesAndRejectsOthers)
{
    const auto turned = twist(0);
    const auto travelling = wave(0);
    const auto skinned = skin(kIdentityRows);
    const auto morphed = morph({}, {});
    SmoothDeformer smoothed{SmoothTopology()};
    const std::tuple<Deformer&, const char*, const char*> rows[] = {
        {*turned, "angle", "-0.5"},        {*travelling, "amplitude", "2"},
        {*travelling, "wavelength", "3"},  {*travelling, "phase", "-1"},
        {*travelling, "direction", "z"},   {*travelling, "displacement", "x"},
        {*skinned, "precision", "double"}, {*morphed, "strength", "0.25"},
        {smoothed, "weight", "1"},         {smoothed, "iterations", "7"}};
    for (const auto& [deformer, name, value] : rows)
        EXPECT_EQ(setParameter(deformer, name, value), "");
    EXPECT_EQ(turned->angle, -0.5f);
    EXPECT_THAT(std::tuple(travelling->amplitude, travelling->wavelength, travelling->phase,
                           travelling->direction, travelling->displacement),
                testing::Eq(std::tuple(2, 3, -1, WaveDeformer::kZ, WaveDeformer::kX)));
    EXPECT_EQ(skinned->precision, SkinDeformer::kDouble);
    EXPECT_EQ(morphed->strength, 0.25f);
    EXPECT_EQ(std::tuple(smoothed.weight, smoothed.iterations), std::tuple(1.0f, 7u));
}

} // namespace
