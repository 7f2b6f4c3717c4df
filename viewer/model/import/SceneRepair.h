// Checks and corrections of a scene between Assimp's importers and its post-processing.
#pragma once

#include <optional>
#include <string>

struct aiScene;

namespace viewer {

// Describes the first infinite number or NaN in the scene, such as "vertex 7 of the mesh 'Cube' is
// at (inf, 0, 0)". Empty if all numbers are finite. Normals and colours are not checked.
[[nodiscard]] std::optional<std::string> findNonFiniteNumber(const aiScene& scene);

// Scales a scene whose largest mesh is very small or very large to an extent of 1. Post-processing
// compares positions with a fixed tolerance, and squares of coordinates must not underflow or
// overflow.
void rescaleExtremeScene(aiScene& scene);

} // namespace viewer
