// Poses, parsing of deformer chains, comparison with the CPU reference.
#include "viewer/model/DeformerChain.h"
#include "viewer/model/Pose.h"
#include "viewer/opencl/Verification.h"

#include <limits>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using namespace viewer;

constexpr float kTolerance = 1e-5f;

void expectNear(const QVector3D& actual, const QVector3D& expected, float tolerance = kTolerance)
{
    EXPECT_LT((actual - expected).length(), tolerance)
        << actual.x() << ' ' << actual.y() << ' ' << actual.z();
}

QMatrix4x4 moved(float x, float y, float z)
{
    QMatrix4x4 matrix;
    matrix.translate(x, y, z);
    return matrix;
}

QQuaternion turned(float degrees, const QVector3D& axis)
{
    return QQuaternion::fromAxisAndAngle(axis, degrees);
}

// A translated shoulder, and an arm of length 2 on it that rotates around z.
Model armModel()
{
    Model model;
    model.nodes = {{"root", 0, {}}, {"shoulder", 0, {}}, {"arm", 1, moved(2, 0, 0)}};
    const std::vector<Key<QQuaternion>> rotations{{0.0, {}}, {1.0, turned(90, {0, 0, 1})}};
    model.animations = {{"wave", 2.0, {{1, {{0.0, {0, 1, 0}}}, rotations, {}}}}};
    return model;
}

TEST(Pose, SamplePositionInterpolatesLinearlyAndClampsOutsideTheKeys)
{
    const std::vector<Key<QVector3D>> keys{{1.0, {0, 0, 0}}, {3.0, {4, 8, 0}}, {4.0, {4, 8, 6}}};
    const std::pair<double, QVector3D> rows[] = {{0.0, {0, 0, 0}}, {1.0, {0, 0, 0}},
                                                 {1.5, {1, 2, 0}}, {3.0, {4, 8, 0}},
                                                 {3.5, {4, 8, 3}}, {9.0, {4, 8, 6}}};
    for (const auto& [seconds, expected] : rows)
        expectNear(sample(keys, seconds), expected);
}

TEST(Pose, SampleRotationTakesTheShorterArcAtConstantSpeed)
{
    // The quaternion has the opposite sign, for which plain interpolation takes the longer arc.
    const std::vector<Key<QQuaternion>> keys{{0.0, {}}, {3.0, -turned(90, {0, 1, 0})}};
    expectNear(sample(keys, 1.0).rotatedVector({1, 0, 0}),
               turned(30, {0, 1, 0}).rotatedVector({1, 0, 0}));
}

TEST(Pose, PoseAtMovesChildrenWithTheirParentsAndWrapsTime)
{
    const Model model = armModel();
    const std::pair<double, QVector3D> rows[] = {
        {0.0, {2, 1, 0}}, {1.0, {0, 3, 0}}, {2.0, {2, 1, 0}}, {5.0, {0, 3, 0}}, {-1.0, {0, 3, 0}}};
    for (const auto& [seconds, hand] : rows)
        expectNear(poseAt(model, &model.animations[0], seconds)[2].map(QVector3D()), hand);
    expectNear(poseAt(model, nullptr, 1.0)[2].map(QVector3D()), {2, 0, 0});
}

TEST(Pose, BoneMatricesTransformFromMeshAtRestToModelSpace)
{
    const Model model = armModel();
    Mesh mesh;
    mesh.bones.push_back({2, moved(-2, 0, 0)}); // the arm's origin in the mesh at rest
    // A quarter turn around the translated shoulder: (3, 0, 0) becomes (0, 1 + 3, 0).
    const vyra::MatrixRows expected{0, -1, 0, 0, 1, 0, 0, 1, 0, 0, 1, 0};
    EXPECT_THAT(boneMatrices(mesh, poseAt(model, &model.animations[0], 1.0))[0],
                testing::Pointwise(testing::FloatNear(kTolerance), expected));
}

TEST(ParseDeformers, ReturnsDeformersInOrderWithParameters)
{
    const auto choices =
        parseDeformers("wave:amplitude=0.5,skin:precision=double,smooth:iterations=3");
    ASSERT_TRUE(choices);
    EXPECT_EQ(chainText(choices.value()),
              "wave:amplitude=0.5, skin:precision=double, smooth:iterations=3");
    EXPECT_TRUE(parseDeformers(kDefaultDeformers));
}

TEST(ParseDeformers, FailsForWrongTextWithTheValidNames)
{
    const std::pair<const char*, const char*> rows[] = {
        {"skin,bend", "no deformer 'bend'; there are skin, morph, twist, wave, smooth"},
        {"", "no deformer ''"},
        {"skin,", "no deformer ''"},
        {"wave:height=1", "no parameter 'height'; it has "},
        {"wave:amplitude", "'amplitude' is not PARAMETER=VALUE"},
        {"wave:amplitude=high", "not 'high'"},
        {"smooth:iterations=1.5", "whole number"},
        {"skin:precision=half", "one of single, double, not 'half'"},
    };
    for (const auto& [text, reason] : rows) {
        const auto choices = parseDeformers(text);
        ASSERT_FALSE(choices) << text;
        EXPECT_THAT(choices.failure().text, testing::HasSubstr(reason));
    }
}

TEST(Verification, CompareReturnsTheLargestDeviationAndInfinityForNaN)
{
    constexpr float kNan = std::numeric_limits<float>::quiet_NaN();
    constexpr double kInfinity = std::numeric_limits<double>::infinity();
    const vyra::Surface expected{{{0, 0, 0}, {1, 0, 0}}, {{0, 1, 0}, {0, 1, 0}}};
    const vyra::Surface moved{{{0, 0, 0}, {1, 0, 0.5f}}, expected.normals};
    const vyra::Surface turnedNormal{expected.positions, {{0, 1, 0}, {1, 0, 0}}};
    const vyra::Surface notANumber{{{kNan, 0, 0}, {1, 0, 0}},
                                   expected.normals}; // before a good vertex
    QMatrix4x4 toCharacter;
    toCharacter.scale(2);
    const std::tuple<vyra::Surface, double, bool> rows[] = {{expected, 0, true},
                                                            {moved, 1, false},
                                                            {turnedNormal, 0, false},
                                                            {notANumber, kInfinity, false}};
    for (const auto& [actual, position, passes] : rows) {
        const Deviation deviation = compare(actual, expected, toCharacter);
        EXPECT_DOUBLE_EQ(deviation.position, position);
        EXPECT_EQ(deviation.withinBound(), passes);
    }
}

TEST(Verification, CompareAllowsNormalsFromTrianglesToRotateWithPositionErrors)
{
    constexpr float kSize = 1e-3f; // of the triangle
    const vyra::Surface expected{{{0, 0, 0}, {kSize, 0, 0}, {0, kSize, 0}},
                                 {{0, 0, 1}, {0, 0, 1}, {0, 0, 1}}};
    const vyra::SmoothTopology topology({"", expected, {0, 1, 2}});
    const std::tuple<float, float, bool, bool> rows[] = {
        // a corner moved, normals turned, passes without and with topology
        {1e-6f, 5e-5f, true, true},   {1e-6f, 2e-3f, false, true}, {1e-6f, 2e-2f, false, false},
        {1e-7f, 2e-3f, false, false}, {0, 2e-3f, false, false},
    };
    for (const auto& [moved, turned, passes, passesWithTopology] : rows) {
        vyra::Surface actual = expected;
        actual.positions[2].z = moved;
        for (vyra::Vector3& normal : actual.normals)
            normal.y = -turned;
        EXPECT_EQ(compare(actual, expected, {}).withinBound(), passes) << moved << ", " << turned;
        EXPECT_EQ(compare(actual, expected, {}, &topology).withinBound(), passesWithTopology)
            << moved << ", " << turned;
    }
}

} // namespace
