// A model: meshes, skeleton, animations.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

#include <QMatrix4x4>
#include <QQuaternion>
#include <QVector3D>

namespace viewer {

// Most bones that influence one vertex.
inline constexpr std::size_t kBonesPerVertex = 4;

using BoneIndices = std::array<std::uint32_t, kBonesPerVertex>;
using BoneWeights = std::array<float, kBonesPerVertex>;

struct Bone {
    std::size_t node;  // index into Model::nodes
    QMatrix4x4 offset; // from the mesh's rest space to the bone's space (inverse bind matrix)
};

// Differences that a morph target adds to each vertex of the mesh at rest, at weight 1.
struct MorphTarget {
    std::vector<QVector3D> positionDeltas;
    std::vector<QVector3D> normalDeltas; // empty: normals do not change
    float weight = 0;                    // while no animation sets it
};

// All per-vertex arrays have the same length. The weights of a vertex add up to 1. In a mesh
// without bones, which moves rigidly with its node, `bones`, `boneIndices` and `boneWeights` are
// empty.
struct Mesh {
    std::string name;
    std::size_t node = 0; // index into Model::nodes
    QVector3D colour;     // of the material, sRGB

    std::vector<QVector3D> positions; // at rest
    std::vector<QVector3D> normals;   // at rest, of length 1
    std::vector<BoneIndices> boneIndices;
    std::vector<BoneWeights> boneWeights;
    std::vector<std::uint32_t> triangles; // three vertex indices each
    std::vector<Bone> bones;
    std::vector<MorphTarget> morphTargets;

    [[nodiscard]] std::size_t vertexCount() const noexcept { return positions.size(); }
    [[nodiscard]] bool hasBones() const noexcept { return !bones.empty(); }
};

struct Node {
    std::string name;
    std::size_t parent; // less than the node's own index; the root is its own parent
    QMatrix4x4 local;   // from the node's space to the parent's, at rest
};

template <typename T>
struct Key {
    double seconds;
    T value;
};

// Motion of one node: translation * rotation * scale replaces its local transform. Each list is
// sorted by time; an empty list is the identity.
struct Channel {
    std::size_t node;
    std::vector<Key<QVector3D>> positions;
    std::vector<Key<QQuaternion>> rotations;
    std::vector<Key<QVector3D>> scales;
};

// Weights of the morph targets in the meshes of one node. A key has one weight per target.
struct MorphChannel {
    std::size_t node;
    std::vector<Key<std::vector<float>>> weights; // sorted by time, at least one
};

struct Animation {
    std::string name;
    double seconds; // length of one cycle; 0 for a static pose
    std::vector<Channel> channels;
    std::vector<MorphChannel> morphChannels = {};
};

struct Model {
    std::vector<Node> nodes; // parents before children
    std::vector<Mesh> meshes;
    std::vector<Animation> animations;
};

// The kernels read positions and normals as packed floats.
static_assert(sizeof(QVector3D) == 3 * sizeof(float));
static_assert(sizeof(BoneIndices) == kBonesPerVertex * sizeof(std::uint32_t));

} // namespace viewer
