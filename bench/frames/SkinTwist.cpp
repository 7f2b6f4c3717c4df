#include "frames/CpuDeformation.h"
#include "frames/SkinTwistPose.h"

#include <algorithm>
#include <array>
#include <bit>
#include <cmath>
#include <map>
#include <utility>
#include <vector>

#include <tbb/blocked_range.h>
#include <tbb/parallel_for.h>

namespace {

using viewer::kBonesPerVertex;
using vyra::MatrixRows;

// Vertices that are deformed together, one per lane of a vector of 64 bytes.
constexpr std::size_t kLanes = 16;
// Blocks per task: enough to hide the cost of a task, few enough to divide a single mesh.
constexpr std::size_t kGrain = 64;

using Float16 = float __attribute__((vector_size(64)));
using Lanes = std::array<float, kLanes>;

// Sixteen vertices of the rest pose. Those past the mesh's end repeat the last one.
struct RestBlock {
    Lanes x, y, z;    // positions
    Lanes nx, ny, nz; // normals
    std::array<std::array<float, kBonesPerVertex>, kLanes> weights;
    std::array<std::array<std::uint32_t, kBonesPerVertex>, kLanes> bones;
};

std::vector<RestBlock> blocksOf(const viewer::Mesh& mesh)
{
    std::vector<RestBlock> blocks((mesh.vertexCount() + kLanes - 1) / kLanes);
    for (std::size_t i = 0; i < blocks.size() * kLanes; ++i) {
        RestBlock& block = blocks[i / kLanes];
        const std::size_t lane = i % kLanes;
        const std::size_t vertex = std::min(i, mesh.vertexCount() - 1);
        block.x[lane] = mesh.positions[vertex].x();
        block.y[lane] = mesh.positions[vertex].y();
        block.z[lane] = mesh.positions[vertex].z();
        block.nx[lane] = mesh.normals[vertex].x();
        block.ny[lane] = mesh.normals[vertex].y();
        block.nz[lane] = mesh.normals[vertex].z();
        block.weights[lane] = mesh.hasBones() ? mesh.boneWeights[vertex]
                                              : std::array<float, kBonesPerVertex>{1, 0, 0, 0};
        block.bones[lane] = mesh.hasBones() ? mesh.boneIndices[vertex]
                                            : std::array<std::uint32_t, kBonesPerVertex>{};
    }
    return blocks;
}

// The four columns of a 3x4 matrix, with a 0 below each.
Float16 columnsOf(const MatrixRows& r)
{
    return Float16{r[0], r[4], r[8],  0, r[1], r[5], r[9],  0,
                   r[2], r[6], r[10], 0, r[3], r[7], r[11], 0};
}

// Exchanges the lanes of `a` with the bit `Step` for those of `b` without it.
template <int Step, int... Lane>
void exchange(Float16& a, Float16& b, std::integer_sequence<int, Lane...>)
{
    const Float16 low = __builtin_shufflevector(a, b, ((Lane & Step) ? 16 + Lane - Step : Lane)...);
    b = __builtin_shufflevector(a, b, ((Lane & Step) ? 16 + Lane : Lane + Step)...);
    a = low;
}

template <int Step>
void exchangeRows(std::array<Float16, kLanes>& rows)
{
    for (std::size_t i = 0; i < kLanes; ++i) {
        if (!(i & Step))
            exchange<Step>(rows[i], rows[i + Step], std::make_integer_sequence<int, 16>());
    }
}

// Transposes one matrix per vertex into one vector per element.
void transpose(std::array<Float16, kLanes>& rows)
{
    exchangeRows<8>(rows);
    exchangeRows<4>(rows);
    exchangeRows<2>(rows);
    exchangeRows<1>(rows);
}

// Element 4 * column + row of the matrices of all lanes.
using Matrices = std::array<Lanes, kLanes>;

// Returns the blended matrix of each vertex.
Matrices blend(const RestBlock& block, const std::vector<Float16>& bones)
{
    std::array<Float16, kLanes> blended;
    for (std::size_t lane = 0; lane < kLanes; ++lane) {
        const auto& weight = block.weights[lane];
        const auto& bone = block.bones[lane];
        blended[lane] = weight[0] * bones[bone[0]] + weight[1] * bones[bone[1]] +
                        weight[2] * bones[bone[2]] + weight[3] * bones[bone[3]];
    }
    transpose(blended);
    return std::bit_cast<Matrices>(blended);
}

struct Vertices {
    Lanes x, y, z, nx, ny, nz;
};

// Normals are transformed by the cofactors, whose sign keeps them outside of a mirrored mesh.
void skin(const RestBlock& block, const Matrices& matrices, Vertices& out)
{
    for (std::size_t i = 0; i < kLanes; ++i) {
        const float ax = matrices[0][i], ay = matrices[1][i], az = matrices[2][i];
        const float bx = matrices[4][i], by = matrices[5][i], bz = matrices[6][i];
        const float cx = matrices[8][i], cy = matrices[9][i], cz = matrices[10][i];
        out.x[i] = ax * block.x[i] + bx * block.y[i] + cx * block.z[i] + matrices[12][i];
        out.y[i] = ay * block.x[i] + by * block.y[i] + cy * block.z[i] + matrices[13][i];
        out.z[i] = az * block.x[i] + bz * block.y[i] + cz * block.z[i] + matrices[14][i];
        const float px = by * cz - bz * cy, py = bz * cx - bx * cz, pz = bx * cy - by * cx;
        const float qx = cy * az - cz * ay, qy = cz * ax - cx * az, qz = cx * ay - cy * ax;
        const float rx = ay * bz - az * by, ry = az * bx - ax * bz, rz = ax * by - ay * bx;
        const float sign = ax * px + ay * py + az * pz < 0 ? -1.0F : 1.0F;
        const float u = sign * block.nx[i], v = sign * block.ny[i], w = sign * block.nz[i];
        out.nx[i] = u * px + v * qx + w * rx;
        out.ny[i] = u * py + v * qy + w * ry;
        out.nz[i] = u * pz + v * qz + w * rz;
    }
}

struct Turn {
    float sine, cosine;
};

// Uses the polynomials of the kernels, on a quarter of a turn around its nearest multiple. There is
// no call, so the compiler vectorises the loop over the lanes.
inline Turn turnBy(float angle)
{
    const float quarters = std::nearbyint(angle * 0.63661977F);
    const float r = angle - quarters * 1.57079633F;
    const float z = r * r;
    const float s = r + r * z * (-0.166666507F + z * (0.00833197812F - z * 1.94955678e-4F));
    const float c =
        (1.0F - 0.5F * z) + z * z * (0.0416666469F + z * (-0.00138873669F + z * 2.44383795e-5F));
    const int quadrant = static_cast<int>(quarters);
    const float turnedSine = (quadrant & 1) ? c : s;
    const float turnedCosine = (quadrant & 1) ? s : c;
    return {(quadrant & 2) ? -turnedSine : turnedSine,
            ((quadrant + 1) & 2) ? -turnedCosine : turnedCosine};
}

void twist(const TwistPose& pose, Vertices& all)
{
    const MatrixRows& m = pose.toTwist;
    const MatrixRows& w = pose.fromTwist;
    const float perHeight = pose.anglePerHeight;
    for (std::size_t i = 0; i < kLanes; ++i) {
        const float x = m[0] * all.x[i] + m[1] * all.y[i] + m[2] * all.z[i] + m[3];
        const float y = m[4] * all.x[i] + m[5] * all.y[i] + m[6] * all.z[i] + m[7];
        const float z = m[8] * all.x[i] + m[9] * all.y[i] + m[10] * all.z[i] + m[11];
        const float u = w[0] * all.nx[i] + w[4] * all.ny[i] + w[8] * all.nz[i];
        const float t = w[2] * all.nx[i] + w[6] * all.ny[i] + w[10] * all.nz[i];
        const float v =
            w[1] * all.nx[i] + w[5] * all.ny[i] + w[9] * all.nz[i] - perHeight * (z * u - x * t);
        const auto [s, c] = turnBy(perHeight * y);
        const float turnedX = c * x + s * z;
        const float turnedZ = c * z - s * x;
        all.x[i] = w[0] * turnedX + w[1] * y + w[2] * turnedZ + w[3];
        all.y[i] = w[4] * turnedX + w[5] * y + w[6] * turnedZ + w[7];
        all.z[i] = w[8] * turnedX + w[9] * y + w[10] * turnedZ + w[11];
        const float turnedU = c * u + s * t;
        const float turnedT = c * t - s * u;
        const float a = m[0] * turnedU + m[4] * v + m[8] * turnedT;
        const float b = m[1] * turnedU + m[5] * v + m[9] * turnedT;
        const float d = m[2] * turnedU + m[6] * v + m[10] * turnedT;
        const float scale = 1.0F / std::sqrt(a * a + b * b + d * d);
        all.nx[i] = a * scale;
        all.ny[i] = b * scale;
        all.nz[i] = d * scale;
    }
}

void store(const Vertices& from, std::size_t count, vyra::Vector3* positions,
           vyra::Vector3* normals)
{
    const auto storeFirst = [&](std::size_t lanes) {
        for (std::size_t i = 0; i < lanes; ++i)
            positions[i] = {from.x[i], from.y[i], from.z[i]};
        for (std::size_t i = 0; i < lanes; ++i)
            normals[i] = {from.nx[i], from.ny[i], from.nz[i]};
    };
    if (count >= kLanes)
        storeFirst(kLanes); // a constant, for the compiler
    else
        storeFirst(count);
}

class SkinTwist final : public CpuDeformation {
public:
    explicit SkinTwist(const viewer::Scene& scene) : fScene(scene), fBones(scene.meshes().size())
    {
        for (const viewer::CharacterMesh* mesh : scene.meshes()) {
            auto& blocks = fBlocks[&mesh->mesh()];
            if (blocks.empty())
                blocks = blocksOf(mesh->mesh());
        }
    }

    void deform(std::size_t mesh, vyra::Vector3* positions, vyra::Vector3* normals) override
    {
        const viewer::CharacterMesh& character = *fScene.meshes()[mesh];
        const std::vector<RestBlock>& blocks = fBlocks.at(&character.mesh());
        const std::size_t vertexCount = character.mesh().vertexCount();
        const TwistPose pose = twistPoseOf(character);
        std::vector<Float16>& bones = fBones[mesh];
        bones.assign(1,
                     columnsOf({1, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1, 0})); // for meshes without bones
        bones.resize(std::max<std::size_t>(1, character.pose.bones.size()));
        std::transform(character.pose.bones.begin(), character.pose.bones.end(), bones.begin(),
                       columnsOf);
        using Range = tbb::blocked_range<std::size_t>;
        tbb::parallel_for(Range(0, blocks.size(), kGrain), [&](const Range& range) {
            Vertices vertices;
            for (std::size_t i = range.begin(); i < range.end(); ++i) {
                skin(blocks[i], blend(blocks[i], bones), vertices);
                twist(pose, vertices);
                const std::size_t first = i * kLanes;
                store(vertices, vertexCount - first, positions + first, normals + first);
            }
        });
    }

private:
    const viewer::Scene& fScene;
    std::map<const viewer::Mesh*, std::vector<RestBlock>> fBlocks;
    std::vector<std::vector<Float16>> fBones; // of each mesh; kept for their memory
};

} // namespace

std::unique_ptr<CpuDeformation> makeSkinTwist(const viewer::Scene& scene)
{
    return std::make_unique<SkinTwist>(scene);
}
