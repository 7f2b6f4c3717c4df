#include "viewer/model/import/ModelImport.h"

#include "viewer/model/import/MeshNormals.h"
#include "viewer/model/import/ModelFile.h"
#include "viewer/model/import/SceneRepair.h"

#include <algorithm>
#include <cctype>
#include <cmath>
#include <cstring>
#include <map>
#include <new>
#include <numeric>
#include <optional>

#include <assimp/Importer.hpp>
#include <assimp/config.h>
#include <assimp/postprocess.h>
#include <assimp/scene.h>

namespace viewer {
namespace {

// For files that do not say how long a tick of their animation is; Assimp's documentation names it.
constexpr double kDefaultTicksPerSecond = 25.0;
// A light clay, for materials without a colour of their own.
const QVector3D kDefaultColour(0.76f, 0.57f, 0.43f);
// Greys are what exporters write when the colour comes from a texture.
constexpr float kLeastColour = 0.05f;

// Formats whose z axis points up by definition and that Assimp leaves as they are, by the beginning
// of what its metadata call them.
constexpr const char* kFormatsWithZUp[] = {"Blender 3D", "3mf"};

constexpr unsigned kPostProcessing = aiProcess_JoinIdenticalVertices | aiProcess_Triangulate |
                                     aiProcess_LimitBoneWeights | aiProcess_SortByPType;

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
    if (brightest - darkest < kLeastColour || !std::isfinite(colour.r + colour.g + colour.b))
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

// Puts a weight into the first free place of its vertex. A negative one counts as none.
void addInfluence(Mesh& mesh, std::size_t vertex, std::uint32_t bone, float weight)
{
    if (weight <= 0)
        return;
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

// Normals of the file and differences may be infinite or not a number.
float finiteOrZero(float number)
{
    return std::isfinite(number) ? number : 0.0f;
}

QVector3D finiteOrZero(const aiVector3D& vector)
{
    return {finiteOrZero(vector.x), finiteOrZero(vector.y), finiteOrZero(vector.z)};
}

// Assimp's targets hold whole positions and normals.
void copyMorphTargets(const aiMesh& source, Mesh& mesh)
{
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

Mesh copyMesh(const aiScene& scene, const aiMesh& source, std::size_t node, const NodeIndex& nodes,
              double creaseAngle)
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
    turnNormalsOutside(mesh);
    return mesh;
}

// A mesh that several nodes use becomes a mesh for each. Walks in the order of addNodes, which
// numbered the nodes; `self` is the number of `source` and becomes that of the next node.
void addMeshes(const aiScene& scene, const aiNode& source, const NodeIndex& nodes,
               double creaseAngle, std::size_t& self, Model& model)
{
    for (unsigned i = 0; i < source.mNumMeshes; ++i) {
        const aiMesh& mesh = *scene.mMeshes[source.mMeshes[i]];
        if ((mesh.mPrimitiveTypes & aiPrimitiveType_TRIANGLE) != 0)
            model.meshes.push_back(copyMesh(scene, mesh, self, nodes, creaseAngle));
    }
    ++self;
    for (unsigned i = 0; i < source.mNumChildren; ++i)
        addMeshes(scene, *source.mChildren[i], nodes, creaseAngle, self, model);
}

// Assimp only warns about keys in another order. A time may overflow.
template <typename Keys>
Keys inOrderOfTime(Keys keys)
{
    std::erase_if(keys, [](const auto& key) { return !std::isfinite(key.seconds); });
    std::stable_sort(keys.begin(), keys.end(),
                     [](const auto& a, const auto& b) { return a.seconds < b.seconds; });
    return keys;
}

template <typename SourceKey, typename Convert>
auto copyKeys(const SourceKey* source, unsigned count, double ticksPerSecond, Convert convert)
{
    std::vector<Key<decltype(convert(source->mValue))>> keys;
    for (unsigned i = 0; i < count; ++i)
        keys.push_back({source[i].mTime / ticksPerSecond, convert(source[i].mValue)});
    return inOrderOfTime(std::move(keys));
}

// Weights of targets that no mesh has are left out; their numbers may be arbitrarily large.
MorphChannel copyMorphChannel(const aiMeshMorphAnim& source, std::size_t node, double ticks,
                              std::size_t targets)
{
    MorphChannel channel{node, {}};
    for (unsigned i = 0; i < source.mNumKeys; ++i) {
        const aiMeshMorphKey& key = source.mKeys[i];
        std::vector<float> weights;
        for (unsigned value = 0; value < key.mNumValuesAndWeights; ++value) {
            const std::size_t target = key.mValues[value];
            if (target >= targets)
                continue;
            if (target >= weights.size())
                weights.resize(target + 1);
            weights[target] = finiteOrZero(static_cast<float>(key.mWeights[value]));
        }
        channel.weights.push_back({key.mTime / ticks, std::move(weights)});
    }
    channel.weights = inOrderOfTime(std::move(channel.weights));
    return channel;
}

Animation copyAnimation(const aiAnimation& source, const NodeIndex& nodes, std::size_t targets)
{
    const double ticks =
        source.mTicksPerSecond > 0 ? source.mTicksPerSecond : kDefaultTicksPerSecond;
    const double seconds = source.mDuration / ticks;
    Animation animation{
        source.mName.C_Str(), std::isfinite(seconds) ? std::max(seconds, 0.0) : 0, {}};
    const auto vector = [](const aiVector3D& value) { return toQt(value); };
    const auto rotation = [](const aiQuaternion& value) {
        const QQuaternion quaternion(value.w, value.x, value.y, value.z);
        return quaternion.isNull() ? QQuaternion() : quaternion.normalized();
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
    for (unsigned i = 0; i < source.mNumMorphMeshChannels; ++i) {
        const aiMeshMorphAnim& channel = *source.mMorphMeshChannels[i];
        const auto node = nodes.find(channel.mName.C_Str());
        if (node == nodes.end())
            continue;
        MorphChannel copy = copyMorphChannel(channel, node->second, ticks, targets);
        if (!copy.weights.empty())
            animation.morphChannels.push_back(std::move(copy));
    }
    return animation;
}

// The rotation that makes the y axis point up.
QMatrix4x4 upright(UpAxis up, bool downwards)
{
    QMatrix4x4 rotation;
    if (up == UpAxis::kX)
        rotation.rotate(downwards ? -90 : 90, 0, 0, 1);
    else if (up == UpAxis::kZ)
        rotation.rotate(downwards ? 90 : -90, 1, 0, 0);
    else
        rotation.rotate(downwards ? 180 : 0, 1, 0, 0);
    return rotation;
}

// Whether two matrices turn in the same way; importers round.
bool sameRotation(const QMatrix4x4& a, const QMatrix4x4& b)
{
    constexpr float kTolerance = 1e-5f;
    const QMatrix4x4 difference = a - b;
    for (int row = 0; row < 3; ++row) {
        if (difference.row(row).toVector3D().length() > kTolerance)
            return false;
    }
    return true;
}

// The axis that the file's metadata or its format names.
QMatrix4x4 uprightByFile(const aiMetadata& metadata)
{
    aiString format;
    if (metadata.Get("SourceAsset_Format", format)) {
        for (const char* known : kFormatsWithZUp) {
            if (std::strncmp(format.C_Str(), known, std::strlen(known)) == 0)
                return upright(UpAxis::kZ, false);
        }
    }
    int axis = 0;
    int sign = 1;
    if (!metadata.Get("UpAxis", axis) || axis < 0 || axis > static_cast<int>(UpAxis::kZ))
        return {};
    metadata.Get("UpAxisSign", sign);
    return upright(static_cast<UpAxis>(axis), sign < 0);
}

// Importers that stand a model upright by themselves turn its root.
QMatrix4x4 upright(const aiScene& scene, const ImportSettings& settings)
{
    const QMatrix4x4 root = toQt(scene.mRootNode->mTransformation);
    const QMatrix4x4 fromZ = upright(UpAxis::kZ, false);
    if (settings.up) {
        const QMatrix4x4 rotation = upright(*settings.up, false);
        return sameRotation(root, fromZ) ? rotation * fromZ.transposed() : rotation;
    }
    const bool untouched = sameRotation(root, QMatrix4x4());
    return untouched && scene.mMetaData ? uprightByFile(*scene.mMetaData) : QMatrix4x4();
}

bool hasArea(const Mesh& mesh)
{
    for (std::size_t i = 0; i + 2 < mesh.triangles.size(); i += 3) {
        const QVector3D& a = mesh.positions[mesh.triangles[i]];
        const QVector3D& b = mesh.positions[mesh.triangles[i + 1]];
        const QVector3D& c = mesh.positions[mesh.triangles[i + 2]];
        if (!QVector3D::crossProduct(b - a, c - a).isNull())
            return true;
    }
    return false;
}

Failure failure(const std::string& file, const std::string& text)
{
    return {ExitCode::kModel, "the model '" + file + "' " + text};
}

// Assimp's reason on one line. It may quote all that is left of the file.
std::string reasonOf(const Assimp::Importer& importer)
{
    constexpr std::size_t kLongestReason = 200;
    std::string reason = importer.GetErrorString();
    std::replace_if(
        reason.begin(), reason.end(), [](unsigned char letter) { return std::iscntrl(letter); },
        ' ');
    while (!reason.empty() && (reason.back() == ' ' || reason.back() == '.'))
        reason.pop_back();
    if (reason.size() > kLongestReason)
        reason = reason.substr(0, kLongestReason) + " ...";
    return reason.empty() ? "Assimp names no reason" : reason;
}

// Memory that ran out is not the file's fault, or cannot be told from it.
void throwIfMemoryRanOut(const Assimp::Importer& importer)
{
    if (!importer.GetException())
        return;
    try {
        std::rethrow_exception(importer.GetException());
    } catch (const std::bad_alloc&) {
        throw;
    } catch (...) { // NOLINT(bugprone-empty-catch): the error string has its text
    }
}

Failure unreadable(const std::string& file, const Assimp::Importer& importer)
{
    throwIfMemoryRanOut(importer);
    return failure(file, "cannot be read (" + reasonOf(importer) +
                             "); it may be truncated or damaged, or in a format that Assimp does "
                             "not support: export it again, best as glTF");
}

Result<Model> readModel(Assimp::Importer& importer, const std::string& file,
                        const ImportSettings& settings)
{
    importer.SetPropertyInteger(AI_CONFIG_PP_LBW_MAX_WEIGHTS, static_cast<int>(kBonesPerVertex));
    const aiScene* scene = importer.ReadFile(file, aiProcess_ValidateDataStructure);
    if (!scene || !scene->mRootNode)
        return unreadable(file, importer);
    if (const auto found = findNonFiniteNumber(*scene))
        return failure(file, "has a number that is infinite or not a number: " + *found +
                                 "; correct it in the program that made the file");
    // The importer owns the scene and lends it unchangeable; post-processing changes it all the
    // same.
    auto& changeable = const_cast<aiScene&>(*scene);
    rescaleExtremeScene(changeable);
    if (const auto found = findNonFiniteNumber(*scene))
        return failure(file, "has numbers that are too far apart: scaled to a usual size, " +
                                 *found + "; correct it in the program that made the file");
    scene = importer.ApplyPostProcessing(kPostProcessing);
    if (!scene)
        return unreadable(file, importer);
    return convertScene(*scene, settings);
}

} // namespace

// The root of the nodes stands the model upright; the file's nodes are below it.
Model convertScene(const aiScene& scene, const ImportSettings& settings)
{
    Model model;
    model.nodes.push_back({"vyra-viewer upright", 0, upright(scene, settings)});
    addNodes(*scene.mRootNode, 0, model);
    const NodeIndex nodes = indexByName(model);
    std::size_t first = 1;
    addMeshes(scene, *scene.mRootNode, nodes, settings.creaseAngle, first, model);
    std::size_t targets = 0;
    for (const Mesh& mesh : model.meshes)
        targets = std::max(targets, mesh.morphTargets.size());
    for (unsigned i = 0; i < scene.mNumAnimations; ++i)
        model.animations.push_back(copyAnimation(*scene.mAnimations[i], nodes, targets));
    return model;
}

BoneWeights normalised(const BoneWeights& weights)
{
    // In double precision, which the sum of large weights does not overflow.
    const double sum = std::accumulate(weights.begin(), weights.end(), 0.0);
    if (sum <= 0)
        return {};
    BoneWeights result = weights;
    for (float& weight : result)
        weight = static_cast<float>(weight / sum);
    return result;
}

Result<Model> importModel(const std::string& name, const ImportSettings& settings)
{
    const Result<std::string> file = findModelFile(name);
    if (!file)
        return file.failure();
    Assimp::Importer importer;
    Result<Model> model = readModel(importer, file.value(), settings);
    if (!model)
        return model;
    const std::vector<Mesh>& meshes = model.value().meshes;
    if (meshes.empty())
        return failure(file.value(), "has no meshes with triangles; give one that has something to "
                                     "draw");
    if (std::none_of(meshes.begin(), meshes.end(), hasArea))
        return failure(file.value(), "has no triangle with an area: all corners of each are on one "
                                     "point or line; give one that has something to draw");
    return model;
}

} // namespace viewer
