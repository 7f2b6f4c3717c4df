// Conversion of Assimp scenes with unusual numbers that a valid file may contain.
#include "viewer/model/import/SceneConversion.h"

#include "viewer/model/Pose.h"

#include <array>
#include <cmath>
#include <limits>
#include <memory>
#include <numeric>
#include <tuple>
#include <vector>

#include <assimp/scene.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using namespace viewer;
using testing::ElementsAre;

// A triangle that a bone moves.
std::unique_ptr<aiScene> triangle()
{
    auto scene = std::make_unique<aiScene>();
    scene->mNumMaterials = scene->mNumMeshes = 1;
    scene->mMaterials = new aiMaterial* [1] { new aiMaterial };
    scene->mMeshes = new aiMesh* [1] { new aiMesh };
    scene->mRootNode = new aiNode("node");
    scene->mRootNode->mNumMeshes = 1;
    scene->mRootNode->mMeshes = new unsigned[1]{0};
    aiMesh& mesh = *scene->mMeshes[0];
    mesh.mPrimitiveTypes = aiPrimitiveType_TRIANGLE;
    mesh.mNumVertices = 3;
    mesh.mVertices = new aiVector3D[3]{{0, 0, 0}, {1, 0, 0}, {0, 1, 0}};
    mesh.mNumFaces = mesh.mNumBones = 1;
    mesh.mFaces = new aiFace[1];
    mesh.mFaces[0].mNumIndices = 3;
    mesh.mFaces[0].mIndices = new unsigned[3]{0, 1, 2};
    mesh.mBones = new aiBone* [1] { new aiBone };
    mesh.mBones[0]->mName = "node";
    return scene;
}

// A node that an animation moves along x. Each of `times`, in ticks, has a key with x = time.
std::unique_ptr<aiScene> movingNode(const std::vector<double>& times, double ticksPerSecond)
{
    auto scene = std::make_unique<aiScene>();
    scene->mRootNode = new aiNode("node");
    scene->mNumAnimations = 1;
    scene->mAnimations = new aiAnimation* [1] { new aiAnimation };
    aiAnimation& animation = *scene->mAnimations[0];
    animation.mDuration = 4;
    animation.mTicksPerSecond = ticksPerSecond;
    animation.mNumChannels = 1;
    animation.mChannels = new aiNodeAnim* [1] { new aiNodeAnim };
    aiNodeAnim& channel = *animation.mChannels[0];
    channel.mNodeName = "node";
    channel.mNumPositionKeys = static_cast<unsigned>(times.size());
    channel.mPositionKeys = new aiVectorKey[times.size()];
    for (std::size_t i = 0; i < times.size(); ++i)
        channel.mPositionKeys[i] = {times[i], aiVector3D(static_cast<float>(times[i]), 0, 0)};
    return scene;
}

TEST(SceneConversion, UnsortedKeysAreSortedByTime)
{
    const Model model = convertScene(*movingNode({4, 3, 1, 1}, 2), {});
    std::vector<float> places;
    for (const double seconds : {0.5, 1.0, 1.5, 1.75})
        places.push_back(poseAt(model, &model.animations.at(0), seconds).back()(0, 3));
    EXPECT_THAT(places, ElementsAre(1, 2, 3, 3.5f));
}

// A negative weight would turn a part of the mesh inside out; the sum of huge weights overflows
// single precision.
TEST(SceneConversion, NegativeTinyOrHugeWeightsAreNormalisedToASumOfOne)
{
    const std::tuple<std::array<float, 3>, float> rows[] = {
        {{2, -1, 0}, 1}, {{-1, 0, 0}, 1}, {{3e38f, 3e38f, 0}, 0.5f}, {{1e-45f, 0, 0}, 1}};
    for (const auto& [weights, first] : rows) {
        const auto scene = triangle();
        aiBone& bone = *scene->mMeshes[0]->mBones[0];
        bone.mNumWeights = 3;
        bone.mWeights = new aiVertexWeight[3]{{1, weights[0]}, {1, weights[1]}, {1, weights[2]}};
        const Mesh mesh = convertScene(*scene, {}).meshes.at(0);
        EXPECT_EQ(mesh.boneWeights.at(1)[0], first) << weights[0];
        for (const BoneWeights& all : mesh.boneWeights)
            EXPECT_FLOAT_EQ(std::accumulate(all.begin(), all.end(), 0.0f), 1) << weights[0];
    }
}

TEST(SceneConversion, NonFiniteColourBecomesTheDefault)
{
    const QVector3D expected = convertScene(*triangle(), {}).meshes.at(0).colour;
    for (const float number : {std::numeric_limits<float>::quiet_NaN(), HUGE_VALF}) {
        const auto scene = triangle();
        const aiColor3D colour(0, number, 1);
        scene->mMaterials[0]->AddProperty(&colour, 1, AI_MATKEY_COLOR_DIFFUSE);
        EXPECT_EQ(convertScene(*scene, {}).meshes.at(0).colour, expected);
    }
}

TEST(SceneConversion, WeightOfMissingMorphTargetIsLeftOut)
{
    const auto scene = movingNode({}, 1);
    aiAnimation& animation = *scene->mAnimations[0];
    animation.mNumMorphMeshChannels = 1;
    animation.mMorphMeshChannels = new aiMeshMorphAnim* [1] { new aiMeshMorphAnim };
    aiMeshMorphAnim& channel = *animation.mMorphMeshChannels[0];
    channel.mName = "node";
    channel.mNumKeys = 1;
    channel.mKeys = new aiMeshMorphKey[1];
    channel.mKeys[0].mNumValuesAndWeights = 1;
    channel.mKeys[0].mValues = new unsigned[1]{0xFFFFFFFF};
    channel.mKeys[0].mWeights = new double[1]{1};
    const Model model = convertScene(*scene, {});
    EXPECT_TRUE(model.animations.at(0).morphChannels.at(0).weights.at(0).value.empty());
}

TEST(SceneConversion, OverflowingDurationBecomesZero)
{
    EXPECT_EQ(convertScene(*movingNode({}, 1e-320), {}).animations.at(0).seconds, 0);
}

} // namespace
