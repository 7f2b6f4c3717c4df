// Import of model files, levels of detail, character space, camera.
#include "viewer/model/CharacterSpace.h"
#include "viewer/model/DetailLevel.h"
#include "viewer/model/import/ImportProcess.h"
#include "viewer/model/import/ModelImport.h"
#include "viewer/model/import/ModelSerialisation.h"
#include "viewer/render/Camera.h"

#include <algorithm>
#include <cmath>
#include <filesystem>
#include <fstream>
#include <numeric>
#include <set>
#include <stdexcept>

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

void expectConsistent(const Mesh& mesh)
{
    EXPECT_EQ(mesh.normals.size(), mesh.vertexCount());
    EXPECT_THAT(mesh.triangles, Each(Lt(mesh.vertexCount())));
    EXPECT_EQ(mesh.boneWeights.size(), mesh.hasBones() ? mesh.vertexCount() : 0);
    for (const BoneWeights& weights : mesh.boneWeights)
        EXPECT_NEAR(std::accumulate(weights.begin(), weights.end(), 0.0f), 1, 1e-5);
    EXPECT_EQ(mesh.boneIndices.size(), mesh.boneWeights.size());
    EXPECT_THAT(mesh.boneIndices, Each(Each(Lt(mesh.bones.size()))));
}

TEST_P(SampleModel, ImportReturnsAllMeshesBonesAndAnimations)
{
    const Sample& expected = GetParam();
    ASSERT_EQ(fModel.meshes.size(), expected.meshes);
    EXPECT_EQ(fModel.animations.size(), expected.animations);
    EXPECT_EQ(fModel.meshes[0].bones.size(), expected.bones);
    std::size_t vertices = 0;
    for (const Mesh& mesh : fModel.meshes) {
        vertices += mesh.vertexCount();
        expectConsistent(mesh);
        const std::set<std::uint32_t> used(mesh.triangles.begin(), mesh.triangles.end());
        EXPECT_EQ(used.size(), mesh.vertexCount());
    }
    EXPECT_EQ(vertices, expected.vertices);
}

TEST_P(SampleModel, CoarserMeshHasFewerTrianglesAndConsistentData)
{
    for (const Mesh& mesh : fModel.meshes) {
        const Mesh coarse = coarserMesh(mesh);
        EXPECT_LT(coarse.vertexCount(), mesh.vertexCount());
        EXPECT_LT(coarse.triangles.size(), mesh.triangles.size());
        EXPECT_GT(coarse.triangles.size(), mesh.triangles.size() / 8); // keeps its shape
        EXPECT_EQ(coarse.hasBones(), mesh.hasBones());
        expectConsistent(coarse);
    }
}

TEST_P(SampleModel, CharacterSpaceHasFeetOnTheGroundAndLargestExtentOne)
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

// A temporary folder with model files.
class ModelFolder : public testing::Test {
protected:
    std::string path(const char* name) const { return fFolder.filePath(name).toStdString(); }

    std::string write(const char* name, const std::string& content) const
    {
        std::ofstream(path(name)) << content;
        return path(name);
    }

    // Imports a file of this content.
    Model imported(const char* name, const std::string& content,
                   const ImportSettings& settings = {}) const
    {
        const Result<Model> model = importModel(write(name, content), settings);
        return model ? model.value() : throw std::runtime_error(model.failure().text);
    }

private:
    QTemporaryDir fFolder;
};
using ModelImport = ModelFolder;
using ImportProcess = ModelFolder;

// A cube without normals, with its corners at 0 and `size`.
std::string cube(const char* size)
{
    std::string text;
    for (const char* line :
         {"v 0 0 0", "v S 0 0", "v S S 0", "v 0 S 0", "v 0 0 S", "v S 0 S", "v S S S", "v 0 S S",
          "f 4 3 2 1", "f 5 6 7 8", "f 1 2 6 5", "f 3 4 8 7", "f 2 3 7 6", "f 1 5 8 4"})
        text += line + std::string("\n");
    return QString::fromStdString(text).replace("S", size).toStdString();
}

TEST_F(ModelImport, UnusableFileFailsWithAReason)
{
    std::filesystem::create_symlink("loop.obj", path("loop.obj"));
    const std::string longWord =
        "solid a\nfacet normal 0 0 1\nouter loop\nvertex " + std::string(9999, 'x');
    const std::tuple<const char*, const char*, const char*> rows[] = {
        {"comment.obj", "# nothing\n", "cannot be read (OBJ"},
        {"points.obj", "v 0 0 0\nv 1 0 0\np 1\np 2\n", "no meshes"},
        {"text.txt", "not a model\n", "(No suitable reader"},
        {"cut.obj", "v 0 0 0\nv 1 0 0\nv 0 1 0\nf 1 2 9\n", "truncated or damaged"},
        {"long.stl", longWord.c_str(), "xxx ...); it may be truncated"},
        {"empty.obj", "", "is empty"},
        {"missing.obj", nullptr, "there is no model file"},
        {"", nullptr, "is a directory"},
        {"loop.obj", nullptr, "cannot be opened: Too many levels of symbolic links"},
    };
    for (const auto& [name, content, reason] : rows) {
        const Result<Model> model = importModel(content ? write(name, content) : path(name));
        ASSERT_FALSE(model) << name;
        EXPECT_EQ(model.failure().code, ExitCode::kModel);
        EXPECT_THAT(model.failure().text, testing::HasSubstr(reason));
    }
    EXPECT_THAT(importModel("").failure().text, testing::HasSubstr("there is no model file"));
}

// The vertices of a cube: 24 with sharp edges, 8 with smooth ones.
TEST_F(ModelImport, MissingNormalsAreSmoothUpToTheCreaseAngle)
{
    const std::tuple<const char*, double, std::size_t> rows[] = {
        {"1", 60, 24}, {"1", 120, 8}, {"0.000001", 60, 24}, {"1e20", 60, 24}};
    for (const auto& [size, creaseAngle, vertices] : rows) {
        const Mesh mesh =
            imported("cube.obj", cube(size), {std::nullopt, creaseAngle}).meshes.front();
        EXPECT_EQ(mesh.vertexCount(), vertices) << size << ' ' << creaseAngle;
        const auto [low, high] = boundsOf(mesh.normals);
        const float expected = vertices == 24 ? 1 : std::sqrt(1.0f / 3);
        EXPECT_NEAR(high.x() - low.x(), 2 * expected, 1e-5);
    }
}

TEST_F(ModelImport, ZeroNormalsAreComputedFromTriangles)
{
    const std::string triangle = "v 0 0 0\nv 1 0 0\nv 0 0 -1\nv 0 1 0\nvn 0 0 0\nvn -1 0 0\n";
    for (const char* faces : {"f 1//1 2//1 3//1\n", "f 1//1 2//1 3//1\nf 1//2 3//2 4//2\n"}) {
        const Model model = imported("zero.obj", triangle + faces);
        EXPECT_LT((model.meshes[0].normals[1] - QVector3D(0, 1, 0)).length(), 1e-5f);
    }
}

TEST_F(ModelImport, UpAxisIsRotatedToY)
{
    const char* shape = "v 0 0 0\nv 3 0 0\nv 3 0 2\nv 0 1 0\nf 1 2 3\nf 1 2 4\n";
    const std::pair<std::optional<UpAxis>, QVector3D> rows[] = {{std::nullopt, {3, 1, 2}},
                                                                {UpAxis::kX, {1, 3, 2}},
                                                                {UpAxis::kY, {3, 1, 2}},
                                                                {UpAxis::kZ, {3, 2, 1}}};
    for (const auto& [up, size] : rows) {
        ImportSettings settings;
        settings.up = up;
        const Model model = imported("up.obj", shape, settings);
        EXPECT_LT((characterSpace(model, nullptr).size - size / 3).length(), 1e-5f);
    }
}

TEST_F(ImportProcess, ImportInChildReturnsTheSameModelAsImportModel)
{
    if (!std::filesystem::exists("/usr/share/assimp/models"))
        GTEST_SKIP() << "the sample models (package assimp-testmodels) are not installed";
    const ImportChild child{VIEWER_PROGRAM, 60, [](int) { return true; }};
    const char* name = "X/BCN_Epileptic.X";
    const QByteArray expected = serialiseModel(importModel(name));
    EXPECT_EQ(serialiseModel(importInChild(child, name, {})), expected);
    ASSERT_GT(expected.size(), 100000);
    EXPECT_TRUE(deserialiseModel(expected));
    EXPECT_FALSE(deserialiseModel(expected.chopped(1)));
    const auto wrong = importInChild(child, "/dev/null", {});
    EXPECT_THAT(wrong.failure().text, testing::HasSubstr("not a regular file"));
}

TEST_F(ImportProcess, FailingChildReturnsOneSentence)
{
    const std::string file = write("cube.obj", cube("1"));
    const std::string program = path("program");
    const std::tuple<const char*, int, bool, const char*> rows[] = {
        {"kill -SEGV $$", 60, true, "makes Assimp crash (signal 11)"},
        {"echo surprise", 60, true, "makes Assimp crash (exit code 0)"},
        {"exit 3", 60, true, "makes Assimp crash (exit code 3)"},
        {"exec sleep 1000", -5, true, "takes longer than -5 s"}, // with the grace period of 5 s
        {"exit 124", 60, true, "takes longer than 60 s"},
        {"exec sleep 1000", 60, false, "interrupted"},
    };
    for (const auto& [command, timeLimit, goOn, sentence] : rows) {
        write("program", std::string("#!/bin/sh\n") + command + '\n');
        std::filesystem::permissions(program, std::filesystem::perms::owner_all);
        const bool answer = goOn;
        const auto model =
            importInChild({program, timeLimit, [answer](int) { return answer; }}, file, {});
        ASSERT_FALSE(model) << command;
        EXPECT_THAT(model.failure().text, testing::HasSubstr(sentence));
    }
    const auto model = importInChild({path("none"), 60, {}}, file, {});
    EXPECT_THAT(model.failure().text, testing::HasSubstr("the process for it does not start"));
}

// All points are in the picture and centred and nearly fill one of its dimensions; the camera is
// above the ground and below the zenith.
void expectFramed(const Camera& camera, const std::vector<QVector3D>& points)
{
    std::vector<QVector3D> inClip = points;
    for (QVector3D& point : inClip)
        point = camera.toClip().map(point);
    const auto [low, high] = boundsOf(inClip);
    EXPECT_GT(std::min({low.x(), low.y(), low.z()}), -1);
    EXPECT_LT(std::max({high.x(), high.y(), high.z()}), 1);
    EXPECT_NEAR(low.x() + high.x(), 0, 0.05);
    EXPECT_NEAR(low.y() + high.y(), 0, 0.05);
    EXPECT_GT(std::max(high.x() - low.x(), high.y() - low.y()), 1.5);
    const QVector3D eye = camera.eye();
    EXPECT_GT(eye.y(), 0);
    EXPECT_GT(std::hypot(eye.x(), eye.z()), 0.01f);
}

TEST(Camera, OrbitAndSetAspectKeepAllPointsFramed)
{
    const std::vector<QVector3D> shapes[] = {
        {{-0.3f, 0, -0.2f}, {0.3f, 1, 0.2f}, {0.3f, 0, 0.2f}}, // upright
        {{-9, 0, -9}, {9, 0.5f, 9}, {-9, 0, 9}, {9, 0, -9}},   // a wide crowd
        {{4, 2, 4}, {5, 2.5f, 4}},                             // away from the origin
        {{-0.5f, 0, 0}, {0.5f, 0, 0}, {0.5f, 0.1f, 0}},        // long
    };
    for (const std::vector<QVector3D>& shape : shapes) {
        Camera camera;
        camera.frame(shape, 16.0f / 9);
        for (const float aspect : {16.0f / 9, 1.0f, 0.5f, 0.1f}) {
            camera.setAspect(aspect);
            for (const float pitch : {0.0f, 500.0f, -500.0f}) {
                SCOPED_TRACE(testing::Message() << shape[0].x() << ' ' << aspect << ' ' << pitch);
                expectFramed(camera, shape);
                camera.orbit(70, pitch);
            }
        }
        camera.zoom(5);
        camera.pan(0.5f, 0.1f);
        camera.reset();
        expectFramed(camera, shape);
    }
}

TEST(Camera, PanMovesThePictureByFractionsOfItsHeight)
{
    const QVector3D middle(0, 0.5f, 0);
    Camera camera;
    camera.frame({{-1, 0, -1}, {1, 1, 1}, {-1, 1, 1}, {1, 0, -1}}, 2);
    camera.zoom(3);
    const QVector3D before = camera.toClip().map(middle);
    camera.pan(0.25f, 0.1f);
    const QVector3D moved = camera.toClip().map(middle) - before;
    EXPECT_NEAR(moved.x(), 0.25f, 0.02); // half a height is half of a width of 2
    EXPECT_NEAR(moved.y(), 0.2f, 0.02);
}

} // namespace
