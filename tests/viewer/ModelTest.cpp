// From files to meshes, what is derived from a mesh, and the camera that frames it.
#include "viewer/Camera.h"
#include "viewer/CharacterSpace.h"
#include "viewer/DetailLevel.h"
#include "viewer/ModelImport.h"

#include <algorithm>
#include <cmath>
#include <filesystem>
#include <fstream>
#include <numeric>
#include <set>

#include <QTemporaryDir>
#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using namespace viewer;
using testing::Each, testing::Lt;

// The corners of the box around the points, lowest and highest.
std::pair<QVector3D, QVector3D> boundsOf(const std::vector<QVector3D>& points)
{
    std::pair<QVector3D, QVector3D> bounds;
    for (int axis = 0; axis < 3; ++axis) {
        const auto along = [axis](const QVector3D& point) { return point[axis]; };
        const auto [lowest, highest] = std::ranges::minmax(points, {}, along);
        bounds.first[axis] = lowest[axis];
        bounds.second[axis] = highest[axis];
    }
    return bounds;
}

struct Sample {
    const char* name;
    std::size_t meshes;
    std::size_t vertices;
    std::size_t bones; // of the first mesh
    std::size_t animations;
};

class SampleModel : public testing::TestWithParam<Sample> {
protected:
    void SetUp() override
    {
        if (!std::filesystem::exists("/usr/share/assimp/models"))
            GTEST_SKIP() << "the sample models (package assimp-testmodels) are not installed";
        Result<Model> model = importModel(GetParam().name);
        ASSERT_TRUE(model) << model.failure().text;
        fModel = std::move(model.value());
    }

    Model fModel;
};

TEST_P(SampleModel, IsReadWholeWithWeightsThatAddUpToOne)
{
    const Sample& expected = GetParam();
    ASSERT_EQ(fModel.meshes.size(), expected.meshes);
    EXPECT_EQ(fModel.animations.size(), expected.animations);
    EXPECT_EQ(fModel.meshes[0].bones.size(), expected.bones);
    std::size_t vertices = 0;
    for (const Mesh& mesh : fModel.meshes) {
        vertices += mesh.vertexCount();
        EXPECT_EQ(mesh.normals.size(), mesh.vertexCount());
        const std::set<std::uint32_t> drawn(mesh.triangles.begin(), mesh.triangles.end());
        EXPECT_EQ(drawn.size(), mesh.vertexCount());
        EXPECT_EQ(mesh.boneWeights.size(), mesh.hasBones() ? mesh.vertexCount() : 0);
        for (const BoneWeights& weights : mesh.boneWeights)
            EXPECT_NEAR(std::accumulate(weights.begin(), weights.end(), 0.0f), 1, 1e-5);
        EXPECT_EQ(mesh.boneIndices.size(), mesh.boneWeights.size());
        EXPECT_THAT(mesh.boneIndices, Each(Each(Lt(mesh.bones.size()))));
    }
    EXPECT_EQ(vertices, expected.vertices);
}

TEST_P(SampleModel, ACoarserLevelIsSmallerAndWhole)
{
    for (const Mesh& mesh : fModel.meshes) {
        const Mesh coarse = coarserMesh(mesh);
        EXPECT_LT(coarse.vertexCount(), mesh.vertexCount());
        EXPECT_LT(coarse.triangles.size(), mesh.triangles.size());
        EXPECT_GT(coarse.triangles.size(), mesh.triangles.size() / 8); // still a shape
        EXPECT_EQ(coarse.normals.size(), coarse.vertexCount());
        EXPECT_EQ(coarse.boneWeights.size(), mesh.hasBones() ? coarse.vertexCount() : 0);
        EXPECT_EQ(coarse.boneIndices.size(), coarse.boneWeights.size());
        EXPECT_THAT(coarse.triangles, Each(Lt(coarse.vertexCount())));
    }
}

TEST_P(SampleModel, StandsOnTheGroundWithItsLargestExtentOne)
{
    const Animation* animation = fModel.animations.empty() ? nullptr : &fModel.animations[0];
    const auto [lowest, highest] = boundsOf(characterSpace(fModel, animation).outline);
    const QVector3D size = highest - lowest;
    EXPECT_NEAR(std::max({size.x(), size.y(), size.z()}), 1, 1e-4);
    EXPECT_NEAR(lowest.y(), 0, 1e-4);
    EXPECT_NEAR(lowest.x() + highest.x(), 0, 1e-4);
    EXPECT_NEAR(lowest.z() + highest.z(), 0, 1e-4);
}

INSTANTIATE_TEST_SUITE_P(All, SampleModel,
                         testing::Values(Sample{"X/Testwuson.X", 1, 3205, 37, 3},
                                         Sample{"X/BCN_Epileptic.X", 3, 3014, 24, 1},
                                         Sample{"FBX/animation_with_skeleton.fbx", 1, 2464, 13, 1},
                                         Sample{"OBJ/WusonOBJ.obj", 1, 2117, 0, 0}),
                         [](const auto& sample) { return "Model" + std::to_string(sample.index); });

TEST(ModelImport, WeightsAreScaledToAddUpToOne)
{
    const std::pair<BoneWeights, BoneWeights> rows[] = {
        {{0.5f, 0.5f, 0, 0}, {0.5f, 0.5f, 0, 0}},
        {{1, 1, 1, 1}, {0.25f, 0.25f, 0.25f, 0.25f}},
        {{0.1f, 0, 0, 0}, {1, 0, 0, 0}},
        {{0, 0, 0, 0}, {0, 0, 0, 0}}};
    for (const auto& [weights, expected] : rows)
        EXPECT_EQ(normalised(weights), expected);
}

TEST(ModelImport, SaysWhyAFileIsNoModel)
{
    const QTemporaryDir folder;
    const std::tuple<const char*, const char*, const char*> rows[] = {
        {"empty.obj", "# nothing\n", "cannot be read"},
        {"points.obj", "v 0 0 0\nv 1 0 0\np 1\np 2\n", "no meshes"},
        {"text.txt", "not a model\n", "cannot be read"},
        {"missing.obj", nullptr, "there is no model file"},
        {"", nullptr, "there is no model file"},
    };
    for (const auto& [name, content, says] : rows) {
        const std::string file = folder.filePath(name).toStdString();
        if (content)
            std::ofstream(file) << content;
        const Result<Model> model = importModel(file);
        ASSERT_FALSE(model) << name;
        EXPECT_EQ(model.failure().code, ExitCode::kModel);
        EXPECT_THAT(model.failure().text, testing::HasSubstr(says));
    }
}

TEST(Camera, FramesAllPointsAsLargeAsThePictureAllows)
{
    const std::vector<QVector3D> shapes[] = {
        {{-0.3f, 0, -0.2f}, {0.3f, 1, 0.2f}, {0.3f, 0, 0.2f}}, // upright
        {{-9, 0, -9}, {9, 0.5f, 9}, {-9, 0, 9}, {9, 0, -9}},   // a wide crowd
        {{4, 2, 4}, {5, 2.5f, 4}},                             // away from the origin
    };
    for (const std::vector<QVector3D>& shape : shapes) {
        for (const float aspect : {16.0f / 9, 1.0f, 0.5f}) {
            SCOPED_TRACE(testing::Message() << shape[0].x() << " aspect " << aspect);
            Camera camera;
            camera.frame(shape, aspect);
            std::vector<QVector3D> inClip = shape;
            for (QVector3D& point : inClip)
                point = camera.toClip().map(point);
            const auto [low, high] = boundsOf(inClip);
            EXPECT_GT(std::min(low.x(), low.y()), -1);
            EXPECT_LT(std::max(high.x(), high.y()), 1);
            // Centred, and one of the sides is nearly filled.
            EXPECT_NEAR(low.x() + high.x(), 0, 0.05);
            EXPECT_NEAR(low.y() + high.y(), 0, 0.05);
            EXPECT_GT(std::max(high.x() - low.x(), high.y() - low.y()), 1.6);
        }
    }
}

TEST(Camera, StaysAboveTheGround)
{
    Camera camera;
    camera.frame({{-1, 0, -1}, {1, 1, 1}}, 1);
    camera.orbit(0, -500);
    EXPECT_GT(camera.eye().y(), 0);
    camera.orbit(0, 500);
    EXPECT_GT(std::hypot(camera.eye().x(), camera.eye().z()), 0.1f);
}

} // namespace
