#include "frames/CpuDeformation.h"

#include "evaluator/MorphDeformer.h"
#include "evaluator/SmoothDeformer.h"

#include <algorithm>
#include <cmath>
#include <span>
#include <utility>
#include <vector>

#include <tbb/blocked_range.h>
#include <tbb/parallel_for.h>

namespace {

// Vertices per task.
constexpr std::size_t kGrain = 512;
// The areas of a vertex's triangles cancel if the length of their sum is below this part of the sum
// of their lengths.
constexpr float kCancelled = 1e-4F;

using Float4 = float __attribute__((vector_size(16))); // x, y, z and 0

float dot(const Float4& a, const Float4& b)
{
    const Float4 product = a * b;
    return product[0] + product[1] + product[2];
}

Float4 cross(const Float4& a, const Float4& b)
{
    const Float4 c = a * __builtin_shufflevector(b, b, 1, 2, 0, 3) -
                     __builtin_shufflevector(a, a, 1, 2, 0, 3) * b;
    return __builtin_shufflevector(c, c, 1, 2, 0, 3);
}

template <typename Body>
void forRanges(std::size_t count, const Body& body)
{
    using Range = tbb::blocked_range<std::size_t>;
    tbb::parallel_for(Range(0, count, kGrain),
                      [&](const Range& range) { body(range.begin(), range.end()); });
}

// One mesh, with the memory between the iterations.
class MeshMorphSmooth {
public:
    explicit MeshMorphSmooth(const viewer::CharacterMesh& mesh)
        : fRest(mesh.shape().geometry->rest),
          fMorph(dynamic_cast<const vyra::MorphDeformer&>(*mesh.deformable->deformers().front())),
          fSmooth(dynamic_cast<const vyra::SmoothDeformer&>(*mesh.deformable->deformers().back())),
          fNeighbourRanges(valuesOf<vyra::SmoothTopology::Range>(&Topology::neighbourRanges)),
          fNeighbours(valuesOf<std::uint32_t>(&Topology::neighbours)),
          fCornerRanges(valuesOf<vyra::SmoothTopology::Range>(&Topology::cornerRanges)),
          fCorners(valuesOf<vyra::SmoothTopology::Corner>(&Topology::corners)),
          fPositions(fRest.vertexCount()), fNext(fRest.vertexCount()), fNormals(fRest.vertexCount())
    {
    }

    void deform(vyra::Vector3* positions, vyra::Vector3* normals)
    {
        const std::size_t count = fRest.vertexCount();
        forRanges(count, [this](auto begin, auto end) { morph(begin, end); });
        forRanges(count, [this](auto begin, auto end) { markReversed(begin, end); });
        for (unsigned i = 0; i < fSmooth.iterations; ++i) {
            forRanges(count, [this](auto begin, auto end) { smooth(begin, end); });
            std::swap(fPositions, fNext);
        }
        forRanges(count, [&](auto begin, auto end) { write(begin, end, positions, normals); });
    }

private:
    using Topology = vyra::SmoothTopology;

    template <typename T>
    std::span<const T> valuesOf(const vyra::ConstantArray& (Topology::*array)() const) const
    {
        return (fSmooth.topology().*array)().template values<T>();
    }

    // Applies all targets to one component of positions (0 to 2) or normals (3 to 5).
    void addTargets(std::size_t component, std::size_t begin, std::size_t end, float* sums) const
    {
        const std::size_t count = fRest.vertexCount();
        for (std::size_t target = 0; target < fMorph.weights.size(); ++target) {
            const float weight = fMorph.strength * fMorph.weights[target];
            const float* deltas =
                fMorph.targets().deltas(target).values<float>().data() + component * count;
            for (std::size_t i = begin; i < end; ++i)
                sums[i - begin] += weight * deltas[i];
        }
    }

    void morph(std::size_t begin, std::size_t end)
    {
        constexpr std::size_t kComponents = 6;
        for (std::size_t first = begin; first < end; first += kGrain) {
            const std::size_t last = std::min(first + kGrain, end);
            float sums[kComponents][kGrain] = {};
            for (std::size_t component = 0; component < kComponents; ++component)
                addTargets(component, first, last, sums[component]);
            for (std::size_t i = first; i < last; ++i) {
                const auto& [x, y, z] = fRest.positions[i];
                const auto& [u, v, w] = fRest.normals[i];
                const std::size_t slot = i - first;
                fPositions[i] = Float4{x + sums[0][slot], y + sums[1][slot], z + sums[2][slot], 0};
                const Float4 normal{u + sums[3][slot], v + sums[4][slot], w + sums[5][slot], 0};
                fNormals[i] = normal / std::sqrt(dot(normal, normal));
            }
        }
    }

    Float4 areaOf(std::size_t vertex, const vyra::SmoothTopology::Corner& corner) const
    {
        return cross(fPositions[corner.next] - fPositions[vertex],
                     fPositions[corner.last] - fPositions[vertex]);
    }

    // Doubles the normals on the other side of the surface.
    void markReversed(std::size_t begin, std::size_t end)
    {
        for (std::size_t i = begin; i < end; ++i) {
            const auto [first, last] = fCornerRanges[i];
            if (first < last && dot(areaOf(i, fCorners[first]), fNormals[i]) < 0)
                fNormals[i] *= 2.0F;
        }
    }

    void smooth(std::size_t begin, std::size_t end)
    {
        for (std::size_t i = begin; i < end; ++i) {
            const auto [first, last] = fNeighbourRanges[i];
            Float4 sum{};
            for (std::uint32_t neighbour = first; neighbour < last; ++neighbour)
                sum += fPositions[fNeighbours[neighbour]] - fPositions[i];
            const float part =
                first < last ? fSmooth.weight / static_cast<float>(last - first) : 0.0F;
            fNext[i] = fPositions[i] + part * sum;
        }
    }

    void write(std::size_t begin, std::size_t end, vyra::Vector3* positions,
               vyra::Vector3* normals) const
    {
        for (std::size_t i = begin; i < end; ++i) {
            const auto [first, last] = fCornerRanges[i];
            Float4 sum{};
            Float4 size{};
            for (std::uint32_t corner = first; corner < last; ++corner) {
                const Float4 area = areaOf(i, fCorners[corner]);
                sum += area;
                size += area < 0 ? -area : area;
            }
            const bool isReversed = dot(fNormals[i], fNormals[i]) > 2;
            Float4 normal = isReversed ? 0.5F * fNormals[i] : fNormals[i];
            const Float4 magnitude = sum < 0 ? -sum : sum;
            if (magnitude[0] + magnitude[1] + magnitude[2] >
                kCancelled * (size[0] + size[1] + size[2]))
                normal = sum * ((isReversed ? -1.0F : 1.0F) / std::sqrt(dot(sum, sum)));
            positions[i] = {fPositions[i][0], fPositions[i][1], fPositions[i][2]};
            normals[i] = {normal[0], normal[1], normal[2]};
        }
    }

    const vyra::Surface& fRest;
    const vyra::MorphDeformer& fMorph;
    const vyra::SmoothDeformer& fSmooth;
    std::span<const vyra::SmoothTopology::Range> fNeighbourRanges;
    std::span<const std::uint32_t> fNeighbours;
    std::span<const vyra::SmoothTopology::Range> fCornerRanges;
    std::span<const vyra::SmoothTopology::Corner> fCorners;
    std::vector<Float4> fPositions;
    std::vector<Float4> fNext;
    std::vector<Float4> fNormals;
};

class MorphSmooth final : public CpuDeformation {
public:
    explicit MorphSmooth(const viewer::Scene& scene)
    {
        for (const viewer::CharacterMesh* mesh : scene.meshes())
            fMeshes.push_back(std::make_unique<MeshMorphSmooth>(*mesh));
    }

    void deform(std::size_t mesh, vyra::Vector3* positions, vyra::Vector3* normals) override
    {
        fMeshes[mesh]->deform(positions, normals);
    }

private:
    std::vector<std::unique_ptr<MeshMorphSmooth>> fMeshes;
};

} // namespace

std::unique_ptr<CpuDeformation> makeMorphSmooth(const viewer::Scene& scene)
{
    return std::make_unique<MorphSmooth>(scene);
}
