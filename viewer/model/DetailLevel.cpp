#include "viewer/model/DetailLevel.h"

#include <algorithm>
#include <cmath>
#include <limits>
#include <map>
#include <tuple>

namespace viewer {
namespace {

// Cells along the longest side of the bounding box. A character loses about half of its vertices
// and keeps its shape.
constexpr float kCellsAlongLongestSide = 64.0f;

using Cell = std::tuple<int, int, int, int>;

// Returns the signs of a normal. They separate the vertices on different sides of a thin part.
int octant(const QVector3D& normal)
{
    return (normal.x() < 0 ? 1 : 0) + (normal.y() < 0 ? 2 : 0) + (normal.z() < 0 ? 4 : 0);
}

float cellSize(const std::vector<QVector3D>& positions)
{
    constexpr float kLargest = std::numeric_limits<float>::max();
    QVector3D lowest(kLargest, kLargest, kLargest);
    QVector3D highest = -lowest;
    for (const QVector3D& position : positions) {
        for (int axis = 0; axis < 3; ++axis) {
            lowest[axis] = std::min(lowest[axis], position[axis]);
            highest[axis] = std::max(highest[axis], position[axis]);
        }
    }
    const QVector3D size = highest - lowest;
    return std::max({size.x(), size.y(), size.z()}) / kCellsAlongLongestSide;
}

Cell cellOf(const QVector3D& position, const QVector3D& normal, float size)
{
    const auto index = [size](float coordinate) {
        return static_cast<int>(std::floor(coordinate / size));
    };
    return {index(position.x()), index(position.y()), index(position.z()), octant(normal)};
}

void appendVertex(const Mesh& from, std::size_t vertex, Mesh& to)
{
    to.positions.push_back(from.positions[vertex]);
    to.normals.push_back(from.normals[vertex]);
    for (std::size_t i = 0; i < from.morphTargets.size(); ++i) {
        const MorphTarget& target = from.morphTargets[i];
        to.morphTargets[i].positionDeltas.push_back(target.positionDeltas[vertex]);
        if (!target.normalDeltas.empty())
            to.morphTargets[i].normalDeltas.push_back(target.normalDeltas[vertex]);
    }
    if (!from.hasBones())
        return;
    to.boneIndices.push_back(from.boneIndices[vertex]);
    to.boneWeights.push_back(from.boneWeights[vertex]);
}

} // namespace

Mesh coarserMesh(const Mesh& mesh)
{
    const float size = cellSize(mesh.positions);
    if (!(size > 0))
        return mesh;

    Mesh coarse;
    coarse.name = mesh.name;
    coarse.node = mesh.node;
    coarse.colour = mesh.colour;
    coarse.bones = mesh.bones;
    coarse.morphTargets.resize(mesh.morphTargets.size());
    for (std::size_t i = 0; i < mesh.morphTargets.size(); ++i)
        coarse.morphTargets[i].weight = mesh.morphTargets[i].weight;

    std::map<Cell, std::uint32_t> cells;
    std::vector<std::uint32_t> newIndex;
    for (std::size_t i = 0; i < mesh.vertexCount(); ++i) {
        const auto next = static_cast<std::uint32_t>(coarse.vertexCount());
        const auto [cell, isNew] =
            cells.emplace(cellOf(mesh.positions[i], mesh.normals[i], size), next);
        if (isNew)
            appendVertex(mesh, i, coarse);
        newIndex.push_back(cell->second);
    }
    for (std::size_t i = 0; i + 2 < mesh.triangles.size(); i += 3) {
        const std::uint32_t a = newIndex[mesh.triangles[i]];
        const std::uint32_t b = newIndex[mesh.triangles[i + 1]];
        const std::uint32_t c = newIndex[mesh.triangles[i + 2]];
        if (a != b && b != c && c != a)
            coarse.triangles.insert(coarse.triangles.end(), {a, b, c});
    }
    return coarse.triangles.empty() ? mesh : coarse;
}

} // namespace viewer
