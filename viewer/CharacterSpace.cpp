#include "viewer/CharacterSpace.h"

#include "viewer/Deformation.h"
#include "viewer/Pose.h"

#include <algorithm>
#include <limits>

namespace viewer {
namespace {

// Moments of a cycle that are measured: a run has two steps, so a dozen poses of each.
constexpr int kMeasuredPoses = 24;
constexpr float kLargest = std::numeric_limits<float>::max();

struct Bounds {
    QVector3D lowest{kLargest, kLargest, kLargest};
    QVector3D highest{-kLargest, -kLargest, -kLargest};

    void include(const QVector3D& point)
    {
        for (int axis = 0; axis < 3; ++axis) {
            lowest[axis] = std::min(lowest[axis], point[axis]);
            highest[axis] = std::max(highest[axis], point[axis]);
        }
    }
};

void include(const Model& model, const Pose& pose, Bounds& bounds)
{
    for (const Mesh& mesh : model.meshes) {
        const Surface surface = skin(mesh, boneMatrices(mesh, pose));
        const QMatrix4x4 toModel = meshToModel(mesh, pose);
        for (const QVector3D& position : surface.positions)
            bounds.include(toModel.map(position));
    }
}

} // namespace

CharacterSpace characterSpace(const Model& model, const Animation* animation)
{
    Bounds bounds;
    const int poses = animation && animation->seconds > 0 ? kMeasuredPoses : 1;
    for (int i = 0; i < poses; ++i) {
        const double seconds = animation ? animation->seconds * i / poses : 0.0;
        include(model, poseAt(model, animation, seconds), bounds);
    }

    const QVector3D size = bounds.highest - bounds.lowest;
    const float extent = std::max({size.x(), size.y(), size.z()});
    const float scale = extent > 0 ? 1.0f / extent : 1.0f;
    const QVector3D middle = (bounds.lowest + bounds.highest) / 2;

    CharacterSpace space;
    space.fromModel.scale(scale);
    space.fromModel.translate(-middle.x(), -bounds.lowest.y(), -middle.z());
    space.size = size * scale;
    return space;
}

} // namespace viewer
