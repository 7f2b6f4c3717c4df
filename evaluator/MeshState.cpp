#include "evaluator/MeshState.h"

#include <algorithm>
#include <cmath>
#include <limits>

namespace vyra {
namespace {

bool isFinite(const Vector3& v)
{
    return std::isfinite(v.x) && std::isfinite(v.y) && std::isfinite(v.z);
}

// Returns a text such as "position 17 is not a finite number", or an empty text.
std::string findNonFinite(const std::vector<Vector3>& values, const char* what)
{
    const auto found = std::find_if_not(values.begin(), values.end(), isFinite);
    if (found == values.end())
        return {};
    return std::string(what) + ' ' + std::to_string(found - values.begin()) +
           " is not a finite number";
}

} // namespace

std::string findProblem(const MeshGeometry& geometry)
{
    const auto& [positions, normals] = geometry.rest;
    if (positions.empty())
        return "it has no vertices";
    // Device buffers have 32-bit sizes.
    if (positions.size() > std::numeric_limits<std::uint32_t>::max() / sizeof(Vector3))
        return "it has more vertices than a device buffer holds";
    if (normals.size() != positions.size())
        return "it has " + std::to_string(positions.size()) + " positions and " +
               std::to_string(normals.size()) + " normals; the numbers must be equal";
    if (geometry.triangles.size() % 3 != 0)
        return "the number of its triangle indices is not a multiple of 3";
    for (const std::uint32_t index : geometry.triangles) {
        if (index >= positions.size())
            return "a triangle refers to vertex " + std::to_string(index) + ", and there are " +
                   std::to_string(positions.size()) + " vertices";
    }
    const std::string problem = findNonFinite(positions, "position");
    return problem.empty() ? findNonFinite(normals, "normal") : problem;
}

} // namespace vyra
