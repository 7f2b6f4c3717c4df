#include "frames/SkinTwistPose.h"

#include "evaluator/TwistDeformer.h"
#include "viewer/model/Pose.h"

TwistPose twistPoseOf(const viewer::CharacterMesh& mesh)
{
    const auto& twist =
        dynamic_cast<const vyra::TwistDeformer&>(*mesh.deformable->deformers().back());
    const QMatrix4x4& space = mesh.pose.geometryMatrix;
    return {viewer::rowsOf(space), viewer::rowsOf(space.inverted()), twist.angle};
}
