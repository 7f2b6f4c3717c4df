// What is checked and mended in a scene between Assimp's importers and its post-processing.
#pragma once

#include <optional>
#include <string>

struct aiScene;

namespace viewer {

// Returns what makes the scene useless because a number in it is infinite or not a number, such as
// "vertex 7 of the mesh 'Cube' is at (inf, 0, 0)". Empty if all numbers are finite.
std::optional<std::string> findNonFiniteNumber(const aiScene& scene);

// Scales a scene whose largest mesh is very small or very large so that its extent becomes 1.
// Post-processing compares positions with a fixed tolerance, and squares of coordinates must
// neither vanish nor overflow.
void rescaleExtremeScene(aiScene& scene);

} // namespace viewer
