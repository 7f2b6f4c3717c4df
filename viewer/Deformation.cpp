#include "viewer/Deformation.h"

#include <cmath>

namespace viewer {
namespace {

struct Vector {
    double x, y, z;
};

Vector wide(const QVector3D& v)
{
    return {v.x(), v.y(), v.z()};
}

QVector3D narrow(const Vector& v)
{
    return {static_cast<float>(v.x), static_cast<float>(v.y), static_cast<float>(v.z)};
}

double dot(const Vector& a, const Vector& b)
{
    return a.x * b.x + a.y * b.y + a.z * b.z;
}

Vector cross(const Vector& a, const Vector& b)
{
    return {a.y * b.z - a.z * b.y, a.z * b.x - a.x * b.z, a.x * b.y - a.y * b.x};
}

Vector normalised(const Vector& v)
{
    const double length = std::sqrt(dot(v, v));
    return length > 0 ? Vector{v.x / length, v.y / length, v.z / length} : v;
}

// A 3x4 matrix: row i is (axis[i], offset[i]).
struct Affine {
    Vector axis[3];
    double offset[3];
};

Affine wide(const MatrixRows& rows)
{
    Affine result;
    for (std::size_t i = 0; i < 3; ++i) {
        result.axis[i] = {rows[4 * i], rows[4 * i + 1], rows[4 * i + 2]};
        result.offset[i] = rows[4 * i + 3];
    }
    return result;
}

void addScaled(Affine& sum, const Affine& term, double factor)
{
    for (int i = 0; i < 3; ++i) {
        sum.axis[i].x += factor * term.axis[i].x;
        sum.axis[i].y += factor * term.axis[i].y;
        sum.axis[i].z += factor * term.axis[i].z;
        sum.offset[i] += factor * term.offset[i];
    }
}

Vector transformPoint(const Affine& m, const Vector& p)
{
    return {dot(m.axis[0], p) + m.offset[0], dot(m.axis[1], p) + m.offset[1],
            dot(m.axis[2], p) + m.offset[2]};
}

// Multiplies by the transposed linear part.
Vector transformTransposed(const Affine& m, const Vector& v)
{
    return {m.axis[0].x * v.x + m.axis[1].x * v.y + m.axis[2].x * v.z,
            m.axis[0].y * v.x + m.axis[1].y * v.y + m.axis[2].y * v.z,
            m.axis[0].z * v.x + m.axis[1].z * v.y + m.axis[2].z * v.z};
}

// The cofactors of the linear part carry normals through any transform, also a sheared one; the
// sign keeps them outside of a mirrored mesh.
Vector transformNormal(const Affine& m, const Vector& n)
{
    const Vector first = cross(m.axis[1], m.axis[2]);
    const Vector second = cross(m.axis[2], m.axis[0]);
    const Vector third = cross(m.axis[0], m.axis[1]);
    const double sign = dot(m.axis[0], first) < 0 ? -1.0 : 1.0;
    return normalised({sign * dot(first, n), sign * dot(second, n), sign * dot(third, n)});
}

Affine blend(const std::vector<Affine>& bones, const BoneIndices& indices,
             const BoneWeights& weights)
{
    Affine sum{};
    for (std::size_t i = 0; i < kBonesPerVertex; ++i)
        addScaled(sum, bones[indices[i]], weights[i]);
    return sum;
}

} // namespace

Surface skin(const Mesh& mesh, const std::vector<MatrixRows>& bones)
{
    if (!mesh.hasBones())
        return {mesh.positions, mesh.normals};
    std::vector<Affine> matrices;
    matrices.reserve(bones.size());
    for (const MatrixRows& rows : bones)
        matrices.push_back(wide(rows));

    Surface result;
    result.positions.reserve(mesh.vertexCount());
    result.normals.reserve(mesh.vertexCount());
    for (std::size_t i = 0; i < mesh.vertexCount(); ++i) {
        const Affine matrix = blend(matrices, mesh.boneIndices[i], mesh.boneWeights[i]);
        result.positions.push_back(narrow(transformPoint(matrix, wide(mesh.positions[i]))));
        result.normals.push_back(narrow(transformNormal(matrix, wide(mesh.normals[i]))));
    }
    return result;
}

// With R the rotation by the angle twist * y, a point p becomes R p. Its Jacobian is
// R (I + twist w e_y^T), w = (z, 0, -x), so a normal n becomes R (n - twist (w . n) e_y).
void twist(const MeshPose& pose, Surface& surface)
{
    const Affine toCharacter = wide(rowsOf(pose.geometryMatrix));
    const Affine fromCharacter = wide(rowsOf(pose.inverseGeometryMatrix));
    for (std::size_t i = 0; i < surface.positions.size(); ++i) {
        const Vector p = transformPoint(toCharacter, wide(surface.positions[i]));
        Vector n = transformTransposed(fromCharacter, wide(surface.normals[i]));
        n.y -= pose.twist * (p.z * n.x - p.x * n.z);

        const double angle = pose.twist * p.y;
        const double c = std::cos(angle);
        const double s = std::sin(angle);
        const Vector turnedPoint{c * p.x + s * p.z, p.y, c * p.z - s * p.x};
        const Vector turnedNormal{c * n.x + s * n.z, n.y, c * n.z - s * n.x};
        surface.positions[i] = narrow(transformPoint(fromCharacter, turnedPoint));
        surface.normals[i] = narrow(normalised(transformTransposed(toCharacter, turnedNormal)));
    }
}

Surface deform(const Mesh& mesh, const MeshPose& pose)
{
    if (!pose.deforms)
        return {mesh.positions, mesh.normals};
    Surface surface = skin(mesh, pose.bones);
    twist(pose, surface);
    return surface;
}

} // namespace viewer
