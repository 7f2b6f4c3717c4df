#include "evaluator/SmoothDeformer.h"

#include "evaluator/VectorMath.h"

#include <algorithm>
#include <array>
#include <bit>
#include <cmath>
#include <numeric>
#include <span>
#include <utility>
#include <vector>

namespace vyra {
namespace {

using Index = std::uint32_t;
using Range = SmoothTopology::Range;
using Corner = SmoothTopology::Corner;

// The areas of a vertex's triangles cancel if their sum is below this fraction of their sizes.
constexpr double kCancelled = 1e-4;

// Returns keys that are equal if and only if the vectors are; 0 equals -0.
std::array<Index, 3> keyOf(const Vector3& v)
{
    return {std::bit_cast<Index>(v.x + 0.0f), std::bit_cast<Index>(v.y + 0.0f),
            std::bit_cast<Index>(v.z + 0.0f)};
}

// Returns for each index below `count` the lowest index with an equal key.
template <typename KeyOf>
std::vector<Index> firstWithSameKey(std::size_t count, const KeyOf& key)
{
    std::vector<Index> order(count);
    std::iota(order.begin(), order.end(), Index{0});
    std::sort(order.begin(), order.end(),
              [&](Index a, Index b) { return std::pair(key(a), a) < std::pair(key(b), b); });
    std::vector<Index> first(count);
    for (std::size_t i = 0; i < count; ++i) {
        const bool isNew = i == 0 || key(order[i - 1]) != key(order[i]);
        first[order[i]] = isNew ? order[i] : first[order[i - 1]];
    }
    return first;
}

// Items by owner: a range per owner in an array of all items.
template <typename Item>
struct Lists {
    std::vector<Range> ranges;
    std::vector<Item> items;
};

template <typename Item>
Lists<Item> listsByOwner(std::size_t owners, const std::vector<std::pair<Index, Item>>& pairs)
{
    Lists<Item> lists{std::vector<Range>(owners), std::vector<Item>(pairs.size())};
    for (const auto& [owner, item] : pairs)
        ++lists.ranges[owner].end;
    Index begin = 0;
    for (Range& range : lists.ranges) {
        const Index size = range.end;
        range = {begin, begin};
        begin += size;
    }
    for (const auto& [owner, item] : pairs)
        lists.items[lists.ranges[owner].end++] = item;
    return lists;
}

// Gives all vertices of a group the range of its first vertex.
void shareRanges(const std::vector<Index>& first, std::vector<Range>& ranges)
{
    for (std::size_t i = 0; i < ranges.size(); ++i)
        ranges[i] = ranges[first[i]];
}

// Calls `use` with the vertices of each triangle whose corners are three different points.
template <typename Use>
void forEachTriangle(const std::vector<Index>& triangles, const std::vector<Index>& pointOf,
                     const Use& use)
{
    for (std::size_t i = 0; i + 2 < triangles.size(); i += 3) {
        const std::array<Index, 3> corners = {triangles[i], triangles[i + 1], triangles[i + 2]};
        const Index a = pointOf[corners[0]];
        const Index b = pointOf[corners[1]];
        const Index c = pointOf[corners[2]];
        if (a != b && b != c && c != a)
            use(corners);
    }
}

using Edge = std::pair<Index, Index>; // two points, the lower first

// Returns the sorted edges of all triangles; an edge occurs once per triangle.
std::vector<Edge> triangleEdges(const std::vector<Index>& triangles,
                                const std::vector<Index>& pointOf)
{
    std::vector<Edge> edges;
    edges.reserve(triangles.size());
    forEachTriangle(triangles, pointOf, [&](const std::array<Index, 3>& corners) {
        for (std::size_t i = 0; i < 3; ++i)
            edges.push_back(std::minmax({pointOf[corners[i]], pointOf[corners[(i + 1) % 3]]}));
    });
    std::sort(edges.begin(), edges.end());
    return edges;
}

Lists<Index> neighbourLists(const std::vector<Index>& triangles, const std::vector<Index>& pointOf)
{
    const std::vector<Edge> edges = triangleEdges(triangles, pointOf);
    std::vector<std::pair<Edge, bool>> uniqueEdges; // and whether the edge is a border
    std::vector<bool> onBorder(pointOf.size());
    for (auto edge = edges.begin(); edge != edges.end();) {
        const auto next = std::upper_bound(edge, edges.end(), *edge);
        const bool isBorder = next - edge == 1;
        uniqueEdges.emplace_back(*edge, isBorder);
        if (isBorder)
            onBorder[edge->first] = onBorder[edge->second] = true;
        edge = next;
    }
    std::vector<std::pair<Index, Index>> neighbours;
    neighbours.reserve(2 * uniqueEdges.size());
    for (const auto& [edge, isBorder] : uniqueEdges) {
        if (isBorder || !onBorder[edge.first])
            neighbours.emplace_back(edge.first, edge.second);
        if (isBorder || !onBorder[edge.second])
            neighbours.emplace_back(edge.second, edge.first);
    }
    return listsByOwner(pointOf.size(), neighbours);
}

// Returns twice the area of a triangle, as a vector that is perpendicular to it.
Vector areaVector(const Vector& p, const Vector& next, const Vector& last)
{
    return cross(next - p, last - p);
}

// Moves the first corner according to SmoothTopology::corners() to the front.
void arrange(std::span<Corner> corners, const Surface& rest, Index vertex)
{
    const auto area = [&](const Corner& corner) {
        return areaVector(wide(rest.positions[vertex]), wide(rest.positions[corner.next]),
                          wide(rest.positions[corner.last]));
    };
    Vector sum;
    for (const Corner& corner : corners)
        sum += area(corner);
    const auto best =
        std::max_element(corners.begin(), corners.end(), [&](const Corner& a, const Corner& b) {
            return dot(normalised(area(a)), sum) < dot(normalised(area(b)), sum);
        });
    if (best != corners.end())
        std::swap(*best, corners.front());
}

Lists<Corner> cornerLists(const MeshGeometry& geometry, const std::vector<Index>& pointOf,
                          const std::vector<Index>& groupOf)
{
    std::vector<std::pair<Index, Corner>> corners;
    corners.reserve(geometry.triangles.size());
    forEachTriangle(geometry.triangles, pointOf, [&](const std::array<Index, 3>& vertices) {
        for (std::size_t i = 0; i < 3; ++i)
            corners.emplace_back(groupOf[vertices[i]], Corner{pointOf[vertices[(i + 1) % 3]],
                                                              pointOf[vertices[(i + 2) % 3]]});
    });
    Lists<Corner> lists = listsByOwner(pointOf.size(), corners);
    for (Index vertex = 0; vertex < pointOf.size(); ++vertex) {
        const Range& range = lists.ranges[vertex];
        arrange(std::span(lists.items).subspan(range.begin, range.end - range.begin), geometry.rest,
                vertex);
    }
    return lists;
}

std::string problemOf(const MeshGeometry& geometry)
{
    const std::size_t count = geometry.rest.vertexCount();
    const std::vector<Index>& triangles = geometry.triangles;
    if (geometry.rest.normals.size() != count)
        return "the mesh has " + std::to_string(count) + " positions and " +
               std::to_string(geometry.rest.normals.size()) + " normals";
    if (triangles.size() % 3 != 0)
        return "the triangles have " + std::to_string(triangles.size()) +
               " vertex indices, which is not a multiple of 3";
    const auto bad = std::find_if(triangles.begin(), triangles.end(),
                                  [count](Index vertex) { return vertex >= count; });
    if (bad != triangles.end())
        return "triangle " + std::to_string((bad - triangles.begin()) / 3) + " refers to vertex " +
               std::to_string(*bad) + ", and the mesh has " + std::to_string(count) + " vertices";
    return {};
}

// Returns the items of one vertex.
template <typename Item>
std::span<const Item> itemsOf(const ConstantArray& ranges, const ConstantArray& items,
                              std::size_t vertex)
{
    const Range& range = ranges.values<Range>()[vertex];
    return items.values<Item>().subspan(range.begin, range.end - range.begin);
}

std::vector<Vector> smoothed(const std::vector<Vector>& positions, const SmoothTopology& topology,
                             double weight)
{
    std::vector<Vector> result = positions;
    for (std::size_t i = 0; i < positions.size(); ++i) {
        const auto neighbours =
            itemsOf<Index>(topology.neighbourRanges(), topology.neighbours(), i);
        Vector sum;
        for (const Index neighbour : neighbours)
            sum += positions[neighbour] - positions[i];
        if (!neighbours.empty())
            result[i] += weight / static_cast<double>(neighbours.size()) * sum;
    }
    return result;
}

// Returns the normal from the triangles of a vertex, or a vector of length 0.
Vector normalOf(const std::vector<Vector>& positions, std::span<const Corner> corners,
                std::size_t vertex)
{
    Vector sum;
    double size = 0;
    for (const Corner& corner : corners) {
        const Vector area =
            areaVector(positions[vertex], positions[corner.next], positions[corner.last]);
        sum += area;
        size += std::abs(area.x) + std::abs(area.y) + std::abs(area.z);
    }
    const bool cancelled = std::abs(sum.x) + std::abs(sum.y) + std::abs(sum.z) <= kCancelled * size;
    return cancelled ? Vector{} : normalised(sum);
}

} // namespace

SmoothTopology::SmoothTopology(const MeshGeometry& geometry) : fProblem(problemOf(geometry))
{
    if (!fProblem.empty())
        return;
    const Surface& rest = geometry.rest;
    const auto pointKey = [&rest](Index i) { return keyOf(rest.positions[i]); };
    const auto groupKey = [&rest](Index i) {
        return std::pair(keyOf(rest.positions[i]), keyOf(rest.normals[i]));
    };
    const std::vector<Index> pointOf = firstWithSameKey(rest.vertexCount(), pointKey);
    const std::vector<Index> groupOf = firstWithSameKey(rest.vertexCount(), groupKey);

    Lists<Index> neighbours = neighbourLists(geometry.triangles, pointOf);
    shareRanges(pointOf, neighbours.ranges);
    fNeighbourRanges = ConstantArray(neighbours.ranges);
    fNeighbours = ConstantArray(neighbours.items);

    Lists<Corner> corners = cornerLists(geometry, pointOf, groupOf);
    shareRanges(groupOf, corners.ranges);
    fCornerRanges = ConstantArray(corners.ranges);
    fCorners = ConstantArray(corners.items);
}

std::size_t SmoothTopology::vertexCount() const
{
    return fNeighbourRanges.sizeInBytes() / sizeof(Range);
}

SmoothDeformer::SmoothDeformer(SmoothTopology topology) : fTopology(std::move(topology)) {}

std::string SmoothDeformer::mismatch(const MeshGeometry& geometry) const
{
    if (!fTopology.problem().empty())
        return fTopology.problem() + "; correct the mesh";
    if (fTopology.vertexCount() != geometry.rest.vertexCount())
        return "the topology has " + std::to_string(fTopology.vertexCount()) +
               " vertices, and the mesh has " + std::to_string(geometry.rest.vertexCount()) +
               "; use the topology of this mesh";
    if (!(weight >= 0 && weight <= 1))
        return "the weight is " + std::to_string(weight) + "; set one from 0 to 1";
    if (iterations > kMostIterations)
        return "there are " + std::to_string(iterations) + " iterations; set at most " +
               std::to_string(kMostIterations);
    return {};
}

unsigned SmoothDeformer::passCount() const
{
    return weight == 0 || iterations == 0 ? 0 : iterations + 1;
}

KernelSource SmoothDeformer::kernel(unsigned pass) const
{
    return {"smooth.cl", pass < iterations ? "smooth" : "smoothNormals"};
}

void SmoothDeformer::setArguments(unsigned pass, KernelArguments& arguments)
{
    arguments.constant(fTopology.cornerRanges());
    arguments.constant(fTopology.corners());
    if (pass == iterations)
        return;
    arguments.constant(fTopology.neighbourRanges());
    arguments.constant(fTopology.neighbours());
    arguments.value(weight);
    arguments.value(cl_uint{pass == 0});
}

void SmoothDeformer::deform(const MeshGeometry& /*geometry*/, Surface& surface) const
{
    if (passCount() == 0)
        return;
    std::vector<Vector> positions(surface.vertexCount());
    std::transform(surface.positions.begin(), surface.positions.end(), positions.begin(),
                   [](const Vector3& p) { return wide(p); });
    const std::vector<Vector> before = positions;
    for (unsigned i = 0; i < iterations; ++i)
        positions = smoothed(positions, fTopology, weight);

    for (std::size_t i = 0; i < positions.size(); ++i) {
        surface.positions[i] = narrow(positions[i]);
        const auto corners = itemsOf<Corner>(fTopology.cornerRanges(), fTopology.corners(), i);
        const Vector normal = normalOf(positions, corners, i);
        if (dot(normal, normal) == 0)
            continue;
        // The triangles may be clockwise, and deformers before this one may have mirrored the mesh.
        const Corner& first = corners.front();
        const bool isReversed = dot(areaVector(before[i], before[first.next], before[first.last]),
                                    wide(surface.normals[i])) < 0;
        surface.normals[i] = narrow((isReversed ? -1 : 1) * normal);
    }
}

std::vector<DeformerParameter> SmoothDeformer::parameters()
{
    return {{"weight", "part of the way to the mean of the neighbours in each iteration", &weight,
             0, 1},
            {"iterations", "how often vertices move", &iterations, 0, kMostIterations}};
}

} // namespace vyra
