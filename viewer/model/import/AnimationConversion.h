// Converts one animation of an Assimp scene.
#pragma once

#include "viewer/model/Model.h"
#include "viewer/model/import/AssimpConversion.h"

#include <cstddef>

struct aiAnimation;

namespace viewer {

// Converts ticks to seconds and sorts the keys by time. Channels of nodes that are not in `nodes`
// are left out, and so are weights of morph targets with an index of `targetCount` or more.
[[nodiscard]] Animation convertAnimation(const aiAnimation& source, const NodeIndex& nodes,
                                         std::size_t targetCount);

} // namespace viewer
