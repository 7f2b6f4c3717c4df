// A character as it comes from a file: meshes, skeleton, animations.
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

// A vertex follows at most this many bones.
inline constexpr std::size_t kBonesPerVertex = 4;

using BoneIndices = std::array<std::uint32_t, kBonesPerVertex>;
using BoneWeights = std::array<float, kBonesPerVertex>;

struct Bone {
    std::size_t node;  // index into Model::nodes
    QMatrix4x4 offset; // from the mesh's space at rest to the bone's
};

// What a morph target adds to each vertex of the mesh at rest, at weight 1.
struct MorphTarget {
    std::vector<QVector3D> positionDeltas;
    std::vector<QVector3D> normalDeltas; // empty: normals stay
    float weight = 0;                    // without an animation
};

// All per-vertex arrays have the same length. `bones`, `boneIndices` and `boneWeights` are empty in
// a mesh without bones, which moves with its node as a whole; else the weights of a vertex add up
// to 1.
struct Mesh {
    std::string name;
    std::size_t node = 0; // index into Model::nodes
    QVector3D colour;     // of its material, sRGB

    std::vector<QVector3D> positions; // at rest
    std::vector<QVector3D> normals;   // at rest, of length 1
    std::vector<BoneIndices> boneIndices;
    std::vector<BoneWeights> boneWeights;
    std::vector<std::uint32_t> triangles; // three vertices each
    std::vector<Bone> bones;
    std::vector<MorphTarget> morphTargets;

    std::size_t vertexCount() const { return positions.size(); }
    bool hasBones() const { return !bones.empty(); }
};

struct Node {
    std::string name;
    std::size_t parent; // smaller than the node's own index; the root's own index for the root
    QMatrix4x4 local;   // to the parent's space, at rest
};

template <typename T>
struct Key {
    double seconds;
    T value;
};

// How one node moves: its local transform is replaced by translation * rotation * scale. Each list
// is in the order of time; an empty one stands for none.
struct Channel {
    std::size_t node;
    std::vector<Key<QVector3D>> positions;
    std::vector<Key<QQuaternion>> rotations;
    std::vector<Key<QVector3D>> scales;
};

// How the weights of the morph targets change in the meshes of one node: one weight per target.
struct MorphChannel {
    std::size_t node;
    std::vector<Key<std::vector<float>>> weights; // in the order of time, at least one
};

struct Animation {
    std::string name;
    double seconds; // length of one cycle; 0 for a still
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
