// The two deformers as the viewer defines them, on the CPU: the reference that --verify compares
// with, and the stand-in where OpenCL may not or shall not be used.
//
// A mesh goes through
//     1. skinning: a vertex follows up to four bones (only in meshes with bones),
//     2. a twist around the vertical axis, in the character's space,
// and ends in the space that skinning leaves it in.
#pragma once

#include "viewer/Model.h"
#include "viewer/Pose.h"

#include <vector>

#include <QMatrix4x4>
#include <QVector3D>

namespace viewer {

// What the deformers of one mesh need for one frame.
struct MeshPose {
    std::vector<MatrixRows> bones; // empty in a mesh without bones
    // From the deformed mesh to the character's space: feet at y = 0, upright along y, centred,
    // its largest extent 1.
    QMatrix4x4 geometryMatrix;
    QMatrix4x4 inverseGeometryMatrix;
    float twist = 0;     // radians per unit of height
    bool deforms = true; // else both deformers leave the mesh at rest
};

struct Surface {
    std::vector<QVector3D> positions;
    std::vector<QVector3D> normals; // of length 1
};

// Calculates in double precision. Safe from any thread.
Surface deform(const Mesh& mesh, const MeshPose& pose);

// The first deformer alone. Without bones it is the mesh at rest.
Surface skin(const Mesh& mesh, const std::vector<MatrixRows>& bones);

// The second deformer alone, in place.
void twist(const MeshPose& pose, Surface& surface);

} // namespace viewer
