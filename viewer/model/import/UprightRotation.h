// The rotation that turns a model upright.
#pragma once

#include "viewer/model/import/ImportSettings.h"

#include <optional>

#include <QMatrix4x4>

struct aiScene;

namespace viewer {

// Returns the rotation from the coordinates of `scene` to coordinates in which y points up. With
// `up`, that axis of the file points up, else the axis that the file's metadata or format names. If
// the file names none, or Assimp has rotated the root node already, the result is the identity.
[[nodiscard]] QMatrix4x4 uprightRotation(const aiScene& scene, std::optional<UpAxis> up);

} // namespace viewer
