#include "viewer/model/Pose.h"

#include <algorithm>
#include <cmath>

namespace viewer {
namespace {

QVector3D mix(const QVector3D& from, const QVector3D& to, float fraction)
{
    return from + (to - from) * fraction;
}

QQuaternion mix(const QQuaternion& from, const QQuaternion& to, float fraction)
{
    return QQuaternion::slerp(from, to, fraction);
}

// A key may hold fewer weights than the next one; the missing weights are 0.
std::vector<float> mix(const std::vector<float>& from, const std::vector<float>& to, float fraction)
{
    std::vector<float> result(std::max(from.size(), to.size()));
    for (std::size_t i = 0; i < result.size(); ++i) {
        const float begin = i < from.size() ? from[i] : 0.0f;
        const float end = i < to.size() ? to[i] : 0.0f;
        result[i] = begin + (end - begin) * fraction;
    }
    return result;
}

template <typename T>
T sampleKeys(const std::vector<Key<T>>& keys, double seconds)
{
    const auto next =
        std::upper_bound(keys.begin(), keys.end(), seconds,
                         [](double time, const auto& key) { return time < key.seconds; });
    if (next == keys.begin())
        return keys.front().value;
    if (next == keys.end())
        return keys.back().value;
    const Key<T>& before = *(next - 1);
    const double fraction = (seconds - before.seconds) / (next->seconds - before.seconds);
    return mix(before.value, next->value, static_cast<float>(fraction));
}

QMatrix4x4 localTransform(const Channel& channel, double seconds)
{
    QMatrix4x4 local;
    if (!channel.positions.empty())
        local.translate(sample(channel.positions, seconds));
    if (!channel.rotations.empty())
        local.rotate(sample(channel.rotations, seconds));
    if (!channel.scales.empty())
        local.scale(sample(channel.scales, seconds));
    return local;
}

double wrapped(double seconds, double length)
{
    return length > 0 ? seconds - length * std::floor(seconds / length) : 0.0;
}

} // namespace

QVector3D sample(const std::vector<Key<QVector3D>>& keys, double seconds)
{
    return sampleKeys(keys, seconds);
}

QQuaternion sample(const std::vector<Key<QQuaternion>>& keys, double seconds)
{
    return sampleKeys(keys, seconds);
}

Pose poseAt(const Model& model, const Animation* animation, double seconds)
{
    Pose pose;
    poseAt(model, animation, seconds, pose);
    return pose;
}

void poseAt(const Model& model, const Animation* animation, double seconds, Pose& pose)
{
    pose.resize(model.nodes.size());
    std::transform(model.nodes.begin(), model.nodes.end(), pose.begin(),
                   [](const Node& node) { return node.local; });
    if (animation) {
        const double time = wrapped(seconds, animation->seconds);
        for (const Channel& channel : animation->channels)
            pose[channel.node] = localTransform(channel, time);
    }
    for (std::size_t i = 0; i < pose.size(); ++i) {
        if (model.nodes[i].parent != i)
            pose[i] = pose[model.nodes[i].parent] * pose[i];
    }
}

vyra::MatrixRows rowsOf(const QMatrix4x4& matrix)
{
    vyra::MatrixRows rows;
    auto next = rows.begin();
    for (int row = 0; row < 3; ++row) {
        for (int column = 0; column < 4; ++column)
            *next++ = matrix(row, column);
    }
    return rows;
}

std::vector<vyra::MatrixRows> boneMatrices(const Mesh& mesh, const Pose& pose)
{
    std::vector<vyra::MatrixRows> matrices;
    boneMatrices(mesh, pose, matrices);
    return matrices;
}

void boneMatrices(const Mesh& mesh, const Pose& pose, std::vector<vyra::MatrixRows>& matrices)
{
    matrices.resize(mesh.bones.size());
    std::transform(mesh.bones.begin(), mesh.bones.end(), matrices.begin(),
                   [&pose](const Bone& bone) { return rowsOf(pose[bone.node] * bone.offset); });
}

void morphWeights(const Mesh& mesh, const Animation* animation, double seconds,
                  std::vector<float>& weights)
{
    weights.resize(mesh.morphTargets.size());
    std::transform(mesh.morphTargets.begin(), mesh.morphTargets.end(), weights.begin(),
                   [](const MorphTarget& target) { return target.weight; });
    if (!animation || weights.empty())
        return;
    for (const MorphChannel& channel : animation->morphChannels) {
        if (channel.node != mesh.node)
            continue;
        const std::vector<float> sampled =
            sampleKeys(channel.weights, wrapped(seconds, animation->seconds));
        std::copy_n(sampled.begin(), std::min(sampled.size(), weights.size()), weights.begin());
    }
}

QMatrix4x4 meshToModel(const Mesh& mesh, const Pose& pose)
{
    return mesh.hasBones() ? QMatrix4x4() : pose[mesh.node];
}

QMatrix4x4 restToModel(const Mesh& mesh, const Pose& pose)
{
    if (!mesh.hasBones())
        return pose[mesh.node];
    const Bone& bone = mesh.bones.front();
    return pose[bone.node] * bone.offset;
}

} // namespace viewer
