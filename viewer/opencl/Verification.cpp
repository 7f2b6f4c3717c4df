#include "viewer/opencl/Verification.h"

#include <algorithm>
#include <cmath>
#include <limits>
#include <vector>

#include <tbb/parallel_for.h>

namespace viewer {
namespace {

// Unlike std::max, returns infinity if a or b is NaN.
double larger(double a, double b) noexcept
{
    if (std::isnan(a) || std::isnan(b))
        return std::numeric_limits<double>::infinity();
    return a > b ? a : b;
}

QVector3D difference(const vyra::Vector3& a, const vyra::Vector3& b)
{
    return {a.x - b.x, a.y - b.y, a.z - b.z};
}

// Returns the angle in radians by which each normal can rotate per unit of position error in
// character space, to first order: an error d at the corners of a triangle changes its edges a and
// b by at most 2 d, and their cross product, which is the normal, by at most 2 d (|a| + |b|).
std::vector<double> normalSensitivities(const vyra::Surface& surface, const QMatrix4x4& toCharacter,
                                        const vyra::SmoothTopology& topology)
{
    using Topology = vyra::SmoothTopology;
    const auto ranges = topology.cornerRanges().values<Topology::Range>();
    const auto corners = topology.corners().values<Topology::Corner>();
    std::vector<double> angles(surface.vertexCount());
    for (std::size_t i = 0; i < angles.size(); ++i) {
        const auto edgeTo = [&](std::uint32_t other) {
            return toCharacter.mapVector(
                difference(surface.positions[other], surface.positions[i]));
        };
        double lengths = 0;
        QVector3D area;
        for (const auto& corner :
             corners.subspan(ranges[i].begin, ranges[i].end - ranges[i].begin)) {
            const QVector3D a = edgeTo(corner.next);
            const QVector3D b = edgeTo(corner.last);
            lengths += a.length() + b.length();
            area += QVector3D::crossProduct(a, b);
        }
        angles[i] = 2 * lengths / std::max(area.length(), std::numeric_limits<float>::min());
    }
    return angles;
}

// Returns the topology of the deformer that computes normals from triangles, null if there is none.
const vyra::SmoothTopology* topologyOfNormals(const vyra::DeformableMesh& mesh)
{
    for (const auto& deformer : mesh.deformers()) {
        if (const auto* smooth = dynamic_cast<const vyra::SmoothDeformer*>(deformer.get());
            smooth && smooth->passCount() > 0)
            return &smooth->topology();
    }
    return nullptr;
}

} // namespace

void Deviation::include(const Deviation& other) noexcept
{
    position = larger(position, other.position);
    if (!(other.normal * normalBound <= normal * other.normalBound)) {
        normal = larger(other.normal, 0);
        normalBound = other.normalBound;
    }
}

bool Deviation::withinBound() const noexcept
{
    return position <= kPositionBound && normal <= normalBound;
}

Deviation compare(const vyra::Surface& actual, const vyra::Surface& expected,
                  const QMatrix4x4& toCharacter, const vyra::SmoothTopology* topology)
{
    Deviation deviation;
    for (std::size_t i = 0; i < expected.vertexCount(); ++i) {
        const QVector3D distance =
            toCharacter.mapVector(difference(actual.positions[i], expected.positions[i]));
        deviation.include({distance.length()});
    }
    std::vector<double> sensitivities(expected.vertexCount());
    if (topology)
        sensitivities = normalSensitivities(expected, toCharacter, *topology);
    for (std::size_t i = 0; i < expected.vertexCount(); ++i) {
        const QVector3D change = difference(actual.normals[i], expected.normals[i]);
        const double bound = kNormalBound + std::min(sensitivities[i] * deviation.position, 2.0);
        deviation.include({0, change.length(), bound});
    }
    return deviation;
}

Deviation verify(QOpenGLFunctions_3_3_Core& gl, const Scene& scene)
{
    const std::vector<CharacterMesh*>& meshes = scene.meshes();
    std::vector<vyra::Surface> actual;
    actual.reserve(meshes.size());
    for (const CharacterMesh* mesh : meshes)
        actual.push_back({mesh->positions.read(gl), mesh->normals.read(gl)});

    std::vector<Deviation> deviations(meshes.size());
    tbb::parallel_for(std::size_t{0}, meshes.size(), [&](std::size_t i) {
        const CharacterMesh& mesh = *meshes[i];
        deviations[i] = compare(actual[i], mesh.deformable->deformOnCpu(), mesh.pose.geometryMatrix,
                                topologyOfNormals(*mesh.deformable));
    });
    Deviation largest;
    for (const Deviation& deviation : deviations)
        largest.include(deviation);
    return largest;
}

bool deformsOnOpenCL(const Scene& scene)
{
    return std::any_of(scene.meshes().begin(), scene.meshes().end(),
                       [](const auto* mesh) { return mesh->deformable->usesOpenCL(); });
}

} // namespace viewer
