// Normalised space of a character, independent of the units and the origin of its file.
#pragma once

#include "viewer/model/Model.h"

#include <vector>

#include <QMatrix4x4>
#include <QVector3D>

namespace viewer {

// In character space, feet are at y = 0, up is y, the y axis is the centre, the largest extent
// is 1.
struct CharacterSpace {
    QMatrix4x4 fromModel;           // from model space
    QVector3D size;                 // extent over the whole animation, in character space
    std::vector<QVector3D> outline; // outermost points of the sampled poses, in character space
};

// Computes the character space from poses sampled over one cycle of the animation, or from the rest
// pose if `animation` is null. Applies morph targets and bones only.
[[nodiscard]] CharacterSpace characterSpace(const Model& model, const Animation* animation);

} // namespace viewer
