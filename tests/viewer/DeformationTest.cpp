// The CPU reference, against cases that are calculated in another way.
#include "viewer/Deformation.h"
#include "viewer/Verification.h"

#include <cmath>
#include <limits>

#include <gtest/gtest.h>

namespace {

using namespace viewer;

constexpr float kTolerance = 1e-5f;

void expectNear(const QVector3D& actual, const QVector3D& expected, float tolerance = kTolerance)
{
    EXPECT_LT((actual - expected).length(), tolerance)
        << actual.x() << ' ' << actual.y() << ' ' << actual.z();
}

Mesh meshOf(const QVector3D& position, const QVector3D& normal)
{
    Mesh mesh;
    mesh.positions = {position};
    mesh.normals = {normal};
    return mesh;
}

QMatrix4x4 moved(float x, float y, float z)
{
    QMatrix4x4 matrix;
    matrix.translate(x, y, z);
    return matrix;
}

TEST(Skin, AVertexIsBlendedFromAllFourBones)
{
    Mesh mesh = meshOf({1, 2, 3}, {0, 0, 1});
    mesh.bones.resize(5);
    mesh.boneIndices = {{4, 0, 2, 1}};
    mesh.boneWeights = {{0.5f, 0.25f, 0.125f, 0.125f}};
    std::vector<MatrixRows> bones;
    for (const QMatrix4x4& matrix :
         {moved(8, 0, 0), moved(0, 8, 0), moved(0, 0, 8), moved(99, 99, 99), moved(-4, 4, 0)})
        bones.push_back(rowsOf(matrix));

    const Surface surface = skin(mesh, bones);
    // Half of (-4, 4, 0), a quarter of (8, 0, 0), an eighth of (0, 0, 8) and of (0, 8, 0).
    expectNear(surface.positions[0], QVector3D(1, 2, 3) + QVector3D(0, 3, 1));
    expectNear(surface.normals[0], {0, 0, 1});
}

TEST(Skin, NormalsStayPerpendicularUnderStretchingAndOutsideUnderMirroring)
{
    const QVector3D normal = QVector3D(1, 1, 0).normalized();
    const QVector3D tangent(1, -1, 0);
    const struct {
        const char* name;
        QVector3D scale;
    } rows[] = {{"stretched", {4, 1, 1}}, {"flat", {1, 0.1f, 2}}, {"mirrored", {-1, 1, 1}}};
    for (const auto& row : rows) {
        SCOPED_TRACE(row.name);
        QMatrix4x4 scaling;
        scaling.scale(row.scale);
        Mesh mesh = meshOf({0, 0, 0}, normal);
        mesh.bones.resize(1);
        mesh.boneIndices = {{0, 0, 0, 0}};
        mesh.boneWeights = {{1, 0, 0, 0}};
        const QVector3D result = skin(mesh, {rowsOf(scaling)}).normals[0];
        EXPECT_NEAR(result.length(), 1, kTolerance);
        EXPECT_NEAR(QVector3D::dotProduct(result, scaling.mapVector(tangent)), 0, kTolerance);
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
    expectNear(result, QQuaternion::fromAxisAndAngle(0, 1, 0, degrees).rotatedVector(inCharacter));
}

TEST_F(Twist, NormalsArePerpendicularToTheTwistedSurface)
{
    const QVector3D point(0.7f, 2.5f, -0.4f);
    const QVector3D along = QVector3D(1, 2, -1).normalized();
    const QVector3D across = QVector3D::crossProduct(along, {0, 1, 1}).normalized();
    const QVector3D normal = QVector3D::crossProduct(along, across);
    Surface surface{{point}, {normal}};
    twist(fPose, surface);

    // The twisted tangents by central differences.
    constexpr float kStep = 0.02f;
    const QVector3D alongTwisted = twisted(point + kStep * along) - twisted(point - kStep * along);
    const QVector3D acrossTwisted =
        twisted(point + kStep * across) - twisted(point - kStep * across);
    const QVector3D expected = QVector3D::crossProduct(alongTwisted, acrossTwisted).normalized();
    expectNear(surface.normals[0], expected, 1e-3f);
}

TEST(Verification, FindsTheWorstVertexAndValuesThatAreNoNumbers)
{
    constexpr float kNan = std::numeric_limits<float>::quiet_NaN();
    const Surface expected{{{0, 0, 0}, {1, 0, 0}}, {{0, 1, 0}, {0, 1, 0}}};
    const struct {
        const char* name;
        Surface actual;
        double position;
        bool passes;
    } rows[] = {
        {"equal", expected, 0, true},
        {"off by one vertex", {{{0, 0, 0}, {1, 0, 0.5f}}, expected.normals}, 1.0, false},
        {"turned normal", {expected.positions, {{0, 1, 0}, {1, 0, 0}}}, 0, false},
        {"no number before a good vertex",
         {{{kNan, 0, 0}, {1, 0, 0}}, expected.normals},
         std::numeric_limits<double>::infinity(),
         false},
    };
    QMatrix4x4 toCharacter;
    toCharacter.scale(2);
    for (const auto& row : rows) {
        SCOPED_TRACE(row.name);
        const Deviation deviation = compare(row.actual, expected, toCharacter);
        EXPECT_DOUBLE_EQ(deviation.position, row.position);
        EXPECT_EQ(deviation.withinBound(), row.passes);
    }
}

} // namespace
