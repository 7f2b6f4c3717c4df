// Smoothing against closed forms, on meshes with seams, borders and faults.
#include "evaluator/SmoothDeformer.h"
#include "DeformerCases.h"
#include "evaluator/VectorMath.h"

#include <algorithm>
#include <cmath>
#include <numbers>
#include <tuple>

#include <gtest/gtest.h>

namespace {

using namespace vyra;

const Vector3 kUp{0, 1, 0};

Surface smoothed(const MeshGeometry& mesh, const Surface& from, unsigned iterations,
                 float weight = 0.5f)
{
    SmoothDeformer deformer{SmoothTopology(mesh)};
    deformer.iterations = iterations;
    deformer.weight = weight;
    EXPECT_EQ(deformer.mismatch(mesh), "");
    Surface surface = from;
    deformer.deform(mesh, surface);
    return surface;
}

MeshGeometry meshOf(std::vector<Vector3> positions, std::vector<std::uint32_t> triangles)
{
    MeshGeometry mesh;
    mesh.rest = {std::move(positions), {}};
    mesh.rest.normals.assign(mesh.rest.positions.size(), kUp);
    mesh.triangles = std::move(triangles);
    return mesh;
}

// A flat hexagon of radius 1 whose centre, vertex 0, is raised by `height`. Seen counterclockwise
// from above.
MeshGeometry hexagon(float height)
{
    std::vector<Vector3> positions{{0, height, 0}};
    std::vector<std::uint32_t> triangles;
    for (unsigned i = 0; i < 6; ++i) {
        const float angle = static_cast<float>(i) * std::numbers::pi_v<float> / 3;
        positions.push_back({std::cos(angle), 0, -std::sin(angle)});
        triangles.insert(triangles.end(), {0, i + 1, (i + 1) % 6 + 1});
    }
    return meshOf(std::move(positions), std::move(triangles));
}

// Eight faces around the origin.
MeshGeometry octahedron()
{
    const std::vector<Vector3> corners{{1, 0, 0},  {0, 1, 0}, {-1, 0, 0},
                                       {0, -1, 0}, {0, 0, 1}, {0, 0, -1}};
    MeshGeometry mesh;
    mesh.rest = {corners, corners};
    for (std::uint32_t i = 0; i < 4; ++i)
        mesh.triangles.insert(mesh.triangles.end(), {i, (i + 1) % 4, 4, (i + 1) % 4, i, 5});
    return mesh;
}

// Returns the mesh with a separate vertex for each corner of a triangle.
MeshGeometry split(const MeshGeometry& whole)
{
    MeshGeometry mesh;
    for (const std::uint32_t vertex : whole.triangles) {
        mesh.triangles.push_back(static_cast<std::uint32_t>(mesh.triangles.size()));
        mesh.rest.positions.push_back(whole.rest.positions[vertex]);
        mesh.rest.normals.push_back(whole.rest.normals[vertex]);
    }
    return mesh;
}

// The four neighbours of a corner have the mean 0, so each iteration scales by 1 - weight.
TEST(SmoothDeformer, ClosedMeshShrinksAndKeepsNormalsAlsoAtSeams)
{
    MeshGeometry cut = split(octahedron());
    cut.rest.positions[0].y = -0.0f; // equal to 0
    MeshGeometry hard = cut;
    for (std::size_t i = 0; i < hard.rest.vertexCount(); ++i) {
        const auto corner = [&](std::size_t k) { return wide(hard.rest.positions[i / 3 * 3 + k]); };
        hard.rest.normals[i] = narrow(normalised(corner(0) + corner(1) + corner(2)));
    }
    for (const MeshGeometry& mesh : {octahedron(), cut, hard}) {
        const Surface surface = smoothed(mesh, mesh.rest, 2, 0.25f);
        for (std::size_t i = 0; i < surface.vertexCount(); ++i) {
            expectNear(surface.positions[i], narrow(0.5625 * wide(mesh.rest.positions[i])));
            expectNear(surface.normals[i], mesh.rest.normals[i]);
        }
    }
}

TEST(SmoothDeformer, SpikeSinksAndBorderUsesBorderNeighbours)
{
    const MeshGeometry mesh = hexagon(8);
    const Surface surface = smoothed(mesh, mesh.rest, 3);
    expectNear(surface.positions[0], {0, 1, 0});
    expectNear(surface.normals[0], kUp);
    // The mean of two neighbours on the border has the radius 1/2.
    expectNear(surface.positions[1], {27.0f / 64, 0, 0});
    // A border vertex has two triangles, symmetrical to the plane z = 0.
    EXPECT_GT(surface.normals[1].x, 0.1f);
    EXPECT_NEAR(surface.normals[1].z, 0, kTolerance);
}

TEST(SmoothDeformer, NormalsKeepTheirSide)
{
    const MeshGeometry mesh = hexagon(2);
    // Its first triangle faces the other way.
    MeshGeometry folded = mesh;
    folded.triangles.insert(folded.triangles.begin(), {0, 2, 1});
    for (MeshGeometry given : {mesh, folded}) {
        for (const bool isClockwise : {false, true}) {
            if (isClockwise)
                std::reverse(given.triangles.begin(), given.triangles.end());
            // A deformer before this one may mirror the mesh.
            for (const float side : {1.0f, -1.0f}) {
                Surface surface = given.rest;
                for (Vector3& position : surface.positions)
                    position.x *= side;
                EXPECT_GT(smoothed(given, surface, 1).normals[0].y, 0.5f);
            }
        }
    }
}

TEST(SmoothDeformer, InvalidMeshesHaveDefinedResults)
{
    const Vector3 a{0, 0, 0};
    const Vector3 b{2, 0, 0};
    const Vector3 c{0, 0, -2};
    const Vector3 away{9, 9, 9};
    const Vector3 tilted{0.6f, 0.8f, 0};
    // The position and the normal are those of vertex 0, whose normal at rest is tilted.
    const std::tuple<const char*, MeshGeometry, Vector3, Vector3> rows[] = {
        {"no triangle", meshOf({a, b, c}, {}), a, tilted},
        {"triangle with a corner twice", meshOf({a, b, a}, {0, 1, 2, 0, 0, 1}), a, tilted},
        {"one triangle", meshOf({a, b, c}, {0, 1, 2}), {0.25f, 0, -0.25f}, kUp},
        {"triangle without area", meshOf({a, b, {1, 0, 0}}, {0, 1, 2}), {0.375f, 0, 0}, tilted},
        {"two triangles that cancel",
         meshOf({a, b, c}, {0, 1, 2, 0, 2, 1}),
         {0.25f, 0, -0.25f},
         tilted},
        {"two triangles that almost cancel",
         meshOf({a, b, c, {0, 1e-6f, -2}}, {0, 1, 2, 0, 3, 1}),
         {0, 0, -0.5f},
         tilted},
        // The edge from a to b is no border, and both of its ends are on borders.
        {"edge of three triangles",
         meshOf({a, b, c, {0, 0, 2}, {0, 2, 0}}, {0, 1, 2, 1, 0, 3, 0, 1, 4}),
         {0, 1.0f / 6, 0},
         {}},
        {"vertex of no triangle", meshOf({away, a, b, c}, {1, 2, 3}), away, tilted},
    };
    for (const auto& [name, given, position, normal] : rows) {
        SCOPED_TRACE(name);
        MeshGeometry mesh = given;
        mesh.rest.normals[0] = tilted;
        const Surface surface = smoothed(mesh, mesh.rest, 1, 0.25f);
        expectNear(surface.positions[0], position);
        if (length(wide(normal)) > 0)
            expectNear(surface.normals[0], normal);
        EXPECT_NEAR(length(wide(surface.normals[0])), 1, kTolerance);
    }
}

} // namespace
