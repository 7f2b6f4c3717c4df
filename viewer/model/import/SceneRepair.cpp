#include "viewer/model/import/SceneRepair.h"

#include <algorithm>
#include <cmath>
#include <limits>
#include <sstream>

#include <assimp/scene.h>

namespace viewer {
namespace {

// Range of extents that post-processing handles, in the file's units.
constexpr float kSmallestExtent = 0.1f;
constexpr float kLargestExtent = 1e6f;

bool isFinite(const aiVector3D& vector)
{
    return std::isfinite(vector.x) && std::isfinite(vector.y) && std::isfinite(vector.z);
}

bool isFinite(const aiQuaternion& rotation)
{
    return std::isfinite(rotation.w) && std::isfinite(rotation.x) && std::isfinite(rotation.y) &&
           std::isfinite(rotation.z);
}

bool isFinite(const aiMatrix4x4& matrix)
{
    const float* numbers = &matrix.a1;
    return std::all_of(numbers, numbers + 16, [](float number) { return std::isfinite(number); });
}

std::string named(const char* kind, const aiString& name)
{
    return std::string("the ") + kind + " '" + name.C_Str() + "'";
}

std::optional<std::string> findInMesh(const aiMesh& mesh)
{
    for (unsigned i = 0; i < mesh.mNumVertices; ++i) {
        const aiVector3D& vertex = mesh.mVertices[i];
        if (isFinite(vertex))
            continue;
        std::ostringstream text;
        text << "vertex " << i << " of " << named("mesh", mesh.mName) << " is at (" << vertex.x
             << ", " << vertex.y << ", " << vertex.z << ')';
        return text.str();
    }
    for (unsigned i = 0; i < mesh.mNumAnimMeshes; ++i) {
        const aiAnimMesh& target = *mesh.mAnimMeshes[i];
        if (target.mVertices &&
            !std::all_of(target.mVertices, target.mVertices + target.mNumVertices,
                         [](const aiVector3D& vertex) { return isFinite(vertex); }))
            return "a morph target of " + named("mesh", mesh.mName) +
                   " has a vertex that is not finite";
    }
    for (unsigned i = 0; i < mesh.mNumBones; ++i) {
        const aiBone& bone = *mesh.mBones[i];
        const bool weighted =
            std::all_of(bone.mWeights, bone.mWeights + bone.mNumWeights,
                        [](const auto& weight) { return std::isfinite(weight.mWeight); });
        if (!weighted || !isFinite(bone.mOffsetMatrix))
            return named("bone", bone.mName) + " of " + named("mesh", mesh.mName) +
                   " has a number that is not finite";
    }
    return std::nullopt;
}

std::optional<std::string> findInNode(const aiNode& node)
{
    if (!isFinite(node.mTransformation))
        return named("node", node.mName) + " has a transform that is not finite";
    for (unsigned i = 0; i < node.mNumChildren; ++i) {
        if (auto found = findInNode(*node.mChildren[i]))
            return found;
    }
    return std::nullopt;
}

template <typename Key>
bool keysAreFinite(const Key* keys, unsigned count)
{
    return std::all_of(keys, keys + count, [](const Key& key) {
        return std::isfinite(key.mTime) && isFinite(key.mValue);
    });
}

std::optional<std::string> findInAnimation(const aiAnimation& animation)
{
    bool finite = std::isfinite(animation.mDuration) && std::isfinite(animation.mTicksPerSecond);
    for (unsigned i = 0; i < animation.mNumChannels && finite; ++i) {
        const aiNodeAnim& channel = *animation.mChannels[i];
        finite = keysAreFinite(channel.mPositionKeys, channel.mNumPositionKeys) &&
                 keysAreFinite(channel.mRotationKeys, channel.mNumRotationKeys) &&
                 keysAreFinite(channel.mScalingKeys, channel.mNumScalingKeys);
    }
    if (finite)
        return std::nullopt;
    return named("animation", animation.mName) + " has a number that is not finite";
}

// Returns the largest extent of a mesh in its own space.
float extentOf(const aiMesh& mesh)
{
    constexpr float kLargest = std::numeric_limits<float>::max();
    aiVector3D low(kLargest, kLargest, kLargest);
    aiVector3D high = -low;
    for (unsigned i = 0; i < mesh.mNumVertices; ++i) {
        for (unsigned axis = 0; axis < 3; ++axis) {
            low[axis] = std::min(low[axis], mesh.mVertices[i][axis]);
            high[axis] = std::max(high[axis], mesh.mVertices[i][axis]);
        }
    }
    const aiVector3D size = mesh.mNumVertices > 0 ? high - low : aiVector3D();
    return std::max({size.x, size.y, size.z});
}

void scaleTranslation(aiMatrix4x4& matrix, float factor)
{
    matrix.a4 *= factor;
    matrix.b4 *= factor;
    matrix.c4 *= factor;
}

void scaleNode(aiNode& node, float factor)
{
    scaleTranslation(node.mTransformation, factor);
    for (unsigned i = 0; i < node.mNumChildren; ++i)
        scaleNode(*node.mChildren[i], factor);
}

void scaleMesh(aiMesh& mesh, float factor)
{
    std::for_each(mesh.mVertices, mesh.mVertices + mesh.mNumVertices,
                  [factor](aiVector3D& vertex) { vertex *= factor; });
    for (unsigned i = 0; i < mesh.mNumAnimMeshes; ++i) {
        aiAnimMesh& target = *mesh.mAnimMeshes[i];
        if (target.mVertices)
            std::for_each(target.mVertices, target.mVertices + target.mNumVertices,
                          [factor](aiVector3D& vertex) { vertex *= factor; });
    }
    for (unsigned i = 0; i < mesh.mNumBones; ++i)
        scaleTranslation(mesh.mBones[i]->mOffsetMatrix, factor);
}

void scaleAnimation(aiAnimation& animation, float factor)
{
    for (unsigned i = 0; i < animation.mNumChannels; ++i) {
        aiNodeAnim& channel = *animation.mChannels[i];
        std::for_each(channel.mPositionKeys, channel.mPositionKeys + channel.mNumPositionKeys,
                      [factor](aiVectorKey& key) { key.mValue *= factor; });
    }
}

} // namespace

std::optional<std::string> findNonFiniteNumber(const aiScene& scene)
{
    std::optional<std::string> found;
    for (unsigned i = 0; i < scene.mNumMeshes && !found; ++i)
        found = findInMesh(*scene.mMeshes[i]);
    for (unsigned i = 0; i < scene.mNumAnimations && !found; ++i)
        found = findInAnimation(*scene.mAnimations[i]);
    return found ? found : findInNode(*scene.mRootNode);
}

void rescaleExtremeScene(aiScene& scene)
{
    float extent = 0;
    for (unsigned i = 0; i < scene.mNumMeshes; ++i)
        extent = std::max(extent, extentOf(*scene.mMeshes[i]));
    const float factor = 1 / extent;
    if ((extent >= kSmallestExtent && extent <= kLargestExtent) || !std::isnormal(factor))
        return;
    for (unsigned i = 0; i < scene.mNumMeshes; ++i)
        scaleMesh(*scene.mMeshes[i], factor);
    for (unsigned i = 0; i < scene.mNumAnimations; ++i)
        scaleAnimation(*scene.mAnimations[i], factor);
    scaleNode(*scene.mRootNode, factor);
}

} // namespace viewer
