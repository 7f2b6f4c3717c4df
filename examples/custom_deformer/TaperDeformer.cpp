#include "TaperDeformer.h"

#include <cmath>

vyra::KernelSource TaperDeformer::kernel(unsigned /*pass*/) const
{
    return {"taper.cl", "taper"};
}

void TaperDeformer::setArguments(unsigned /*pass*/, vyra::KernelArguments& arguments)
{
    arguments.value(taper);
}

// The same as taper.cl: the reference of tests, and the fallback without OpenCL.
void TaperDeformer::deform(const vyra::MeshGeometry& /*geometry*/, vyra::Surface& surface) const
{
    for (std::size_t i = 0; i < surface.vertexCount(); ++i) {
        vyra::Vector3& p = surface.positions[i];
        vyra::Vector3& n = surface.normals[i];
        const float scale = 1 + taper * p.y;
        n.y = scale * n.y - taper * (p.x * n.x + p.z * n.z);
        const float length = std::sqrt(n.x * n.x + n.y * n.y + n.z * n.z);
        n = {n.x / length, n.y / length, n.z / length};
        p = {scale * p.x, p.y, scale * p.z};
    }
}
