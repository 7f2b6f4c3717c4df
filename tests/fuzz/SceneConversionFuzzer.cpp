// Fuzzes the viewer's import without Assimp: the repair and the conversion of a scene, and what is
// computed from the model.
//
// The input describes a scene within the rules that Assimp's validation enforces: indices in range,
// a material for each mesh, triangles. Names, numbers, and the order of keys are arbitrary. The
// numbers are small, and then all results must be finite, or any bit pattern.
#include "viewer/CharacterSpace.h"
#include "viewer/DetailLevel.h"
#include "viewer/ModelImport.h"
#include "viewer/Pose.h"
#include "viewer/SceneRepair.h"

#include <algorithm>
#include <bit>
#include <cmath>
#include <cstdlib>
#include <functional>
#include <iostream>
#include <memory>
#include <numeric>
#include <string>

#include <assimp/scene.h>
#include <fuzzer/FuzzedDataProvider.h>

namespace {

constexpr unsigned kMostOfEach = 4; // nodes below a node, meshes, bones, animations, keys
constexpr unsigned kMostVertices = 12;
constexpr unsigned kMostNodes = 12;

void require(bool holds, int line = __builtin_LINE())
{
    if (holds)
        return;
    std::cerr << "The requirement in line " << line << " does not hold.\n";
    std::abort();
}

// Builds a scene from the bytes of the input. The scene owns its parts.
class SceneBuilder {
public:
    explicit SceneBuilder(FuzzedDataProvider& data)
        : fData(data), fAnyNumbers(data.ConsumeBool()), fScene(std::make_unique<aiScene>())
    {
        fill(fScene->mMaterials, fScene->mNumMaterials, 1, [this] { return material(); });
        fill(fScene->mMeshes, fScene->mNumMeshes, 1, [this] { return mesh(); });
        fScene->mRootNode = node(nullptr);
        fill(fScene->mAnimations, fScene->mNumAnimations, 0, [this] { return animation(); });
    }

    aiScene& scene() { return *fScene; }
    bool anyNumbers() const { return fAnyNumbers; }

private:
    unsigned count(unsigned least, unsigned most)
    {
        return fData.ConsumeIntegralInRange(least, most);
    }

    template <typename Part>
    static void fill(Part**& parts, unsigned& number, unsigned wanted,
                     const std::function<Part*()>& make)
    {
        if (wanted > 0) // the parts' owners leave an empty list alone
            parts = new Part*[wanted];
        for (number = 0; number < wanted; ++number)
            parts[number] = make();
    }
    template <typename Part, typename Make>
    void fill(Part**& parts, unsigned& number, unsigned least, Make make)
    {
        fill(parts, number, count(least, kMostOfEach), std::function<Part*()>(make));
    }

    float number()
    {
        if (fAnyNumbers && fData.ConsumeIntegralInRange(0, 7) == 0)
            return std::bit_cast<float>(fData.ConsumeIntegral<std::uint32_t>());
        return static_cast<float>(fData.ConsumeIntegral<std::int8_t>()) / 8.0f;
    }
    double time()
    {
        if (fAnyNumbers && fData.ConsumeIntegralInRange(0, 7) == 0)
            return std::bit_cast<double>(fData.ConsumeIntegral<std::uint64_t>());
        return static_cast<double>(fData.ConsumeIntegral<std::uint8_t>()) / 8.0;
    }
    aiVector3D vector() { return {number(), number(), number()}; }
    aiMatrix4x4 matrix()
    {
        aiMatrix4x4 result;
        if (fData.ConsumeBool())
            std::generate_n(&result.a1, 12, [this] { return number(); });
        return result;
    }
    // Few names, so that bones and channels meet nodes, several of which may have one name.
    aiString name() { return aiString(std::string(1, static_cast<char>('a' + count(0, 7)))); }

    aiMaterial* material()
    {
        auto* result = new aiMaterial;
        const aiColor3D colour(number(), number(), number());
        if (fData.ConsumeBool())
            result->AddProperty(&colour, 1, AI_MATKEY_COLOR_DIFFUSE);
        return result;
    }

    aiBone* bone(unsigned vertices)
    {
        auto* result = new aiBone;
        result->mName = name();
        result->mOffsetMatrix = matrix();
        result->mNumWeights = count(1, kMostVertices);
        result->mWeights = new aiVertexWeight[result->mNumWeights];
        for (unsigned i = 0; i < result->mNumWeights; ++i)
            result->mWeights[i] = {count(0, vertices - 1), number()};
        return result;
    }

    aiAnimMesh* morphTarget(const aiMesh& mesh)
    {
        auto* result = new aiAnimMesh;
        result->mNumVertices = fData.ConsumeBool() ? mesh.mNumVertices : count(1, kMostVertices);
        if (fData.ConsumeBool())
            result->mVertices = vectors(result->mNumVertices);
        if (fData.ConsumeBool())
            result->mNormals = vectors(result->mNumVertices);
        result->mWeight = number();
        return result;
    }

    aiMesh* mesh()
    {
        auto* result = new aiMesh;
        result->mName = name();
        result->mMaterialIndex = count(0, fScene->mNumMaterials - 1);
        result->mPrimitiveTypes =
            fData.ConsumeBool() ? aiPrimitiveType_TRIANGLE : aiPrimitiveType_LINE;
        result->mNumVertices = count(1, kMostVertices);
        result->mVertices = vectors(result->mNumVertices);
        if (fData.ConsumeBool())
            result->mNormals = vectors(result->mNumVertices);
        addFaces(*result);
        fill(result->mBones, result->mNumBones, 0, [&] { return bone(result->mNumVertices); });
        fill(result->mAnimMeshes, result->mNumAnimMeshes, 0, [&] { return morphTarget(*result); });
        return result;
    }

    aiVector3D* vectors(unsigned number)
    {
        auto* result = new aiVector3D[number];
        std::generate_n(result, number, [this] { return vector(); });
        return result;
    }

    void addFaces(aiMesh& mesh)
    {
        mesh.mNumFaces = count(1, kMostVertices);
        mesh.mFaces = new aiFace[mesh.mNumFaces];
        const unsigned corners = mesh.mPrimitiveTypes == aiPrimitiveType_TRIANGLE ? 3 : 2;
        for (unsigned i = 0; i < mesh.mNumFaces; ++i) {
            mesh.mFaces[i].mNumIndices = corners;
            mesh.mFaces[i].mIndices = new unsigned[corners];
            std::generate_n(mesh.mFaces[i].mIndices, corners,
                            [&] { return count(0, mesh.mNumVertices - 1); });
        }
    }

    aiNode* node(aiNode* parent)
    {
        auto* result = new aiNode;
        ++fNodes;
        result->mName = name();
        result->mParent = parent;
        result->mTransformation = matrix();
        result->mNumMeshes = count(0, kMostOfEach);
        result->mMeshes = new unsigned[result->mNumMeshes];
        std::generate_n(result->mMeshes, result->mNumMeshes,
                        [this] { return count(0, fScene->mNumMeshes - 1); });
        if (fNodes < kMostNodes)
            fill(result->mChildren, result->mNumChildren, 0, [&] { return node(result); });
        return result;
    }

    template <typename Key, typename Make>
    void addKeys(Key*& keys, unsigned& number, Make value)
    {
        number = count(0, kMostOfEach);
        keys = new Key[number];
        for (unsigned i = 0; i < number; ++i) {
            keys[i].mTime = time();
            keys[i].mValue = value();
        }
    }

    aiNodeAnim* channel()
    {
        auto* result = new aiNodeAnim;
        result->mNodeName = name();
        addKeys(result->mPositionKeys, result->mNumPositionKeys, [this] { return vector(); });
        addKeys(result->mRotationKeys, result->mNumRotationKeys,
                [this] { return aiQuaternion(number(), number(), number(), number()); });
        addKeys(result->mScalingKeys, result->mNumScalingKeys, [this] { return vector(); });
        return result;
    }

    aiMeshMorphAnim* morphChannel()
    {
        auto* result = new aiMeshMorphAnim;
        result->mName = name();
        result->mNumKeys = count(1, kMostOfEach);
        result->mKeys = new aiMeshMorphKey[result->mNumKeys];
        for (unsigned i = 0; i < result->mNumKeys; ++i) {
            aiMeshMorphKey& key = result->mKeys[i];
            key.mTime = time();
            key.mNumValuesAndWeights = count(1, kMostOfEach);
            key.mValues = new unsigned[key.mNumValuesAndWeights];
            key.mWeights = new double[key.mNumValuesAndWeights];
            std::generate_n(key.mValues, key.mNumValuesAndWeights, [this] {
                return fAnyNumbers ? fData.ConsumeIntegral<unsigned>() : count(0, kMostOfEach);
            });
            std::generate_n(key.mWeights, key.mNumValuesAndWeights, [this] { return time(); });
        }
        return result;
    }

    aiAnimation* animation()
    {
        auto* result = new aiAnimation;
        result->mName = name();
        result->mDuration = time();
        result->mTicksPerSecond = time();
        fill(result->mChannels, result->mNumChannels, 1, [this] { return channel(); });
        fill(result->mMorphMeshChannels, result->mNumMorphMeshChannels, 0,
             [this] { return morphChannel(); });
        return result;
    }

    FuzzedDataProvider& fData;
    const bool fAnyNumbers;
    unsigned fNodes = 0;
    std::unique_ptr<aiScene> fScene;
};

bool isFinite(const QVector3D& vector)
{
    return std::isfinite(vector.x()) && std::isfinite(vector.y()) && std::isfinite(vector.z());
}

bool isFinite(const QMatrix4x4& matrix)
{
    return std::all_of(matrix.constData(), matrix.constData() + 16,
                       [](float value) { return std::isfinite(value); });
}

// What Model.h promises of a mesh.
void requireSound(const viewer::Mesh& mesh, std::size_t nodes)
{
    const std::size_t vertices = mesh.vertexCount();
    require(mesh.node < nodes && isFinite(mesh.colour));
    require(vertices > 0 && mesh.normals.size() == vertices);
    require(!mesh.triangles.empty() && mesh.triangles.size() % 3 == 0);
    for (const std::uint32_t corner : mesh.triangles)
        require(corner < vertices);
    for (std::size_t i = 0; i < vertices; ++i) {
        require(isFinite(mesh.positions[i]));
        require(std::abs(mesh.normals[i].length() - 1) < 1e-3f);
    }
    for (const viewer::Bone& bone : mesh.bones)
        require(bone.node < nodes && isFinite(bone.offset));
    for (const viewer::MorphTarget& target : mesh.morphTargets) {
        require(target.positionDeltas.size() == vertices);
        require(target.normalDeltas.empty() || target.normalDeltas.size() == vertices);
        require(std::isfinite(target.weight));
        for (const auto* deltas : {&target.positionDeltas, &target.normalDeltas})
            for (const QVector3D& delta : *deltas)
                require(isFinite(delta));
    }
    require(mesh.boneWeights.size() == (mesh.hasBones() ? vertices : 0));
    require(mesh.boneIndices.size() == mesh.boneWeights.size());
    for (std::size_t i = 0; i < mesh.boneWeights.size(); ++i) {
        const viewer::BoneWeights& weights = mesh.boneWeights[i];
        for (const std::uint32_t bone : mesh.boneIndices[i])
            require(bone < mesh.bones.size());
        for (const float weight : weights)
            require(weight >= 0);
        require(std::abs(std::accumulate(weights.begin(), weights.end(), 0.0f) - 1) < 1e-3f);
    }
}

template <typename T>
void requireInOrder(const std::vector<viewer::Key<T>>& keys)
{
    for (const auto& key : keys)
        require(std::isfinite(key.seconds));
    require(std::is_sorted(keys.begin(), keys.end(), [](const auto& one, const auto& other) {
        return one.seconds < other.seconds;
    }));
}

void requireSound(const viewer::Model& model)
{
    const std::size_t nodes = model.nodes.size();
    for (std::size_t i = 0; i < nodes; ++i) {
        require(i == 0 ? model.nodes[i].parent == 0 : model.nodes[i].parent < i);
        require(isFinite(model.nodes[i].local));
    }
    for (const viewer::Mesh& mesh : model.meshes)
        requireSound(mesh, nodes);
    for (const viewer::Animation& animation : model.animations) {
        require(std::isfinite(animation.seconds) && animation.seconds >= 0);
        for (const viewer::Channel& channel : animation.channels) {
            require(channel.node < nodes);
            requireInOrder(channel.positions);
            requireInOrder(channel.rotations);
            requireInOrder(channel.scales);
        }
        for (const viewer::MorphChannel& channel : animation.morphChannels) {
            require(channel.node < nodes && !channel.weights.empty());
            requireInOrder(channel.weights);
            for (const auto& key : channel.weights)
                for (const float weight : key.value)
                    require(std::isfinite(weight));
        }
    }
}

// Poses over a cycle and the space that they take; finite if the scene's numbers are small.
void usePoses(const viewer::Model& model, const viewer::Animation* animation, bool small)
{
    for (const double seconds : {-1.0, 0.0, 0.3, 7.0}) {
        const viewer::Pose pose = viewer::poseAt(model, animation, seconds);
        require(!small || std::all_of(pose.begin(), pose.end(),
                                      [](const QMatrix4x4& m) { return isFinite(m); }));
    }
    const viewer::CharacterSpace space = viewer::characterSpace(model, animation);
    require(!small || isFinite(space.fromModel));
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    FuzzedDataProvider input(data, size);
    SceneBuilder builder(input);
    // The viewer refuses such files, and those without meshes.
    if (viewer::findNonFiniteNumber(builder.scene()))
        return 0;
    viewer::rescaleExtremeScene(builder.scene());
    if (viewer::findNonFiniteNumber(builder.scene()))
        return 0;
    const viewer::Model model = viewer::convertScene(builder.scene(), {});
    requireSound(model);
    if (model.meshes.empty())
        return 0;
    for (const viewer::Mesh& mesh : model.meshes)
        requireSound(viewer::coarserMesh(mesh), model.nodes.size());
    usePoses(model, nullptr, !builder.anyNumbers());
    for (const viewer::Animation& animation : model.animations)
        usePoses(model, &animation, !builder.anyNumbers());
    return 0;
}
