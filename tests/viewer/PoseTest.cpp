// Interpolation of keys and the way from an animation to matrices.
#include "viewer/Pose.h"

#include <gtest/gtest.h>

namespace {

using namespace viewer;

constexpr float kTolerance = 1e-5f;

void expectNear(const QVector3D& actual, const QVector3D& expected)
{
    EXPECT_LT((actual - expected).length(), kTolerance)
        << actual.x() << ' ' << actual.y() << ' ' << actual.z();
}

// A shoulder that is moved, with an arm of length 2 on it that turns around z.
Model armModel()
{
    QMatrix4x4 arm;
    arm.translate(2, 0, 0);
    Model model;
    model.nodes = {{"root", 0, {}}, {"shoulder", 0, {}}, {"arm", 1, arm}};
    Animation wave{"wave", 2.0, {}};
    wave.channels.push_back(
        {1,
         {{0.0, {0, 1, 0}}},
         {{0.0, QQuaternion()}, {1.0, QQuaternion::fromAxisAndAngle(0, 0, 1, 90)}},
         {}});
    model.animations.push_back(wave);
    return model;
}

TEST(Pose, PositionsAreLinearBetweenKeysAndStandStillOutside)
{
    const std::vector<Key<QVector3D>> keys{{1.0, {0, 0, 0}}, {3.0, {4, 8, 0}}, {4.0, {4, 8, 6}}};
    const struct {
        double seconds;
        QVector3D expected;
    } rows[] = {{0.0, {0, 0, 0}}, {1.0, {0, 0, 0}}, {1.5, {1, 2, 0}},
                {3.0, {4, 8, 0}}, {3.5, {4, 8, 3}}, {9.0, {4, 8, 6}}};
    for (const auto& row : rows) {
        SCOPED_TRACE(row.seconds);
        expectNear(sample(keys, row.seconds), row.expected);
    }
}

TEST(Pose, RotationsTakeTheShorterWayAtAnEvenSpeed)
{
    const QQuaternion quarter = QQuaternion::fromAxisAndAngle(0, 1, 0, 90);
    // The same rotation with the opposite sign, which a careless mix goes the long way to.
    const std::vector<Key<QQuaternion>> keys{{0.0, QQuaternion()}, {3.0, -quarter}};
    const QQuaternion third = sample(keys, 1.0);
    expectNear(third.rotatedVector({1, 0, 0}),
               QQuaternion::fromAxisAndAngle(0, 1, 0, 30).rotatedVector({1, 0, 0}));
}

TEST(Pose, ChildrenFollowTheirParentsAndTimeWrapsAround)
{
    const Model model = armModel();
    const struct {
        double seconds;
        QVector3D hand; // the arm's origin in the model's space
    } rows[] = {
        {0.0, {2, 1, 0}}, {1.0, {0, 3, 0}}, {2.0, {2, 1, 0}}, {5.0, {0, 3, 0}}, {-1.0, {0, 3, 0}}};
    for (const auto& row : rows) {
        SCOPED_TRACE(row.seconds);
        const Pose pose = poseAt(model, &model.animations[0], row.seconds);
        expectNear(pose[2].map(QVector3D()), row.hand);
    }
    expectNear(poseAt(model, nullptr, 1.0)[2].map(QVector3D()), {2, 0, 0});
}

TEST(Pose, BoneMatricesLeadFromTheMeshAtRestToTheModel)
{
    const Model model = armModel();
    Mesh mesh;
    QMatrix4x4 offset; // the arm's origin is at (2, 0, 0) of the mesh at rest
    offset.translate(-2, 0, 0);
    mesh.bones.push_back({2, offset});
    const MatrixRows rows = boneMatrices(mesh, poseAt(model, &model.animations[0], 1.0))[0];
    // A quarter turn around the moved shoulder: (3, 0, 0) becomes (0, 1 + 3, 0).
    const MatrixRows expected{0, -1, 0, 0, 1, 0, 0, 1, 0, 0, 1, 0};
    for (std::size_t i = 0; i < rows.size(); ++i)
        EXPECT_NEAR(rows[i], expected[i], kTolerance) << i;
}

} // namespace
