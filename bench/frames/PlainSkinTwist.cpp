#include "frames/CpuDeformation.h"
#include "frames/SkinTwistPose.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <vector>

#include <tbb/blocked_range.h>
#include <tbb/parallel_for.h>

namespace {

using viewer::Mesh;
using vyra::MatrixRows;

// Vertices per task: enough to hide the cost of a task, few enough to divide a single mesh.
constexpr std::size_t kGrain = 1024;

using Float4 = float __attribute__((vector_size(16))); // x, y, z and one unused

// The vertices of a block are stored by component, so the compiler vectorises a loop over them. A
// block fits the first-level cache.
constexpr std::size_t kBlock = 128;

struct Components {
    std::array<float, kBlock> x, y, z;

    void set(std::size_t i, const Float4& v)
    {
        x[i] = v[0];
        y[i] = v[1];
        z[i] = v[2];
    }
};

struct Block {
    Components positions;
    Components normals;
};

// A 3x4 matrix by columns.
struct Columns {
    Float4 x{}, y{}, z{}, offset{};
};

Columns columnsOf(const MatrixRows& r)
{
    Columns columns;
    columns.x = Float4{r[0], r[4], r[8], 0};
    columns.y = Float4{r[1], r[5], r[9], 0};
    columns.z = Float4{r[2], r[6], r[10], 0};
    columns.offset = Float4{r[3], r[7], r[11], 0};
    return columns;
}

Float4 cross(const Float4& a, const Float4& b)
{
    return Float4{a[1], a[2], a[0], 0} * Float4{b[2], b[0], b[1], 0} -
           Float4{a[2], a[0], a[1], 0} * Float4{b[1], b[2], b[0], 0};
}

void skinVertex(const Mesh& mesh, const std::vector<Columns>& bones, std::size_t vertex,
                Block& block, std::size_t slot)
{
    Columns m;
    for (std::size_t i = 0; i < viewer::kBonesPerVertex; ++i) {
        const Columns& bone = bones[mesh.boneIndices[vertex][i]];
        const float weight = mesh.boneWeights[vertex][i];
        m.x += weight * bone.x;
        m.y += weight * bone.y;
        m.z += weight * bone.z;
        m.offset += weight * bone.offset;
    }
    const QVector3D& p = mesh.positions[vertex];
    block.positions.set(slot, p.x() * m.x + p.y() * m.y + p.z() * m.z + m.offset);

    // Normals are transformed by the cofactors, whose sign keeps them outside of a mirrored mesh.
    const Float4 first = cross(m.y, m.z);
    const Float4 volume = m.x * first;
    const float sign = volume[0] + volume[1] + volume[2] < 0 ? -1.0F : 1.0F;
    const QVector3D n = sign * mesh.normals[vertex];
    block.normals.set(slot, n.x() * first + n.y() * cross(m.z, m.x) + n.z() * cross(m.x, m.y));
}

void copyVertex(const Mesh& mesh, std::size_t vertex, Block& block, std::size_t slot)
{
    const QVector3D& p = mesh.positions[vertex];
    const QVector3D& n = mesh.normals[vertex];
    block.positions.set(slot, Float4{p.x(), p.y(), p.z(), 0});
    block.normals.set(slot, Float4{n.x(), n.y(), n.z(), 0});
}

void twist(const TwistPose& pose, std::size_t count, Block& block)
{
    const MatrixRows& m = pose.toTwist;
    const MatrixRows& w = pose.fromTwist;
    auto& [px, py, pz] = block.positions;
    auto& [nx, ny, nz] = block.normals;
    for (std::size_t i = 0; i < count; ++i) {
        const float x = m[0] * px[i] + m[1] * py[i] + m[2] * pz[i] + m[3];
        const float y = m[4] * px[i] + m[5] * py[i] + m[6] * pz[i] + m[7];
        const float z = m[8] * px[i] + m[9] * py[i] + m[10] * pz[i] + m[11];
        const float u = w[0] * nx[i] + w[4] * ny[i] + w[8] * nz[i];
        const float t = w[2] * nx[i] + w[6] * ny[i] + w[10] * nz[i];
        const float v =
            w[1] * nx[i] + w[5] * ny[i] + w[9] * nz[i] - pose.anglePerHeight * (z * u - x * t);
        const float c = std::cos(pose.anglePerHeight * y);
        const float s = std::sin(pose.anglePerHeight * y);
        const float turnedX = c * x + s * z;
        const float turnedZ = c * z - s * x;
        px[i] = w[0] * turnedX + w[1] * y + w[2] * turnedZ + w[3];
        py[i] = w[4] * turnedX + w[5] * y + w[6] * turnedZ + w[7];
        pz[i] = w[8] * turnedX + w[9] * y + w[10] * turnedZ + w[11];
        const float turnedU = c * u + s * t;
        const float turnedT = c * t - s * u;
        const float a = m[0] * turnedU + m[4] * v + m[8] * turnedT;
        const float b = m[1] * turnedU + m[5] * v + m[9] * turnedT;
        const float d = m[2] * turnedU + m[6] * v + m[10] * turnedT;
        const float inverseLength = 1.0F / std::sqrt(a * a + b * b + d * d);
        nx[i] = a * inverseLength;
        ny[i] = b * inverseLength;
        nz[i] = d * inverseLength;
    }
}

// Deforms the vertices from `begin` up to `end`.
void deformRange(const viewer::CharacterMesh& character, const TwistPose& pose, std::size_t begin,
                 std::size_t end, vyra::Vector3* positions, vyra::Vector3* normals)
{
    const Mesh& mesh = character.mesh();
    std::vector<Columns> bones(character.pose.bones.size());
    std::transform(character.pose.bones.begin(), character.pose.bones.end(), bones.begin(),
                   columnsOf);
    Block block;
    for (std::size_t first = begin; first < end; first += kBlock) {
        const std::size_t count = std::min(kBlock, end - first);
        for (std::size_t i = 0; i < count; ++i) {
            if (mesh.hasBones())
                skinVertex(mesh, bones, first + i, block, i);
            else
                copyVertex(mesh, first + i, block, i);
        }
        twist(pose, count, block);
        for (std::size_t i = 0; i < count; ++i) {
            const Components& p = block.positions;
            const Components& n = block.normals;
            positions[first + i] = {p.x[i], p.y[i], p.z[i]};
            normals[first + i] = {n.x[i], n.y[i], n.z[i]};
        }
    }
}

class PlainSkinTwist final : public CpuDeformation {
public:
    explicit PlainSkinTwist(const viewer::Scene& scene) : fScene(scene) {}

    void deform(std::size_t mesh, vyra::Vector3* positions, vyra::Vector3* normals) override
    {
        const viewer::CharacterMesh& character = *fScene.meshes()[mesh];
        const TwistPose pose = twistPoseOf(character);
        using Range = tbb::blocked_range<std::size_t>;
        tbb::parallel_for(
            Range(0, character.mesh().vertexCount(), kGrain), [&](const Range& range) {
                deformRange(character, pose, range.begin(), range.end(), positions, normals);
            });
    }

private:
    const viewer::Scene& fScene;
};

} // namespace

std::unique_ptr<CpuDeformation> makePlainSkinTwist(const viewer::Scene& scene)
{
    return std::make_unique<PlainSkinTwist>(scene);
}
