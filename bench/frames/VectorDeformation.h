// The viewer's two deformers (Deformation.h tells what they calculate) in single precision and with
// the processor's vector instructions.
#pragma once

#include "viewer/Deformation.h"

#include <cstddef>

// Deforms the vertices from `begin` up to `end` into the same places of two arrays. Safe from any
// thread.
void deformWithVectors(const viewer::Mesh& mesh, const viewer::MeshPose& pose, std::size_t begin,
                       std::size_t end, QVector3D* positions, QVector3D* normals);
