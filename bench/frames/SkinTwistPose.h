// The twist of a mesh in its present pose, as CPU code takes it.
#pragma once

#include "evaluator/Geometry.h"
#include "viewer/render/Scene.h"

struct TwistPose {
    vyra::MatrixRows toTwist{}; // from the space after skinning
    vyra::MatrixRows fromTwist{};
    float anglePerHeight = 0; // radians
};

// The mesh's last deformer is a twist.
TwistPose twistPoseOf(const viewer::CharacterMesh& mesh);
