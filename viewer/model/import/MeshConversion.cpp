#include "viewer/model/import/MeshConversion.h"

#include "viewer/model/import/MeshNormals.h"

#include <algorithm>
#include <cmath>
#include <numeric>
#include <optional>

#include <assimp/scene.h>

namespace viewer {
namespace {

// Light clay, for materials without a colour of their own.
const QVector3D kDefaultColour(0.76f, 0.57f, 0.43f);
// Least difference between colour channels. Exporters write a grey if the colour is in a texture.
constexpr float kLeastChroma = 0.05f;

QVector3D materialColour(const aiScene& scene, unsigned material)
{
    aiColor3D colour;
    if (scene.mMaterials[material]->Get(AI_MATKEY_COLOR_DIFFUSE, colour) != aiReturn_SUCCESS)
        return kDefaultColour;
    const float darkest = std::min({colour.r, colour.g, colour.b});
    const float brightest = std::max({colour.r, colour.g, colour.b});
    if (brightest - darkest < kLeastChroma || !std::isfinite(colour.r + colour.g + colour.b))
        return kDefaultColour;
    return {colour.r, colour.g, colour.b};
}

void copyVertices(const aiMesh& source, Mesh& mesh)
{
    for (unsigned i = 0; i < source.mNumVertices; ++i) {
        mesh.positions.push_back(toQt(source.mVertices[i]));
        if (source.HasNormals())
            mesh.normals.push_back(toQt(source.mNormals[i]));
    }
    for (unsigned i = 0; i < source.mNumFaces; ++i) {
        const aiFace& face = source.mFaces[i];
        mesh.triangles.insert(mesh.triangles.end(), face.mIndices,
                              face.mIndices + face.mNumIndices);
    }
}

// Stores a weight in the first unused element of its vertex. Ignores weights of 0 or less.
void addInfluence(Mesh& mesh, std::size_t vertex, std::uint32_t bone, float weight)
{
    if (weight <= 0)
        return;
    BoneWeights& weights = mesh.boneWeights[vertex];
    const auto unused = std::find(weights.begin(), weights.end(), 0.0f);
    if (unused == weights.end())
        return;
    *unused = weight;
    mesh.boneIndices[vertex][static_cast<std::size_t>(unused - weights.begin())] = bone;
}

// Scales the weights so that they add up to 1. All zero stays all zero.
BoneWeights normaliseWeights(const BoneWeights& weights)
{
    // In double precision, because the sum of large weights overflows single precision.
    const double sum = std::accumulate(weights.begin(), weights.end(), 0.0);
    if (sum <= 0)
        return {};
    BoneWeights result = weights;
    for (float& weight : result)
        weight = static_cast<float>(weight / sum);
    return result;
}

// Binds vertices without a bone to the mesh's node, which becomes one more bone.
void bindUnweightedVertices(Mesh& mesh)
{
    std::optional<std::uint32_t> nodeBone;
    for (std::size_t vertex = 0; vertex < mesh.vertexCount(); ++vertex) {
        if (mesh.boneWeights[vertex] != BoneWeights{})
            continue;
        if (!nodeBone) {
            nodeBone = static_cast<std::uint32_t>(mesh.bones.size());
            mesh.bones.push_back({mesh.node, QMatrix4x4()});
        }
        addInfluence(mesh, vertex, *nodeBone, 1.0f);
    }
}

void copyBones(const aiMesh& source, const NodeIndex& nodes, Mesh& mesh)
{
    mesh.boneIndices.resize(mesh.vertexCount());
    mesh.boneWeights.resize(mesh.vertexCount());
    for (unsigned i = 0; i < source.mNumBones; ++i) {
        const aiBone& bone = *source.mBones[i];
        const auto node = nodes.find(bone.mName.C_Str());
        if (node == nodes.end())
            continue;
        const auto index = static_cast<std::uint32_t>(mesh.bones.size());
        mesh.bones.push_back({node->second, toQt(bone.mOffsetMatrix)});
        for (unsigned w = 0; w < bone.mNumWeights; ++w)
            addInfluence(mesh, bone.mWeights[w].mVertexId, index, bone.mWeights[w].mWeight);
    }
    std::transform(mesh.boneWeights.begin(), mesh.boneWeights.end(), mesh.boneWeights.begin(),
                   normaliseWeights);
    bindUnweightedVertices(mesh);
}

// Assimp's targets hold whole positions and normals, not differences.
void copyMorphTargets(const aiMesh& source, Mesh& mesh)
{
    // Normals of the file may be infinite or NaN, and a difference may overflow.
    const auto deltas = [&source](const aiVector3D* target, const aiVector3D* base) {
        std::vector<QVector3D> result;
        for (unsigned i = 0; target && base && i < source.mNumVertices; ++i)
            result.push_back(finiteOrZero(target[i] - base[i]));
        return result;
    };
    for (unsigned i = 0; i < source.mNumAnimMeshes; ++i) {
        const aiAnimMesh& target = *source.mAnimMeshes[i];
        if (target.mNumVertices != source.mNumVertices)
            continue;
        MorphTarget& copy = mesh.morphTargets.emplace_back();
        copy.positionDeltas = target.mVertices ? deltas(target.mVertices, source.mVertices)
                                               : std::vector<QVector3D>(source.mNumVertices);
        copy.normalDeltas = deltas(target.mNormals, source.mNormals);
        copy.weight = finiteOrZero(target.mWeight);
    }
}

} // namespace

Mesh convertMesh(const aiScene& scene, const aiMesh& source, std::size_t node,
                 const NodeIndex& nodes, double creaseAngle)
{
    Mesh mesh;
    mesh.name = source.mName.C_Str();
    mesh.node = node;
    mesh.colour = materialColour(scene, source.mMaterialIndex);
    copyVertices(source, mesh);
    if (source.HasBones())
        copyBones(source, nodes, mesh);
    copyMorphTargets(source, mesh);
    completeNormals(mesh, creaseAngle);
    orientNormalsOutwards(mesh);
    return mesh;
}

} // namespace viewer
