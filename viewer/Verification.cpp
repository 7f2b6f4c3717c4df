#include "viewer/Verification.h"

#include <algorithm>
#include <cmath>
#include <limits>
#include <vector>

#include <tbb/parallel_for.h>

namespace viewer {
namespace {

// Unlike std::max it does not lose a value that is not a number.
double larger(double a, double b)
{
    if (std::isnan(a) || std::isnan(b))
        return std::numeric_limits<double>::infinity();
    return a > b ? a : b;
}

QVector3D difference(const vyra::Vector3& a, const vyra::Vector3& b)
{
    return {a.x - b.x, a.y - b.y, a.z - b.z};
}

} // namespace

void Deviation::include(const Deviation& other)
{
    position = larger(position, other.position);
    normal = larger(normal, other.normal);
}

bool Deviation::withinBound() const
{
    return position <= kPositionBound && normal <= kNormalBound;
}

Deviation compare(const vyra::Surface& actual, const vyra::Surface& expected,
                  const QMatrix4x4& toCharacter)
{
    Deviation deviation;
    for (std::size_t i = 0; i < expected.vertexCount(); ++i) {
        const QVector3D distance =
            toCharacter.mapVector(difference(actual.positions[i], expected.positions[i]));
        const QVector3D turn = difference(actual.normals[i], expected.normals[i]);
        deviation.include({distance.length(), turn.length()});
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
        deviations[i] =
            compare(actual[i], mesh.deformable->deformOnCpu(), mesh.pose.geometryMatrix);
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
