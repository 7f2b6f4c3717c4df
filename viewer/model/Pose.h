// Where the nodes of a model are at a moment of an animation, and what that means for its meshes.
#pragma once

#include "evaluator/Geometry.h"
#include "viewer/model/Model.h"

#include <vector>

#include <QMatrix4x4>

namespace viewer {

// The value at a time between keys: linear for vectors, spherical for rotations (the shorter way).
// Before the first key its value, behind the last key its value. `keys` is not empty.
QVector3D sample(const std::vector<Key<QVector3D>>& keys, double seconds);
QQuaternion sample(const std::vector<Key<QQuaternion>>& keys, double seconds);

// For each node of a model the transform from its space to the model's.
using Pose = std::vector<QMatrix4x4>;

// The pose at `seconds`, which wraps around the animation's length. Null stands for rest. The
// second form reuses the storage of `pose`.
Pose poseAt(const Model& model, const Animation* animation, double seconds);
void poseAt(const Model& model, const Animation* animation, double seconds, Pose& pose);

// The upper three rows of a transform, as deformers take it.
vyra::MatrixRows rowsOf(const QMatrix4x4& matrix);

// For each bone of the mesh the transform from the mesh at rest to the model's space. The second
// form reuses the storage of `matrices`.
std::vector<vyra::MatrixRows> boneMatrices(const Mesh& mesh, const Pose& pose);
void boneMatrices(const Mesh& mesh, const Pose& pose, std::vector<vyra::MatrixRows>& matrices);

// The weight of each morph target of the mesh at `seconds`, which wraps around the animation's
// length. Null stands for the weights at rest.
void morphWeights(const Mesh& mesh, const Animation* animation, double seconds,
                  std::vector<float>& weights);

// The transform from the space in which the mesh's deformers leave it (the model's where bones took
// it there, else its node's) to the model's.
QMatrix4x4 meshToModel(const Mesh& mesh, const Pose& pose);

// The transform from the space of the mesh at rest to the model's, by `pose`, which is at rest too:
// all bones agree on it then.
QMatrix4x4 restToModel(const Mesh& mesh, const Pose& pose);

} // namespace viewer
