#include "viewer/model/CharacterSpace.h"

#include "evaluator/MorphDeformer.h"
#include "evaluator/SkinDeformer.h"
#include "viewer/model/MeshShape.h"
#include "viewer/model/Pose.h"

#include <algorithm>
#include <array>
#include <limits>

namespace viewer {
namespace {

// Poses sampled in one cycle: a run cycle has two steps, so this is a dozen poses of each.
constexpr int kSampledPoses = 24;
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

// Returns directions to the faces, edges and corners of a cube.
std::vector<QVector3D> outlineDirections()
{
    std::vector<QVector3D> directions;
    for (const float x : {-1.0f, 0.0f, 1.0f}) {
        for (const float y : {-1.0f, 0.0f, 1.0f}) {
            for (const float z : {-1.0f, 0.0f, 1.0f})
                directions.emplace_back(x, y, z);
        }
    }
    return directions;
}

// Returns all vertices of a pose in model space. `shapes` belong to the model's meshes, in order.
std::vector<QVector3D> vertices(const Model& model, const std::vector<MeshShape>& shapes,
                                const Animation* animation, double seconds)
{
    const Pose pose = poseAt(model, animation, seconds);
    std::vector<QVector3D> points;
    for (std::size_t i = 0; i < shapes.size(); ++i) {
        const Mesh& mesh = model.meshes[i];
        vyra::Surface surface = shapes[i].geometry->rest;
        vyra::MorphDeformer morph(shapes[i].morphTargets);
        morphWeights(mesh, animation, seconds, morph.weights);
        morph.deform(*shapes[i].geometry, surface);
        if (mesh.hasBones()) {
            vyra::SkinDeformer skin(shapes[i].skinWeights);
            skin.bones = boneMatrices(mesh, pose);
            skin.deform(*shapes[i].geometry, surface);
        }
        const QMatrix4x4 toModel = meshToModel(mesh, pose);
        for (const vyra::Vector3& p : surface.positions)
            points.push_back(toModel.map(QVector3D(p.x, p.y, p.z)));
    }
    return points;
}

// Appends the outermost point in each direction.
void appendOutline(const std::vector<QVector3D>& points, std::vector<QVector3D>& outline)
{
    static const std::vector<QVector3D> directions = outlineDirections();
    for (const QVector3D& direction : directions) {
        outline.push_back(*std::max_element(
            points.begin(), points.end(), [&](const QVector3D& a, const QVector3D& b) {
                return QVector3D::dotProduct(a, direction) < QVector3D::dotProduct(b, direction);
            }));
    }
}

} // namespace

CharacterSpace characterSpace(const Model& model, const Animation* animation)
{
    Bounds bounds;
    std::vector<QVector3D> outline;
    std::vector<MeshShape> shapes(model.meshes.size());
    std::transform(model.meshes.begin(), model.meshes.end(), shapes.begin(), shapeOf);
    const int poses = animation && animation->seconds > 0 ? kSampledPoses : 1;
    for (int i = 0; i < poses; ++i) {
        const double seconds = animation ? animation->seconds * i / poses : 0.0;
        const std::vector<QVector3D> points = vertices(model, shapes, animation, seconds);
        appendOutline(points, outline);
        for (const QVector3D& point : points)
            bounds.include(point);
    }

    const QVector3D size = bounds.highest - bounds.lowest;
    const float extent = std::max({size.x(), size.y(), size.z()});
    const float scale = extent > 0 ? 1.0f / extent : 1.0f;
    const QVector3D middle = (bounds.lowest + bounds.highest) / 2;

    CharacterSpace space;
    space.fromModel.scale(scale);
    space.fromModel.translate(-middle.x(), -bounds.lowest.y(), -middle.z());
    space.size = size * scale;
    for (const QVector3D& point : outline)
        space.outline.push_back(space.fromModel.map(point));
    return space;
}

} // namespace viewer
