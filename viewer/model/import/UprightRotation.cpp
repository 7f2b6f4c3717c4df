#include "viewer/model/import/UprightRotation.h"

#include "viewer/model/import/AssimpConversion.h"

#include <cstring>

#include <assimp/scene.h>

namespace viewer {
namespace {

// Prefixes of the format names of formats whose z axis points up by definition. Assimp does not
// rotate these.
constexpr const char* kFormatsWithZUp[] = {"Blender 3D", "3mf"};

QMatrix4x4 rotationToY(UpAxis up, bool isDownwards)
{
    QMatrix4x4 rotation;
    if (up == UpAxis::kX)
        rotation.rotate(isDownwards ? -90 : 90, 0, 0, 1);
    else if (up == UpAxis::kZ)
        rotation.rotate(isDownwards ? 90 : -90, 1, 0, 0);
    else
        rotation.rotate(isDownwards ? 180 : 0, 1, 0, 0);
    return rotation;
}

// Compares the rotations with a tolerance, since importers round.
bool isSameRotation(const QMatrix4x4& a, const QMatrix4x4& b)
{
    constexpr float kTolerance = 1e-5f;
    const QMatrix4x4 difference = a - b;
    for (int row = 0; row < 3; ++row) {
        if (difference.row(row).toVector3D().length() > kTolerance)
            return false;
    }
    return true;
}

QMatrix4x4 rotationOfMetadata(const aiMetadata& metadata)
{
    aiString format;
    if (metadata.Get("SourceAsset_Format", format)) {
        for (const char* prefix : kFormatsWithZUp) {
            if (std::strncmp(format.C_Str(), prefix, std::strlen(prefix)) == 0)
                return rotationToY(UpAxis::kZ, false);
        }
    }
    int axis = 0;
    int sign = 1;
    if (!metadata.Get("UpAxis", axis) || axis < 0 || axis > static_cast<int>(UpAxis::kZ))
        return {};
    metadata.Get("UpAxisSign", sign);
    return rotationToY(static_cast<UpAxis>(axis), sign < 0);
}

} // namespace

QMatrix4x4 uprightRotation(const aiScene& scene, std::optional<UpAxis> up)
{
    const QMatrix4x4 root = toQt(scene.mRootNode->mTransformation);
    const QMatrix4x4 fromZ = rotationToY(UpAxis::kZ, false);
    if (up) {
        // Some importers rotate the root from z to y. The chosen axis replaces that rotation.
        const QMatrix4x4 rotation = rotationToY(*up, false);
        return isSameRotation(root, fromZ) ? rotation * fromZ.transposed() : rotation;
    }
    const bool isUnrotated = isSameRotation(root, QMatrix4x4());
    return isUnrotated && scene.mMetaData ? rotationOfMetadata(*scene.mMetaData) : QMatrix4x4();
}

} // namespace viewer
