// Laplacian smoothing.
#pragma once

#include "evaluator/ConstantArray.h"
#include "evaluator/Deformer.h"

#include <cstddef>
#include <cstdint>
#include <string>

namespace vyra {

// The neighbourhood of each vertex of a mesh. Built once per mesh; copies share the arrays.
//
// Vertices with equal positions in the rest pose are one point: they have the same neighbours, so
// they move together. A point's neighbours are the points at the other ends of its edges. The
// following are allowed:
//
// - An edge of one triangle is a border. A point on a border has only the neighbours along borders,
//   so that the border keeps its course (G. Taubin, A Signal Processing Approach to Fair Surface
//   Design, SIGGRAPH 1995, "hierarchical constraints").
// - An edge of three or more triangles is like one of two.
// - A triangle two of whose corners are one point is ignored. A triangle without area that has
//   three different points has edges, and contributes nothing to normals.
// - A point without triangles stays where it is and keeps its normal.
//
// Triangles that cannot be used are not an error here: problem() names the first, and the deformer
// reports it.
class VYRA_EVALUATOR_API SmoothTopology {
public:
    // No vertices.
    SmoothTopology() = default;
    explicit SmoothTopology(const MeshGeometry& geometry);

    // The range of a vertex's elements in an array that all vertices share.
    struct Range {
        std::uint32_t begin = 0;
        std::uint32_t end = 0;
    };
    // The two other corners of a triangle, in its order.
    struct Corner {
        std::uint32_t next = 0;
        std::uint32_t last = 0;
    };

    std::size_t vertexCount() const;
    // Returns the error in the triangles; empty if they can be used.
    const std::string& problem() const noexcept { return fProblem; }

    // One range per vertex in neighbours(), which holds vertex indices.
    const ConstantArray& neighbourRanges() const noexcept { return fNeighbourRanges; }
    const ConstantArray& neighbours() const noexcept { return fNeighbours; }
    // One range per vertex in corners(): the triangles of the vertices that share its position and
    // its rest normal. The first is the one whose plane is nearest to the mean of all; it decides
    // on which side of the triangles a normal lies.
    const ConstantArray& cornerRanges() const noexcept { return fCornerRanges; }
    const ConstantArray& corners() const noexcept { return fCorners; }

private:
    ConstantArray fNeighbourRanges;
    ConstantArray fNeighbours;
    ConstantArray fCornerRanges;
    ConstantArray fCorners;
    std::string fProblem;
};

// Laplacian smoothing over the edges of the mesh: in each iteration, a point p with the mean m of
// its neighbours becomes p + weight (m - p). Source: D. A. Field, Laplacian Smoothing and Delaunay
// Triangulations, Communications in Applied Numerical Methods 4, 1988.
//
// Normals are computed from the smoothed triangles, weighted by area; vertices that share position
// and rest normal share triangles, so hard edges stay hard, and seams do not show. A normal lies on
// the side of the surface on which it came in. Where the triangles of a vertex have no area, or
// cancel, the normal stays as it came in. Edges are from 1e-9 to 1e9 long.
class VYRA_EVALUATOR_API SmoothDeformer : public Deformer {
public:
    static constexpr unsigned kMostIterations = 100;

    // The topology of the mesh.
    explicit SmoothDeformer(SmoothTopology topology);

    float weight = 0.5f;     // from 0 to 1
    unsigned iterations = 1; // up to kMostIterations

    const SmoothTopology& topology() const noexcept { return fTopology; }

    const char* name() const override { return "smooth"; }
    [[nodiscard]] std::string mismatch(const MeshGeometry& geometry) const override;
    // One per iteration, and one for the normals.
    unsigned passCount() const override;
    KernelSource kernel(unsigned pass) const override;
    bool readsNeighbours() const override { return true; }
    void setArguments(unsigned pass, KernelArguments& arguments) override;
    void deform(const MeshGeometry& geometry, Surface& surface) const override;
    // "weight", "iterations".
    std::vector<DeformerParameter> parameters() override;

private:
    SmoothTopology fTopology;
};

} // namespace vyra
