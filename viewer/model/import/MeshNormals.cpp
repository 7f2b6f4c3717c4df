#include "viewer/model/import/MeshNormals.h"

#include <algorithm>
#include <cmath>
#include <numeric>
#include <tuple>

#include <QtMath>

namespace viewer {
namespace {

// The mean cosine between a normal and the direction from the middle, from which on a mesh counts
// as inside out. Of a flat mesh it is 0, but for rounding.
constexpr float kClearlyInside = -0.1f;

using Indices = std::vector<std::uint32_t>;

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

QVector3D usableNormal(const QVector3D& sum)
{
    const QVector3D normal = scaledToOne(sum);
    return normal.isNull() ? QVector3D(0, 1, 0) : normal;
}

// The angle between two edges, radians. 0 if one of them has no length.
float angleBetween(const QVector3D& a, const QVector3D& b)
{
    const float cosine = QVector3D::dotProduct(scaledToOne(a), scaledToOne(b));
    return a.isNull() || b.isNull() ? 0 : std::acos(std::clamp(cosine, -1.0f, 1.0f));
}

// The corners of triangles around each position. Corner i is that of the vertex triangles[i], in
// the triangle i / 3.
class Surroundings {
public:
    explicit Surroundings(const Mesh& mesh) : fMesh(mesh)
    {
        numberPositions();
        listCorners();
        for (std::size_t i = 0; i + 2 < mesh.triangles.size(); i += 3) {
            const QVector3D& a = mesh.positions[mesh.triangles[i]];
            const QVector3D& b = mesh.positions[mesh.triangles[i + 1]];
            const QVector3D& c = mesh.positions[mesh.triangles[i + 2]];
            fNormals.push_back(scaledToOne(QVector3D::crossProduct(b - a, c - a)));
            fAngles.push_back(angleBetween(b - a, c - a));
            fAngles.push_back(angleBetween(c - b, a - b));
            fAngles.push_back(angleBetween(a - c, b - c));
        }
    }

    QVector3D normalOfVertex(std::size_t vertex) const
    {
        QVector3D sum;
        forEachCorner(vertex, [&](std::uint32_t corner) { sum += weightedNormal(corner); });
        return usableNormal(sum);
    }

    QVector3D normalOfCorner(std::size_t corner, float leastCosine) const
    {
        const QVector3D& own = fNormals[corner / 3];
        QVector3D sum;
        forEachCorner(fMesh.triangles[corner], [&](std::uint32_t other) {
            if (own.isNull() || QVector3D::dotProduct(own, fNormals[other / 3]) >= leastCosine)
                sum += weightedNormal(other);
        });
        return usableNormal(sum);
    }

private:
    // Gives vertices at the same position the same number.
    void numberPositions()
    {
        const auto key = [this](std::uint32_t vertex) {
            const QVector3D& position = fMesh.positions[vertex];
            return std::tuple(position.x(), position.y(), position.z());
        };
        Indices order(fMesh.vertexCount());
        std::iota(order.begin(), order.end(), 0u);
        std::sort(order.begin(), order.end(),
                  [&key](std::uint32_t a, std::uint32_t b) { return key(a) < key(b); });
        fNumbers.resize(order.size());
        for (std::size_t i = 1; i < order.size(); ++i) {
            fPositionCount += key(order[i - 1]) == key(order[i]) ? 0 : 1;
            fNumbers[order[i]] = fPositionCount;
        }
        fPositionCount += 1;
    }

    // Stores the corners at position i in fCorners from fFirst[i] to fFirst[i + 1].
    void listCorners()
    {
        fFirst.resize(fPositionCount + 1);
        for (const std::uint32_t vertex : fMesh.triangles)
            fFirst[fNumbers[vertex] + 1] += 1;
        std::partial_sum(fFirst.begin(), fFirst.end(), fFirst.begin());
        Indices next = fFirst;
        fCorners.resize(fMesh.triangles.size());
        for (std::size_t i = 0; i < fMesh.triangles.size(); ++i)
            fCorners[next[fNumbers[fMesh.triangles[i]]]++] = static_cast<std::uint32_t>(i);
    }

    template <typename Visit>
    void forEachCorner(std::size_t vertex, Visit visit) const
    {
        const std::uint32_t position = fNumbers[vertex];
        for (std::uint32_t i = fFirst[position]; i < fFirst[position + 1]; ++i)
            visit(fCorners[i]);
    }

    QVector3D weightedNormal(std::uint32_t corner) const
    {
        return fNormals[corner / 3] * fAngles[corner];
    }

    const Mesh& fMesh;
    Indices fNumbers; // of the position of each vertex
    std::uint32_t fPositionCount = 0;
    Indices fFirst;
    Indices fCorners;
    std::vector<QVector3D> fNormals; // of each triangle; zero if it has no area
    std::vector<float> fAngles;      // at each corner, radians
};

template <typename T>
void select(std::vector<T>& values, const Indices& vertices)
{
    if (values.empty())
        return;
    std::vector<T> selected;
    selected.reserve(vertices.size());
    for (const std::uint32_t vertex : vertices)
        selected.push_back(values[vertex]);
    values = std::move(selected);
}

// One vertex for each vertex and normal that a corner has.
void splitVertices(Mesh& mesh, const std::vector<QVector3D>& cornerNormals)
{
    Indices origins;                                 // of the new vertices
    std::vector<Indices> copies(mesh.vertexCount()); // of each vertex, as new vertices
    mesh.normals.clear();
    for (std::size_t corner = 0; corner < mesh.triangles.size(); ++corner) {
        std::uint32_t& vertex = mesh.triangles[corner];
        Indices& known = copies[vertex];
        const auto same = std::find_if(known.begin(), known.end(), [&](std::uint32_t copy) {
            return mesh.normals[copy] == cornerNormals[corner];
        });
        if (same == known.end()) {
            known.push_back(static_cast<std::uint32_t>(origins.size()));
            origins.push_back(vertex);
            mesh.normals.push_back(cornerNormals[corner]);
            vertex = known.back();
        } else {
            vertex = *same;
        }
    }
    select(mesh.positions, origins);
    select(mesh.boneIndices, origins);
    select(mesh.boneWeights, origins);
    for (MorphTarget& target : mesh.morphTargets) {
        select(target.positionDeltas, origins);
        target.normalDeltas.clear(); // to normals that were of no use
    }
}

void createNormals(Mesh& mesh, double creaseAngle)
{
    // Rounding must not part triangles that meet at the angle itself.
    constexpr double kTolerance = 1e-4;
    const auto leastCosine =
        static_cast<float>(std::cos(qDegreesToRadians(creaseAngle)) - kTolerance);
    const Surroundings surroundings(mesh);
    std::vector<QVector3D> cornerNormals;
    cornerNormals.reserve(mesh.triangles.size());
    for (std::size_t i = 0; i < mesh.triangles.size(); ++i)
        cornerNormals.push_back(surroundings.normalOfCorner(i, leastCosine));
    splitVertices(mesh, cornerNormals);
}

} // namespace

void completeNormals(Mesh& mesh, double creaseAngle)
{
    std::vector<QVector3D>& normals = mesh.normals;
    const auto isNull = [](const QVector3D& normal) { return normal.isNull(); };
    std::transform(normals.begin(), normals.end(), normals.begin(), scaledToOne);
    if (std::all_of(normals.begin(), normals.end(), isNull)) {
        createNormals(mesh, creaseAngle);
    } else if (std::any_of(normals.begin(), normals.end(), isNull)) {
        const Surroundings surroundings(mesh);
        for (std::size_t i = 0; i < mesh.vertexCount(); ++i) {
            if (normals[i].isNull())
                normals[i] = surroundings.normalOfVertex(i);
        }
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
    for (MorphTarget& target : mesh.morphTargets) {
        for (QVector3D& delta : target.normalDeltas)
            delta = -delta;
    }
}

} // namespace viewer
