// From the keys of an animation to matrices, and the CPU reference, against cases that are
// calculated in another way.
#include "viewer/Deformation.h"
#include "viewer/Pose.h"
#include "viewer/Verification.h"

#include <cmath>
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

// A shoulder that is moved, with an arm of length 2 on it that turns around z.
Model armModel()
{
    Model model;
    model.nodes = {{"root", 0, {}}, {"shoulder", 0, {}}, {"arm", 1, moved(2, 0, 0)}};
    const std::vector<Key<QQuaternion>> rotations{{0.0, {}}, {1.0, turned(90, {0, 0, 1})}};
    model.animations = {{"wave", 2.0, {{1, {{0.0, {0, 1, 0}}}, rotations, {}}}}};
    return model;
}

TEST(Pose, PositionsAreLinearBetweenKeysAndStandStillOutside)
{
    const std::vector<Key<QVector3D>> keys{{1.0, {0, 0, 0}}, {3.0, {4, 8, 0}}, {4.0, {4, 8, 6}}};
    const std::pair<double, QVector3D> rows[] = {{0.0, {0, 0, 0}}, {1.0, {0, 0, 0}},
                                                 {1.5, {1, 2, 0}}, {3.0, {4, 8, 0}},
                                                 {3.5, {4, 8, 3}}, {9.0, {4, 8, 6}}};
    for (const auto& [seconds, expected] : rows)
        expectNear(sample(keys, seconds), expected);
}

TEST(Pose, RotationsTakeTheShorterWayAtAnEvenSpeed)
{
    // The same rotation with the opposite sign, which a careless mix goes the long way to.
    const std::vector<Key<QQuaternion>> keys{{0.0, {}}, {3.0, -turned(90, {0, 1, 0})}};
    expectNear(sample(keys, 1.0).rotatedVector({1, 0, 0}),
               turned(30, {0, 1, 0}).rotatedVector({1, 0, 0}));
}

TEST(Pose, ChildrenFollowTheirParentsAndTimeWrapsAround)
{
    const Model model = armModel();
    const std::pair<double, QVector3D> rows[] = {
        {0.0, {2, 1, 0}}, {1.0, {0, 3, 0}}, {2.0, {2, 1, 0}}, {5.0, {0, 3, 0}}, {-1.0, {0, 3, 0}}};
    for (const auto& [seconds, hand] : rows)
        expectNear(poseAt(model, &model.animations[0], seconds)[2].map(QVector3D()), hand);
    expectNear(poseAt(model, nullptr, 1.0)[2].map(QVector3D()), {2, 0, 0});
}

TEST(Pose, BoneMatricesLeadFromTheMeshAtRestToTheModel)
{
    const Model model = armModel();
    Mesh mesh;
    mesh.bones.push_back({2, moved(-2, 0, 0)}); // the arm's origin in the mesh at rest
    // A quarter turn around the moved shoulder: (3, 0, 0) becomes (0, 1 + 3, 0).
    const MatrixRows expected{0, -1, 0, 0, 1, 0, 0, 1, 0, 0, 1, 0};
    EXPECT_THAT(boneMatrices(mesh, poseAt(model, &model.animations[0], 1.0))[0],
                testing::Pointwise(testing::FloatNear(kTolerance), expected));
}

Mesh meshOf(const QVector3D& position, const QVector3D& normal, const BoneIndices& indices,
            const BoneWeights& weights)
{
    Mesh mesh;
    mesh.positions = {position};
    mesh.normals = {normal};
    mesh.boneIndices = {indices};
    mesh.boneWeights = {weights};
    mesh.bones.resize(1);
    return mesh;
}

TEST(Skin, AVertexIsBlendedFromAllFourBones)
{
    const Mesh mesh = meshOf({1, 2, 3}, {0, 0, 1}, {4, 0, 2, 1}, {0.5f, 0.25f, 0.125f, 0.125f});
    const Surface surface =
        skin(mesh, {rowsOf(moved(8, 0, 0)), rowsOf(moved(0, 8, 0)), rowsOf(moved(0, 0, 8)),
                    rowsOf(moved(99, 99, 99)), rowsOf(moved(-4, 4, 0))});
    // Half of (-4, 4, 0), a quarter of (8, 0, 0), an eighth of (0, 0, 8) and of (0, 8, 0).
    expectNear(surface.positions[0], QVector3D(1, 2, 3) + QVector3D(0, 3, 1));
    expectNear(surface.normals[0], {0, 0, 1});
}

TEST(Skin, NormalsStayPerpendicularUnderStretchingAndOutsideUnderMirroring)
{
    const QVector3D normal = QVector3D(1, 1, 0).normalized();
    const Mesh mesh = meshOf({0, 0, 0}, normal, {0, 0, 0, 0}, {1, 0, 0, 0});
    for (const QVector3D& scale :
         {QVector3D(4, 1, 1), QVector3D(1, 0.1f, 2), QVector3D(-1, 1, 1)}) {
        SCOPED_TRACE(testing::Message() << scale.x() << ' ' << scale.y());
        QMatrix4x4 scaling;
        scaling.scale(scale);
        const QVector3D result = skin(mesh, {rowsOf(scaling)}).normals[0];
        EXPECT_NEAR(result.length(), 1, kTolerance);
        EXPECT_NEAR(QVector3D::dotProduct(result, scaling.mapVector({1, -1, 0})), 0, kTolerance);
        // A point above the surface is still above it.
        EXPECT_GT(QVector3D::dotProduct(result, scaling.mapVector(normal)), 0);
    }
}

// A plane at an angle, in a space that is not the character's, so that both matrices matter.
class Twist : public testing::Test {
protected:
    Twist()
    {
        fPose.geometryMatrix.rotate(70, 1, 2, 3);
        fPose.geometryMatrix.scale(0.25f);
        fPose.geometryMatrix.translate(1, -2, 3);
        fPose.inverseGeometryMatrix = fPose.geometryMatrix.inverted();
        fPose.twist = 0.9f;
    }

    QVector3D twisted(const QVector3D& point) const
    {
        Surface surface{{point}, {{0, 1, 0}}};
        twist(fPose, surface);
        return surface.positions[0];
    }

    MeshPose fPose;
};

TEST_F(Twist, TurnsAPointByItsHeight)
{
    const QVector3D inCharacter(0.5f, 0.8f, -0.3f);
    const QVector3D result =
        fPose.geometryMatrix.map(twisted(fPose.inverseGeometryMatrix.map(inCharacter)));
    const float degrees = fPose.twist * inCharacter.y() * 180 / static_cast<float>(M_PI);
    expectNear(result, turned(degrees, {0, 1, 0}).rotatedVector(inCharacter));
}

TEST_F(Twist, NormalsArePerpendicularToTheTwistedSurface)
{
    const QVector3D point(0.7f, 2.5f, -0.4f);
    const QVector3D along = QVector3D(1, 2, -1).normalized();
    const QVector3D across = QVector3D::crossProduct(along, {0, 1, 1}).normalized();
    Surface surface{{point}, {QVector3D::crossProduct(along, across)}};
    twist(fPose, surface);

    // The twisted tangents by central differences.
    const auto tangent = [&](const QVector3D& direction) {
        constexpr float kStep = 0.02f;
        return twisted(point + kStep * direction) - twisted(point - kStep * direction);
    };
    const QVector3D expected = QVector3D::crossProduct(tangent(along), tangent(across));
    expectNear(surface.normals[0], expected.normalized(), 1e-3f);
}

TEST(Verification, FindsTheWorstVertexAndValuesThatAreNoNumbers)
{
    constexpr float kNan = std::numeric_limits<float>::quiet_NaN();
    constexpr double kInfinity = std::numeric_limits<double>::infinity();
    const Surface expected{{{0, 0, 0}, {1, 0, 0}}, {{0, 1, 0}, {0, 1, 0}}};
    const Surface oneOff{{{0, 0, 0}, {1, 0, 0.5f}}, expected.normals};
    const Surface turnedNormal{expected.positions, {{0, 1, 0}, {1, 0, 0}}};
    const Surface noNumber{{{kNan, 0, 0}, {1, 0, 0}}, expected.normals}; // before a good vertex
    QMatrix4x4 toCharacter;
    toCharacter.scale(2);
    const std::tuple<Surface, double, bool> rows[] = {{expected, 0, true},
                                                      {oneOff, 1, false},
                                                      {turnedNormal, 0, false},
                                                      {noNumber, kInfinity, false}};
    for (const auto& [actual, position, passes] : rows) {
        const Deviation deviation = compare(actual, expected, toCharacter);
        EXPECT_DOUBLE_EQ(deviation.position, position);
        EXPECT_EQ(deviation.withinBound(), passes);
    }
}

} // namespace
