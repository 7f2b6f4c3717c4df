#include "viewer/model/MeshShape.h"

#include <algorithm>
#include <vector>

namespace viewer {
namespace {

std::vector<vyra::Vector3> packed(const std::vector<QVector3D>& vectors)
{
    std::vector<vyra::Vector3> result(vectors.size());
    std::transform(vectors.begin(), vectors.end(), result.begin(), [](const QVector3D& v) {
        return vyra::Vector3{v.x(), v.y(), v.z()};
    });
    return result;
}

} // namespace

MeshShape shapeOf(const Mesh& mesh)
{
    auto geometry = std::make_shared<vyra::MeshGeometry>();
    geometry->name = mesh.name;
    geometry->rest = {packed(mesh.positions), packed(mesh.normals)};
    geometry->triangles = mesh.triangles;

    MeshShape shape;
    if (mesh.hasBones())
        shape.skinWeights = vyra::SkinWeights(mesh.boneIndices, mesh.boneWeights);
    std::vector<vyra::MorphTarget> targets;
    for (const MorphTarget& target : mesh.morphTargets)
        targets.push_back({packed(target.positionDeltas), packed(target.normalDeltas)});
    shape.morphTargets = vyra::MorphTargets(targets);
    shape.topology = vyra::SmoothTopology(*geometry);
    shape.geometry = std::move(geometry);
    return shape;
}

} // namespace viewer
