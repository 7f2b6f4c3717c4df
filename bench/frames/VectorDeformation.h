// Skinning and twist in single precision with the CPU's vector instructions.
#pragma once

#include "evaluator/Geometry.h"
#include "viewer/Model.h"

#include <cstddef>
#include <vector>

// What the deformers need in one frame.
struct VectorPose {
    const viewer::Mesh* mesh = nullptr;
    const std::vector<vyra::MatrixRows>* bones = nullptr; // empty in a mesh without bones
    vyra::MatrixRows geometryMatrix{};
    vyra::MatrixRows inverseGeometryMatrix{};
    float twistPerHeight = 0;
};

// Deforms the vertices from `begin` up to `end` into the same places of two arrays. Safe from any
// thread.
void deformWithVectors(const VectorPose& pose, std::size_t begin, std::size_t end,
                       vyra::Vector3* positions, vyra::Vector3* normals);
