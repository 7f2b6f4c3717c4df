// The twist of a mesh in its current pose, for CPU code.
#pragma once

#include "evaluator/Geometry.h"
#include "viewer/render/Scene.h"

struct TwistPose {
    vyra::MatrixRows toTwist{}; // from the space after skinning
    vyra::MatrixRows fromTwist{};
    float anglePerHeight = 0; // radians
};

// Requires that the mesh's last deformer is a twist.
TwistPose twistPoseOf(const viewer::CharacterMesh& mesh);
