// Small decisions of the viewer: vendor, platform, framing, figures.
#include "viewer/Camera.h"
#include "viewer/GraphicsVendor.h"
#include "viewer/OpenCLPlatforms.h"
#include "viewer/Report.h"

#include <algorithm>
#include <cmath>

#include <gtest/gtest.h>

namespace {

using namespace viewer;

TEST(GraphicsVendor, FollowsFromWhatTheDriverCallsItself)
{
    const struct {
        const char* vendor;
        const char* renderer;
        std::optional<unsigned> id;
    } rows[] = {
        {"NVIDIA Corporation", "NVIDIA H100/PCIe/SSE2", 0x10DE},
        {"ATI Technologies Inc.", "AMD Radeon Pro W6800", 0x1002},
        {"AMD", "AMD Radeon RX 6800 (navi21, LLVM 15.0.6, DRM 3.49)", 0x1002},
        {"X.Org", "AMD Radeon RX 580 (polaris10)", 0x1002},
        {"Intel", "Mesa Intel(R) UHD Graphics 630 (CFL GT2)", 0x8086},
        {"Intel Open Source Technology Center", "Mesa DRI Intel(R) HD 4000", 0x8086},
        {"Mesa/X.org", "llvmpipe (LLVM 15.0.6, 256 bits)", std::nullopt},
        {"Mesa", "llvmpipe (AMD Ryzen 7 3700X)", std::nullopt},
        {"VMware, Inc.", "softpipe", std::nullopt},
        {"Microsoft Corporation", "GDI Generic", std::nullopt},
        {"", "", std::nullopt},
    };
    for (const auto& row : rows)
        EXPECT_EQ(pciVendorId(row.vendor, row.renderer), row.id)
            << row.vendor << ' ' << row.renderer;
}

TEST(OpenCLPlatforms, TheOneThatSharesIsTaken)
{
    const std::string shares = "cl_khr_icd cl_khr_gl_sharing";
    const struct {
        const char* name;
        std::vector<OpenCLPlatform> platforms;
        const char* vendor; // null: none
        const char* says;
    } rows[] = {
        {"one of two", {{"A", "cl_khr_icd"}, {"B", shares}}, "B", nullptr},
        {"two of one vendor", {{"B", shares}, {"B", shares}}, "B", nullptr},
        {"none shares", {{"A", "cl_khr_icd"}}, nullptr, "libglshare.so"},
        {"no platform", {}, nullptr, "install an OpenCL driver"},
        {"a choice", {{"A", shares}, {"B", shares}}, nullptr, "--platform: 'A', 'B'"},
    };
    for (const auto& row : rows) {
        SCOPED_TRACE(row.name);
        const Result<std::string> vendor = sharingVendor(row.platforms);
        ASSERT_EQ(static_cast<bool>(vendor), row.vendor != nullptr);
        if (row.vendor) {
            EXPECT_EQ(vendor.value(), row.vendor);
        } else {
            EXPECT_EQ(vendor.failure().code, ExitCode::kNoOpenCL);
            EXPECT_NE(vendor.failure().text.find(row.says), std::string::npos)
                << vendor.failure().text;
        }
    }
}

TEST(Camera, FramesAllPointsAsLargeAsThePictureAllows)
{
    const std::vector<QVector3D> shapes[] = {
        {{-0.3f, 0, -0.2f}, {0.3f, 1, 0.2f}, {0.3f, 0, 0.2f}}, // upright
        {{-9, 0, -9}, {9, 0.5f, 9}, {-9, 0, 9}, {9, 0, -9}},   // a wide crowd
        {{4, 2, 4}, {5, 2.5f, 4}},                             // away from the origin
    };
    for (const std::vector<QVector3D>& points : shapes) {
        for (const float aspect : {16.0f / 9, 1.0f, 0.5f}) {
            SCOPED_TRACE(testing::Message() << points[0].x() << " aspect " << aspect);
            Camera camera;
            camera.frame(points, aspect);
            float left = 1, right = -1, bottom = 1, top = -1;
            for (const QVector3D& point : points) {
                const QVector3D inClip = camera.toClip().map(point);
                left = std::min(left, inClip.x());
                right = std::max(right, inClip.x());
                bottom = std::min(bottom, inClip.y());
                top = std::max(top, inClip.y());
            }
            EXPECT_GT(std::min(left, bottom), -1);
            EXPECT_LT(std::max(right, top), 1);
            // Centred, and one of the sides is nearly filled.
            EXPECT_NEAR(left + right, 0, 0.05);
            EXPECT_NEAR(bottom + top, 0, 0.05);
            EXPECT_GT(std::max(right - left, top - bottom), 1.6);
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

TEST(Report, PercentilesAreValuesThatWereMeasured)
{
    const struct {
        std::vector<double> values;
        double part;
        double expected;
    } rows[] = {
        {{}, 0.5, 0},
        {{7}, 0.5, 7},
        {{7}, 0.95, 7},
        {{4, 1, 3, 2}, 0.5, 2},
        {{5, 1, 3, 2, 4}, 0.5, 3},
        {{5, 1, 3, 2, 4}, 0.95, 5},
        {{1, 2}, 0, 1},
        {{1, 2}, 1, 2},
    };
    for (const auto& row : rows)
        EXPECT_EQ(percentile(row.values, row.part), row.expected);
}

TEST(Report, TellsWhatTheCpuDidAndWhetherTheBoundHeld)
{
    RunFacts facts;
    facts.characters = 2;
    facts.meshes = 6;
    facts.meshesOnCpu = 4;
    facts.openCL.emplace();
    facts.openCL->minimumVertices = 500;
    facts.openCL->counts.evaluations = 4;
    facts.openCL->counts.acquires = 6;
    facts.deviation = Deviation{2 * kPositionBound, 0};
    const std::string text = reportText(facts);
    EXPECT_NE(text.find("4 meshes by the CPU: they have fewer than 500 vertices"),
              std::string::npos)
        << text;
    EXPECT_NE(text.find("Acquires per frame    1.5"), std::string::npos) << text;
    EXPECT_NE(text.find("FAILED"), std::string::npos) << text;

    facts.openCL.reset();
    facts.deviation = Deviation{kPositionBound, kNormalBound};
    EXPECT_NE(reportText(facts).find("OpenCL is not used"), std::string::npos);
    EXPECT_NE(reportText(facts).find("passed"), std::string::npos);
}

} // namespace
