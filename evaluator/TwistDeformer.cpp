#include "evaluator/TwistDeformer.h"

#include "evaluator/VectorMath.h"

#include <cmath>

namespace vyra {
namespace {

constexpr float kLargestAngle = 1000;

void addRows(KernelArguments& arguments, const Affine& m)
{
    const std::array<double, 3> offset = {m.offset.x, m.offset.y, m.offset.z};
    for (std::size_t i = 0; i < 3; ++i) {
        const Vector3 row = narrow(m.rows[i]);
        arguments.value(cl_float4{{row.x, row.y, row.z, static_cast<float>(offset[i])}});
    }
}

} // namespace

std::string TwistDeformer::mismatch(const MeshGeometry& /*geometry*/) const
{
    return isInvertible(wide(space)) ? ""
                                     : "the matrix to the space of the twist has no inverse; set "
                                       "TwistDeformer::space to one that has";
}

KernelSource TwistDeformer::kernel(unsigned /*pass*/) const
{
    return {"twist.cl", "twist"};
}

void TwistDeformer::setArguments(unsigned /*pass*/, KernelArguments& arguments)
{
    addRows(arguments, wide(space));
    addRows(arguments, inverse(wide(space)));
    arguments.value(angle);
}

// With R the rotation by the angle k * y, a point p becomes R p. Its Jacobian is
// R (I + k w e_y^T), w = (z, 0, -x), so a normal n becomes R (n - k (w . n) e_y).
void TwistDeformer::deform(const MeshGeometry& /*geometry*/, Surface& surface) const
{
    const Affine to = wide(space);
    const Affine from = inverse(to);
    const double k = angle;
    for (std::size_t i = 0; i < surface.vertexCount(); ++i) {
        const Vector p = transformPoint(to, wide(surface.positions[i]));
        Vector n = transformTransposed(from, wide(surface.normals[i]));
        n.y -= k * (p.z * n.x - p.x * n.z);

        const double cosine = std::cos(k * p.y);
        const double sine = std::sin(k * p.y);
        const auto turned = [&](const Vector& v) {
            return Vector{cosine * v.x + sine * v.z, v.y, cosine * v.z - sine * v.x};
        };
        surface.positions[i] = narrow(transformPoint(from, turned(p)));
        surface.normals[i] = narrow(normalised(transformTransposed(to, turned(n))));
    }
}

std::vector<DeformerParameter> TwistDeformer::parameters()
{
    return {{"angle", "radians per unit of height", &angle, -kLargestAngle, kLargestAngle}};
}

} // namespace vyra
