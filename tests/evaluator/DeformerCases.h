// Deformers with settings that use all of their parts, for tests that run over all of them.
#pragma once

#include "evaluator/Deformer.h"

#include <functional>
#include <memory>
#include <ostream>
#include <vector>

struct DeformerCase {
    const char* name; // letters, for test names
    std::function<std::unique_ptr<vyra::Deformer>(const vyra::MeshGeometry&)> make;
    // Whether a point's movement depends on its position only, and normals follow the moved
    // surface. Vertices that belong together are kProbes in a row.
    bool isSmoothMap;
};

// For messages of tests.
inline void PrintTo(const DeformerCase& row, std::ostream* stream)
{
    *stream << row.name;
}

inline constexpr unsigned kProbes = 6;

const std::vector<DeformerCase>& deformerCases();

constexpr double kTolerance = 1e-6;

void expectNear(const vyra::Vector3& actual, const vyra::Vector3& expected);

// A wavy sheet with `side` vertices along each edge. The last vertex has no triangle, and the first
// has two that cancel.
vyra::MeshGeometry makeSheet(unsigned side);
