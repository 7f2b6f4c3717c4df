// Poses of a model, and the matrices and weights that its deformers take from them.
#pragma once

#include "evaluator/Geometry.h"
#include "viewer/model/Model.h"

#include <vector>

#include <QMatrix4x4>

namespace viewer {

// Interpolates between keys: linearly for vectors, spherically along the shorter arc for rotations.
// Returns the first value before the first key and the last value after the last key. `keys` is not
// empty.
[[nodiscard]] QVector3D sample(const std::vector<Key<QVector3D>>& keys, double seconds);
[[nodiscard]] QQuaternion sample(const std::vector<Key<QQuaternion>>& keys, double seconds);

// Transforms from the space of each node of a model to model space.
using Pose = std::vector<QMatrix4x4>;

// Computes the pose at `seconds`, which wraps around the animation's length. A null animation gives
// the rest pose. The second form reuses the storage of `pose`.
[[nodiscard]] Pose poseAt(const Model& model, const Animation* animation, double seconds);
void poseAt(const Model& model, const Animation* animation, double seconds, Pose& pose);

// Returns the upper three rows of a transform, the form that deformers take.
[[nodiscard]] vyra::MatrixRows rowsOf(const QMatrix4x4& matrix);

// Computes the transform of each bone from the mesh at rest to model space. The second form reuses
// the storage of `matrices`.
[[nodiscard]] std::vector<vyra::MatrixRows> boneMatrices(const Mesh& mesh, const Pose& pose);
void boneMatrices(const Mesh& mesh, const Pose& pose, std::vector<vyra::MatrixRows>& matrices);

// Computes the weight of each morph target of the mesh at `seconds`, which wraps around the
// animation's length. A null animation gives the weights at rest.
void morphWeights(const Mesh& mesh, const Animation* animation, double seconds,
                  std::vector<float>& weights);

// Returns the transform to model space from the space of the mesh after skinning: that is model
// space already in a mesh with bones, and its node's space in one without.
[[nodiscard]] QMatrix4x4 meshToModel(const Mesh& mesh, const Pose& pose);

// Returns the transform from the mesh at rest to model space. `pose` is the rest pose, in which all
// bones have the same transform.
[[nodiscard]] QMatrix4x4 restToModel(const Mesh& mesh, const Pose& pose);

} // namespace viewer
