// From files to meshes, and what is derived from a mesh.
#include "viewer/CharacterSpace.h"
#include "viewer/DetailLevel.h"
#include "viewer/ModelImport.h"

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <numeric>

#include <gtest/gtest.h>

namespace {

using namespace viewer;

std::optional<Model> sampleModel(const std::string& name)
{
    Result<Model> model = importModel(name);
    return model ? std::optional<Model>(std::move(model.value())) : std::nullopt;
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
        std::optional<Model> model = sampleModel(GetParam().name);
        ASSERT_TRUE(model.has_value());
        fModel = std::move(*model);
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
        ASSERT_EQ(mesh.normals.size(), mesh.vertexCount());
        ASSERT_EQ(mesh.boneWeights.size(), mesh.hasBones() ? mesh.vertexCount() : 0);
        for (std::size_t i = 0; i < mesh.boneWeights.size(); ++i) {
            const BoneWeights& weights = mesh.boneWeights[i];
            EXPECT_NEAR(std::accumulate(weights.begin(), weights.end(), 0.0f), 1, 1e-5);
            for (const std::uint32_t bone : mesh.boneIndices[i])
                ASSERT_LT(bone, mesh.bones.size());
        }
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
        EXPECT_LT(*std::max_element(coarse.triangles.begin(), coarse.triangles.end()),
                  coarse.vertexCount());
    }
}

TEST_P(SampleModel, StandsOnTheGroundWithItsLargestExtentOne)
{
    const Animation* animation = fModel.animations.empty() ? nullptr : &fModel.animations[0];
    const CharacterSpace space = characterSpace(fModel, animation);
    QVector3D lowest = space.outline.front();
    QVector3D highest = lowest;
    for (const QVector3D& point : space.outline) {
        for (int axis = 0; axis < 3; ++axis) {
            lowest[axis] = std::min(lowest[axis], point[axis]);
            highest[axis] = std::max(highest[axis], point[axis]);
        }
    }
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
    const struct {
        BoneWeights weights;
        BoneWeights expected;
    } rows[] = {
        {{0.5f, 0.5f, 0, 0}, {0.5f, 0.5f, 0, 0}},
        {{1, 1, 1, 1}, {0.25f, 0.25f, 0.25f, 0.25f}},
        {{0.1f, 0, 0, 0}, {1, 0, 0, 0}},
        {{0, 0, 0, 0}, {0, 0, 0, 0}},
    };
    for (const auto& row : rows)
        EXPECT_EQ(normalised(row.weights), row.expected);
}

TEST(ModelImport, SaysWhyAFileIsNoModel)
{
    const std::filesystem::path folder = std::filesystem::path(testing::TempDir()) / "vyra-models";
    std::filesystem::create_directories(folder);
    std::ofstream(folder / "empty.obj") << "# nothing\n";
    std::ofstream(folder / "points.obj") << "v 0 0 0\nv 1 0 0\np 1\np 2\n";
    std::ofstream(folder / "text.txt") << "not a model\n";
    const struct {
        const char* file;
        const char* says;
    } rows[] = {{"missing.obj", "there is no model file"},
                {"empty.obj", "cannot be read"},
                {"points.obj", "no meshes"},
                {"text.txt", "cannot be read"},
                {"", "there is no model file"}};
    for (const auto& row : rows) {
        SCOPED_TRACE(row.file);
        const Result<Model> model = importModel((folder / row.file).string());
        ASSERT_FALSE(model);
        EXPECT_EQ(model.failure().code, ExitCode::kModel);
        EXPECT_NE(model.failure().text.find(row.says), std::string::npos) << model.failure().text;
    }
}

} // namespace
