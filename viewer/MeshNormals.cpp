#include "viewer/MeshNormals.h"

#include <algorithm>
#include <cmath>
#include <map>
#include <tuple>

namespace viewer {
namespace {

// The mean cosine between a normal and the direction from the middle, from which on a mesh counts
// as inside out. Of a flat mesh it is 0, but for rounding.
constexpr float kClearlyInside = -0.1f;

struct ByCoordinates {
    bool operator()(const QVector3D& a, const QVector3D& b) const
    {
        return std::tuple(a.x(), a.y(), a.z()) < std::tuple(b.x(), b.y(), b.z());
    }
};

// In double precision, since the squares of small coordinates vanish in single precision.
QVector3D scaledToOne(const QVector3D& vector)
{
    const double x = vector.x();
    const double y = vector.y();
    const double z = vector.z();
    const double length = std::sqrt(x * x + y * y + z * z);
    if (!std::isfinite(length) || length == 0)
        return {};
    return {static_cast<float>(x / length), static_cast<float>(y / length),
            static_cast<float>(z / length)};
}

// The sum of the normals of all triangles at each position, as long as their areas. Vertices that
// share a position share its triangles.
std::map<QVector3D, QVector3D, ByCoordinates> triangleNormals(const Mesh& mesh)
{
    std::map<QVector3D, QVector3D, ByCoordinates> sums;
    for (std::size_t i = 0; i + 2 < mesh.triangles.size(); i += 3) {
        const QVector3D& a = mesh.positions[mesh.triangles[i]];
        const QVector3D& b = mesh.positions[mesh.triangles[i + 1]];
        const QVector3D& c = mesh.positions[mesh.triangles[i + 2]];
        const QVector3D normal = QVector3D::crossProduct(b - a, c - a);
        for (const QVector3D& corner : {a, b, c})
            sums[corner] += normal;
    }
    return sums;
}

} // namespace

void completeNormals(Mesh& mesh)
{
    std::transform(mesh.normals.begin(), mesh.normals.end(), mesh.normals.begin(), scaledToOne);
    if (std::none_of(mesh.normals.begin(), mesh.normals.end(),
                     [](const QVector3D& normal) { return normal.isNull(); }))
        return;
    const auto sums = triangleNormals(mesh);
    for (std::size_t i = 0; i < mesh.vertexCount(); ++i) {
        if (!mesh.normals[i].isNull())
            continue;
        const auto sum = sums.find(mesh.positions[i]);
        const QVector3D normal = sum == sums.end() ? QVector3D() : scaledToOne(sum->second);
        mesh.normals[i] = normal.isNull() ? QVector3D(0, 1, 0) : normal;
    }
}

void turnNormalsOutside(Mesh& mesh)
{
    QVector3D middle;
    for (const QVector3D& position : mesh.positions)
        middle += position / static_cast<float>(mesh.vertexCount());
    float outside = 0;
    for (std::size_t i = 0; i < mesh.vertexCount(); ++i)
        outside +=
            QVector3D::dotProduct(mesh.normals[i], (mesh.positions[i] - middle).normalized());
    if (outside >= kClearlyInside * static_cast<float>(mesh.vertexCount()))
        return;
    for (QVector3D& normal : mesh.normals)
        normal = -normal;
}

} // namespace viewer
