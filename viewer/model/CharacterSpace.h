// The space in which every character has the same size, whatever its file's units and origin.
#pragma once

#include "viewer/model/Model.h"

#include <vector>

#include <QMatrix4x4>
#include <QVector3D>

namespace viewer {

// Feet at y = 0, upright along y, centred on the y axis, the largest extent 1.
struct CharacterSpace {
    QMatrix4x4 fromModel;
    QVector3D size;                 // extent in this space, over the whole animation
    std::vector<QVector3D> outline; // the outermost points of the measured poses, in this space
};

// Measures the model over one cycle of the animation (null: at rest), without the twist.
CharacterSpace characterSpace(const Model& model, const Animation* animation);

} // namespace viewer
