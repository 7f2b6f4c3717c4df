#include "viewer/model/import/MeshNormals.h"

#include <algorithm>
#include <cmath>
#include <numeric>
#include <tuple>

#include <QtMath>

namespace viewer {
namespace {

// A mesh is inside out if the mean cosine between a normal and the direction from the centre is
// below this. In a flat mesh the mean is 0, except for rounding.
constexpr float kInsideOutCosine = -0.1f;

using Indices = std::vector<std::uint32_t>;

// Returns zero if the vector is zero or not finite. Computes in double precision, because squares
// of small coordinates underflow in single precision.
QVector3D normalisedOrZero(const QVector3D& vector)
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
    const QVector3D normal = normalisedOrZero(sum);
    return normal.isNull() ? QVector3D(0, 1, 0) : normal;
}

// Returns the angle between two edges in radians, 0 if one of them has no length.
float angleBetween(const QVector3D& a, const QVector3D& b)
{
    const float cosine = QVector3D::dotProduct(normalisedOrZero(a), normalisedOrZero(b));
    return a.isNull() || b.isNull() ? 0 : std::acos(std::clamp(cosine, -1.0f, 1.0f));
}

// Triangle corners at each position. Corner i belongs to the vertex triangles[i] and to the
// triangle i / 3.
class CornerAdjacency {
public:
    explicit CornerAdjacency(const Mesh& mesh) : fMesh(mesh)
    {
        numberPositions();
        listCorners();
        for (std::size_t i = 0; i + 2 < mesh.triangles.size(); i += 3) {
            const QVector3D& a = mesh.positions[mesh.triangles[i]];
            const QVector3D& b = mesh.positions[mesh.triangles[i + 1]];
            const QVector3D& c = mesh.positions[mesh.triangles[i + 2]];
            fNormals.push_back(normalisedOrZero(QVector3D::crossProduct(b - a, c - a)));
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
    // Assigns the same number to vertices at the same position.
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
    Indices fNumbers; // position number of each vertex
    std::uint32_t fPositionCount = 0;
    Indices fFirst;
    Indices fCorners;
    std::vector<QVector3D> fNormals; // of each triangle; zero without area
    std::vector<float> fAngles;      // at each corner, in radians
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

// Replaces each vertex by one vertex for each different normal of its corners.
void splitVertices(Mesh& mesh, const std::vector<QVector3D>& cornerNormals)
{
    Indices origins;                                 // old index of each new vertex
    std::vector<Indices> copies(mesh.vertexCount()); // new indices of each old vertex
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
        target.normalDeltas.clear(); // relative to the unusable normals
    }
}

void createNormals(Mesh& mesh, double creaseAngle)
{
    // Prevents rounding from separating triangles that meet exactly at the crease angle.
    constexpr double kTolerance = 1e-4;
    const auto leastCosine =
        static_cast<float>(std::cos(qDegreesToRadians(creaseAngle)) - kTolerance);
    const CornerAdjacency adjacency(mesh);
    std::vector<QVector3D> cornerNormals;
    cornerNormals.reserve(mesh.triangles.size());
    for (std::size_t i = 0; i < mesh.triangles.size(); ++i)
        cornerNormals.push_back(adjacency.normalOfCorner(i, leastCosine));
    splitVertices(mesh, cornerNormals);
}

} // namespace

void completeNormals(Mesh& mesh, double creaseAngle)
{
    std::vector<QVector3D>& normals = mesh.normals;
    const auto isNull = [](const QVector3D& normal) { return normal.isNull(); };
    std::transform(normals.begin(), normals.end(), normals.begin(), normalisedOrZero);
    if (std::all_of(normals.begin(), normals.end(), isNull)) {
        createNormals(mesh, creaseAngle);
    } else if (std::any_of(normals.begin(), normals.end(), isNull)) {
        const CornerAdjacency adjacency(mesh);
        for (std::size_t i = 0; i < mesh.vertexCount(); ++i) {
            if (normals[i].isNull())
                normals[i] = adjacency.normalOfVertex(i);
        }
    }
}

void orientNormalsOutwards(Mesh& mesh)
{
    QVector3D centre;
    for (const QVector3D& position : mesh.positions)
        centre += position / static_cast<float>(mesh.vertexCount());
    float cosines = 0;
    for (std::size_t i = 0; i < mesh.vertexCount(); ++i)
        cosines +=
            QVector3D::dotProduct(mesh.normals[i], (mesh.positions[i] - centre).normalized());
    if (cosines >= kInsideOutCosine * static_cast<float>(mesh.vertexCount()))
        return;
    for (QVector3D& normal : mesh.normals)
        normal = -normal;
    for (MorphTarget& target : mesh.morphTargets) {
        for (QVector3D& delta : target.normalDeltas)
            delta = -delta;
    }
}

} // namespace viewer
