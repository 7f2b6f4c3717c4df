// Fuzzes the viewer's import without Assimp: repair and conversion of a scene, levels of detail,
// poses and character space.
//
// The input describes a scene that Assimp's validation accepts: indices in range, a material for
// each mesh, triangles. Names, numbers, and the order of keys are arbitrary. Numbers are either
// small, and then all results must be finite, or have any bit pattern.
#include "Require.h"
#include "viewer/model/CharacterSpace.h"
#include "viewer/model/DetailLevel.h"
#include "viewer/model/Pose.h"
#include "viewer/model/import/SceneConversion.h"
#include "viewer/model/import/SceneRepair.h"

#include <algorithm>
#include <bit>
#include <cmath>
#include <memory>
#include <numeric>
#include <string>

#include <assimp/scene.h>
#include <fuzzer/FuzzedDataProvider.h>

namespace {

constexpr unsigned kMostOfEach = 4; // nodes below a node, meshes, bones, animations, keys
constexpr unsigned kMostVertices = 12;
constexpr unsigned kMostNodes = 12;

// Builds a scene from the bytes of the input. The scene owns its parts.
class SceneBuilder {
public:
    explicit SceneBuilder(FuzzedDataProvider& data) : fData(data), fAnyNumbers(data.ConsumeBool())
    {
        fill(fScene->mMaterials, fScene->mNumMaterials, 1, [this] { return material(); });
        fill(fScene->mMeshes, fScene->mNumMeshes, 1, [this] { return mesh(); });
        fScene->mRootNode = node(nullptr);
        fill(fScene->mAnimations, fScene->mNumAnimations, 0, [this] { return animation(); });
    }

    aiScene& scene() { return *fScene; }
    bool anyNumbers() const { return fAnyNumbers; }

private:
    bool maybe() { return fData.ConsumeBool(); }
    unsigned count(unsigned least, unsigned most)
    {
        return fData.ConsumeIntegralInRange(least, most);
    }

    template <typename T, typename Make>
    static void makeArray(T*& parts, unsigned number, Make make)
    {
        if (number > 0) // the owners do not delete empty lists
            parts = new T[number];
        std::generate_n(parts, number, make);
    }
    template <typename T, typename Make>
    void fill(T*& parts, unsigned& number, unsigned least, Make make)
    {
        number = count(least, kMostOfEach);
        makeArray(parts, number, make);
    }

    // Returns any bit pattern, or eighths of a `Small`. Floats take 32 bits of the input, times 64.
    template <typename Float, typename Bits, typename Small>
    Float anyOrSmall()
    {
        if (fAnyNumbers && count(0, 7) == 0)
            return std::bit_cast<Float>(fData.ConsumeIntegral<Bits>());
        return static_cast<Float>(fData.ConsumeIntegral<Small>()) / 8;
    }
    float number() { return anyOrSmall<float, std::uint32_t, std::int8_t>(); }
    double time() { return anyOrSmall<double, std::uint64_t, std::uint8_t>(); }
    aiVector3D vector() { return {number(), number(), number()}; }
    aiQuaternion rotation() { return {number(), number(), number(), number()}; }
    aiMatrix4x4 matrix()
    {
        aiMatrix4x4 result;
        if (maybe())
            std::generate_n(&result.a1, 12, [this] { return number(); });
        return result;
    }
    void maybeVectors(aiVector3D*& vectors, unsigned number)
    {
        if (maybe())
            makeArray(vectors, number, [this] { return vector(); });
    }

    // Few names, so that bones and channels refer to nodes, and several nodes may share a name.
    aiString name() { return aiString(std::string(1, static_cast<char>('a' + count(0, 7)))); }

    aiMaterial* material()
    {
        auto* result = new aiMaterial;
        const aiColor3D colour(number(), number(), number());
        if (maybe())
            result->AddProperty(&colour, 1, AI_MATKEY_COLOR_DIFFUSE);
        return result;
    }

    aiBone* bone(unsigned vertices)
    {
        auto* result = new aiBone;
        result->mName = name();
        result->mOffsetMatrix = matrix();
        result->mNumWeights = count(1, kMostVertices);
        makeArray(result->mWeights, result->mNumWeights, [&] {
            return aiVertexWeight{count(0, vertices - 1), number()};
        });
        return result;
    }

    aiAnimMesh* morphTarget(const aiMesh& mesh)
    {
        auto* result = new aiAnimMesh;
        result->mNumVertices = maybe() ? mesh.mNumVertices : count(1, kMostVertices);
        maybeVectors(result->mVertices, result->mNumVertices);
        maybeVectors(result->mNormals, result->mNumVertices);
        result->mWeight = number();
        return result;
    }

    aiMesh* mesh()
    {
        auto* result = new aiMesh;
        result->mName = name();
        result->mMaterialIndex = count(0, fScene->mNumMaterials - 1);
        result->mPrimitiveTypes = maybe() ? aiPrimitiveType_TRIANGLE : aiPrimitiveType_LINE;
        const unsigned vertices = result->mNumVertices = count(1, kMostVertices);
        makeArray(result->mVertices, vertices, [this] { return vector(); });
        maybeVectors(result->mNormals, vertices);
        result->mNumFaces = count(1, kMostVertices);
        makeArray(result->mFaces, result->mNumFaces, [&] {
            aiFace face;
            face.mNumIndices = result->mPrimitiveTypes == aiPrimitiveType_TRIANGLE ? 3 : 2;
            makeArray(face.mIndices, face.mNumIndices, [&] { return count(0, vertices - 1); });
            return face;
        });
        fill(result->mBones, result->mNumBones, 0, [&] { return bone(vertices); });
        fill(result->mAnimMeshes, result->mNumAnimMeshes, 0, [&] { return morphTarget(*result); });
        return result;
    }

    aiNode* node(aiNode* parent)
    {
        auto* result = new aiNode;
        ++fNodes;
        result->mName = name();
        result->mParent = parent;
        result->mTransformation = matrix();
        fill(result->mMeshes, result->mNumMeshes, 0,
             [this] { return count(0, fScene->mNumMeshes - 1); });
        if (fNodes < kMostNodes)
            fill(result->mChildren, result->mNumChildren, 0, [&] { return node(result); });
        return result;
    }

    aiNodeAnim* channel()
    {
        const auto vectorKey = [this] { return aiVectorKey{time(), vector()}; };
        auto* result = new aiNodeAnim;
        result->mNodeName = name();
        fill(result->mPositionKeys, result->mNumPositionKeys, 0, vectorKey);
        fill(result->mRotationKeys, result->mNumRotationKeys, 0, [this] {
            return aiQuatKey{time(), rotation()};
        });
        fill(result->mScalingKeys, result->mNumScalingKeys, 0, vectorKey);
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
            fill(key.mValues, key.mNumValuesAndWeights, 1, [this] {
                return fAnyNumbers ? fData.ConsumeIntegral<unsigned>() : count(0, kMostOfEach);
            });
            makeArray(key.mWeights, key.mNumValuesAndWeights, [this] { return time(); });
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
    std::unique_ptr<aiScene> fScene = std::make_unique<aiScene>();
};

bool isFinite(float number)
{
    return std::isfinite(number);
}
bool isFinite(const QVector3D& vector)
{
    return isFinite(vector.x()) && isFinite(vector.y()) && isFinite(vector.z());
}
bool isFinite(const QMatrix4x4& matrix)
{
    return std::all_of(matrix.constData(), matrix.constData() + 16,
                       [](float value) { return isFinite(value); });
}
template <typename T>
bool isFinite(const std::vector<T>& list)
{
    return std::ranges::all_of(list, [](const T& each) { return isFinite(each); });
}

// Requires the guarantees of Model.h for a mesh.
void requireSound(const viewer::Mesh& mesh, std::size_t nodes)
{
    const std::size_t vertices = mesh.vertexCount();
    const auto areBelow = [](const auto& indices, std::size_t end) {
        return std::ranges::all_of(indices, [end](std::uint32_t index) { return index < end; });
    };
    require(mesh.node < nodes && isFinite(mesh.colour));
    require(vertices > 0 && mesh.normals.size() == vertices && isFinite(mesh.positions));
    require(!mesh.triangles.empty() && mesh.triangles.size() % 3 == 0);
    require(areBelow(mesh.triangles, vertices));
    for (const QVector3D& normal : mesh.normals)
        require(std::abs(normal.length() - 1) < 1e-3f);
    for (const viewer::Bone& bone : mesh.bones)
        require(bone.node < nodes && isFinite(bone.offset));
    for (const viewer::MorphTarget& target : mesh.morphTargets) {
        require(target.positionDeltas.size() == vertices);
        require(target.normalDeltas.empty() || target.normalDeltas.size() == vertices);
        require(isFinite(target.weight) && isFinite(target.positionDeltas));
        require(isFinite(target.normalDeltas));
    }
    require(mesh.boneWeights.size() == (mesh.hasBones() ? vertices : 0));
    require(mesh.boneIndices.size() == mesh.boneWeights.size());
    for (const auto& indices : mesh.boneIndices)
        require(areBelow(indices, mesh.bones.size()));
    for (const viewer::BoneWeights& weights : mesh.boneWeights) {
        require(std::ranges::min(weights) >= 0);
        require(std::abs(std::accumulate(weights.begin(), weights.end(), 0.0f) - 1) < 1e-3f);
    }
}

template <typename T>
void requireInOrder(const std::vector<viewer::Key<T>>& keys)
{
    for (const auto& key : keys)
        require(std::isfinite(key.seconds));
    require(std::ranges::is_sorted(keys, {}, &viewer::Key<T>::seconds));
}

void requireSound(const viewer::Model& model)
{
    const std::size_t nodes = model.nodes.size();
    for (std::size_t i = 0; i < nodes; ++i)
        require(model.nodes[i].parent < std::max<std::size_t>(i, 1) &&
                isFinite(model.nodes[i].local));
    for (const viewer::Mesh& mesh : model.meshes) {
        requireSound(mesh, nodes);
        requireSound(viewer::coarserMesh(mesh), nodes);
    }
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
                require(isFinite(key.value));
        }
    }
}

// Computes poses over a cycle and the character space. They are finite if the numbers are small.
void usePoses(const viewer::Model& model, const viewer::Animation* animation, bool small)
{
    for (const double seconds : {-1.0, 0.0, 0.3, 7.0})
        require(isFinite(viewer::poseAt(model, animation, seconds)) || !small);
    require(isFinite(viewer::characterSpace(model, animation).fromModel) || !small);
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    FuzzedDataProvider input(data, size);
    SceneBuilder builder(input);
    // The viewer rejects such files, and files without meshes.
    if (viewer::findNonFiniteNumber(builder.scene()))
        return 0;
    viewer::rescaleExtremeScene(builder.scene());
    if (viewer::findNonFiniteNumber(builder.scene()))
        return 0;
    const viewer::Model model = viewer::convertScene(builder.scene(), {});
    requireSound(model);
    if (model.meshes.empty())
        return 0;
    usePoses(model, nullptr, !builder.anyNumbers());
    for (const viewer::Animation& animation : model.animations)
        usePoses(model, &animation, !builder.anyNumbers());
    return 0;
}
