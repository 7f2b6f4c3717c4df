#include "viewer/ModelImport.h"

#include <algorithm>
#include <cmath>
#include <filesystem>
#include <map>
#include <numeric>
#include <optional>

#include <assimp/Importer.hpp>
#include <assimp/config.h>
#include <assimp/postprocess.h>
#include <assimp/scene.h>

namespace viewer {
namespace {

// Where Debian's package of sample models installs them.
constexpr char kSampleModels[] = "/usr/share/assimp/models";
// For files that do not say how long a tick of their animation is; Assimp's documentation names it.
constexpr double kDefaultTicksPerSecond = 25.0;
// A light clay, for materials without a colour of their own.
const QVector3D kDefaultColour(0.76f, 0.57f, 0.43f);
// Greys are what exporters write when the colour comes from a texture.
constexpr float kLeastColour = 0.05f;

constexpr unsigned kPostProcessing = aiProcess_JoinIdenticalVertices | aiProcess_Triangulate |
                                     aiProcess_GenSmoothNormals | aiProcess_LimitBoneWeights |
                                     aiProcess_SortByPType | aiProcess_ValidateDataStructure;

using NodeIndex = std::map<std::string, std::size_t>;

QVector3D toQt(const aiVector3D& vector)
{
    return {vector.x, vector.y, vector.z};
}

QMatrix4x4 toQt(const aiMatrix4x4& matrix)
{
    // Both count rows first here.
    return QMatrix4x4(&matrix.a1);
}

void addNodes(const aiNode& source, std::size_t parent, Model& model)
{
    const std::size_t self = model.nodes.size();
    model.nodes.push_back({source.mName.C_Str(), parent, toQt(source.mTransformation)});
    for (unsigned i = 0; i < source.mNumChildren; ++i)
        addNodes(*source.mChildren[i], self, model);
}

NodeIndex indexByName(const Model& model)
{
    NodeIndex index;
    for (std::size_t i = 0; i < model.nodes.size(); ++i)
        index.emplace(model.nodes[i].name, i);
    return index;
}

QVector3D materialColour(const aiScene& scene, unsigned material)
{
    aiColor3D colour;
    if (scene.mMaterials[material]->Get(AI_MATKEY_COLOR_DIFFUSE, colour) != aiReturn_SUCCESS)
        return kDefaultColour;
    const float darkest = std::min({colour.r, colour.g, colour.b});
    const float brightest = std::max({colour.r, colour.g, colour.b});
    if (brightest - darkest < kLeastColour)
        return kDefaultColour;
    return {colour.r, colour.g, colour.b};
}

void copyVertices(const aiMesh& source, Mesh& mesh)
{
    for (unsigned i = 0; i < source.mNumVertices; ++i) {
        mesh.positions.push_back(toQt(source.mVertices[i]));
        const QVector3D normal = toQt(source.mNormals[i]).normalized();
        // Degenerate triangles have normals that are not a number or zero.
        const bool usable = std::isfinite(normal.lengthSquared()) && !normal.isNull();
        mesh.normals.push_back(usable ? normal : QVector3D(0, 1, 0));
    }
    for (unsigned i = 0; i < source.mNumFaces; ++i) {
        const aiFace& face = source.mFaces[i];
        mesh.triangles.insert(mesh.triangles.end(), face.mIndices,
                              face.mIndices + face.mNumIndices);
    }
}

// Files with normals that look inside exist: those of a closed mesh look away from its middle.
void turnNormalsOutside(Mesh& mesh)
{
    QVector3D middle;
    for (const QVector3D& position : mesh.positions)
        middle += position / static_cast<float>(mesh.vertexCount());
    float outside = 0;
    for (std::size_t i = 0; i < mesh.vertexCount(); ++i)
        outside +=
            QVector3D::dotProduct(mesh.normals[i], (mesh.positions[i] - middle).normalized());
    if (outside >= 0)
        return;
    for (QVector3D& normal : mesh.normals)
        normal = -normal;
}

// Puts a weight into the first free place of its vertex.
void addInfluence(Mesh& mesh, std::size_t vertex, std::uint32_t bone, float weight)
{
    BoneWeights& weights = mesh.boneWeights[vertex];
    const auto place = std::find(weights.begin(), weights.end(), 0.0f);
    if (place == weights.end())
        return;
    *place = weight;
    mesh.boneIndices[vertex][static_cast<std::size_t>(place - weights.begin())] = bone;
}

// Vertices that no bone moves follow the mesh's node, which becomes one more bone.
void bindLooseVertices(Mesh& mesh)
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
                   normalised);
    bindLooseVertices(mesh);
}

Mesh copyMesh(const aiScene& scene, const aiMesh& source, std::size_t node, const NodeIndex& nodes)
{
    Mesh mesh;
    mesh.name = source.mName.C_Str();
    mesh.node = node;
    mesh.colour = materialColour(scene, source.mMaterialIndex);
    copyVertices(source, mesh);
    turnNormalsOutside(mesh);
    if (source.HasBones())
        copyBones(source, nodes, mesh);
    return mesh;
}

// A mesh that several nodes use becomes a mesh for each. Walks in the order of addNodes, which
// numbered the nodes; `self` is the number of `source` and becomes that of the next node.
void addMeshes(const aiScene& scene, const aiNode& source, const NodeIndex& nodes,
               std::size_t& self, Model& model)
{
    for (unsigned i = 0; i < source.mNumMeshes; ++i) {
        const aiMesh& mesh = *scene.mMeshes[source.mMeshes[i]];
        if ((mesh.mPrimitiveTypes & aiPrimitiveType_TRIANGLE) != 0 && mesh.HasNormals())
            model.meshes.push_back(copyMesh(scene, mesh, self, nodes));
    }
    ++self;
    for (unsigned i = 0; i < source.mNumChildren; ++i)
        addMeshes(scene, *source.mChildren[i], nodes, self, model);
}

template <typename SourceKey, typename Convert>
auto copyKeys(const SourceKey* source, unsigned count, double ticksPerSecond, Convert convert)
{
    std::vector<Key<decltype(convert(source->mValue))>> keys;
    for (unsigned i = 0; i < count; ++i)
        keys.push_back({source[i].mTime / ticksPerSecond, convert(source[i].mValue)});
    return keys;
}

Animation copyAnimation(const aiAnimation& source, const NodeIndex& nodes)
{
    const double ticks =
        source.mTicksPerSecond > 0 ? source.mTicksPerSecond : kDefaultTicksPerSecond;
    Animation animation{source.mName.C_Str(), source.mDuration / ticks, {}};
    const auto vector = [](const aiVector3D& value) { return toQt(value); };
    const auto rotation = [](const aiQuaternion& value) {
        return QQuaternion(value.w, value.x, value.y, value.z).normalized();
    };
    for (unsigned i = 0; i < source.mNumChannels; ++i) {
        const aiNodeAnim& channel = *source.mChannels[i];
        const auto node = nodes.find(channel.mNodeName.C_Str());
        if (node == nodes.end())
            continue;
        animation.channels.push_back(
            {node->second, copyKeys(channel.mPositionKeys, channel.mNumPositionKeys, ticks, vector),
             copyKeys(channel.mRotationKeys, channel.mNumRotationKeys, ticks, rotation),
             copyKeys(channel.mScalingKeys, channel.mNumScalingKeys, ticks, vector)});
    }
    return animation;
}

std::optional<std::string> findModelFile(const std::string& name)
{
    const std::filesystem::path sample = std::filesystem::path(kSampleModels) / name;
    std::error_code ignored;
    if (std::filesystem::is_regular_file(name, ignored))
        return name;
    if (std::filesystem::is_regular_file(sample, ignored))
        return sample.string();
    return std::nullopt;
}

Model copyScene(const aiScene& scene)
{
    Model model;
    addNodes(*scene.mRootNode, 0, model);
    const NodeIndex nodes = indexByName(model);
    std::size_t first = 0;
    addMeshes(scene, *scene.mRootNode, nodes, first, model);
    for (unsigned i = 0; i < scene.mNumAnimations; ++i)
        model.animations.push_back(copyAnimation(*scene.mAnimations[i], nodes));
    return model;
}

} // namespace

BoneWeights normalised(const BoneWeights& weights)
{
    const float sum = std::accumulate(weights.begin(), weights.end(), 0.0f);
    if (sum <= 0)
        return {};
    BoneWeights result = weights;
    for (float& weight : result)
        weight /= sum;
    return result;
}

Result<Model> importModel(const std::string& name)
{
    const std::optional<std::string> file = findModelFile(name);
    if (!file)
        return Failure{ExitCode::kModel,
                       "there is no model file '" + name +
                           "'; give the path of a model, or the name of a sample model of the "
                           "package assimp-testmodels such as X/Testwuson.X"};

    Assimp::Importer importer;
    importer.SetPropertyInteger(AI_CONFIG_PP_LBW_MAX_WEIGHTS, static_cast<int>(kBonesPerVertex));
    const aiScene* scene = importer.ReadFile(*file, kPostProcessing);
    if (!scene || !scene->mRootNode)
        return Failure{ExitCode::kModel, "the model '" + *file + "' cannot be read (" +
                                             importer.GetErrorString() +
                                             "); give a file in a format that Assimp knows"};
    Model model = copyScene(*scene);
    if (model.meshes.empty())
        return Failure{ExitCode::kModel, "the model '" + *file +
                                             "' has no meshes with triangles; give one that has "
                                             "something to draw"};
    return model;
}

} // namespace viewer
