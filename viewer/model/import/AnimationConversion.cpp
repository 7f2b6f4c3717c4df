#include "viewer/model/import/AnimationConversion.h"

#include <algorithm>
#include <cmath>
#include <utility>
#include <vector>

#include <assimp/scene.h>

namespace viewer {
namespace {

// For files without a tick rate; Assimp's documentation recommends this value.
constexpr double kDefaultTicksPerSecond = 25.0;

// Removes keys whose time overflowed, and sorts the others: Assimp only warns about unsorted keys.
template <typename Keys>
Keys sortedByTime(Keys keys)
{
    std::erase_if(keys, [](const auto& key) { return !std::isfinite(key.seconds); });
    std::stable_sort(keys.begin(), keys.end(),
                     [](const auto& a, const auto& b) { return a.seconds < b.seconds; });
    return keys;
}

template <typename SourceKey, typename Convert>
auto convertKeys(const SourceKey* source, unsigned count, double ticksPerSecond, Convert convert)
{
    std::vector<Key<decltype(convert(source->mValue))>> keys;
    for (unsigned i = 0; i < count; ++i)
        keys.push_back({source[i].mTime / ticksPerSecond, convert(source[i].mValue)});
    return sortedByTime(std::move(keys));
}

Channel convertChannel(const aiNodeAnim& source, std::size_t node, double ticksPerSecond)
{
    const auto vector = [](const aiVector3D& value) { return toQt(value); };
    const auto rotation = [](const aiQuaternion& value) {
        const QQuaternion quaternion(value.w, value.x, value.y, value.z);
        return quaternion.isNull() ? QQuaternion() : quaternion.normalized();
    };
    return {node,
            convertKeys(source.mPositionKeys, source.mNumPositionKeys, ticksPerSecond, vector),
            convertKeys(source.mRotationKeys, source.mNumRotationKeys, ticksPerSecond, rotation),
            convertKeys(source.mScalingKeys, source.mNumScalingKeys, ticksPerSecond, vector)};
}

// A file may name arbitrarily large target indices, so the number of weights is limited.
MorphChannel convertMorphChannel(const aiMeshMorphAnim& source, std::size_t node,
                                 double ticksPerSecond, std::size_t targetCount)
{
    MorphChannel channel{node, {}};
    for (unsigned i = 0; i < source.mNumKeys; ++i) {
        const aiMeshMorphKey& key = source.mKeys[i];
        std::vector<float> weights;
        for (unsigned value = 0; value < key.mNumValuesAndWeights; ++value) {
            const std::size_t target = key.mValues[value];
            if (target >= targetCount)
                continue;
            if (target >= weights.size())
                weights.resize(target + 1);
            weights[target] = finiteOrZero(static_cast<float>(key.mWeights[value]));
        }
        channel.weights.push_back({key.mTime / ticksPerSecond, std::move(weights)});
    }
    channel.weights = sortedByTime(std::move(channel.weights));
    return channel;
}

} // namespace

Animation convertAnimation(const aiAnimation& source, const NodeIndex& nodes,
                           std::size_t targetCount)
{
    const double ticksPerSecond =
        source.mTicksPerSecond > 0 ? source.mTicksPerSecond : kDefaultTicksPerSecond;
    const double seconds = source.mDuration / ticksPerSecond;
    Animation animation{
        source.mName.C_Str(), std::isfinite(seconds) ? std::max(seconds, 0.0) : 0, {}};
    for (unsigned i = 0; i < source.mNumChannels; ++i) {
        const aiNodeAnim& channel = *source.mChannels[i];
        if (const auto node = nodes.find(channel.mNodeName.C_Str()); node != nodes.end())
            animation.channels.push_back(convertChannel(channel, node->second, ticksPerSecond));
    }
    for (unsigned i = 0; i < source.mNumMorphMeshChannels; ++i) {
        const aiMeshMorphAnim& channel = *source.mMorphMeshChannels[i];
        const auto node = nodes.find(channel.mName.C_Str());
        if (node == nodes.end())
            continue;
        MorphChannel converted =
            convertMorphChannel(channel, node->second, ticksPerSecond, targetCount);
        if (!converted.weights.empty())
            animation.morphChannels.push_back(std::move(converted));
    }
    return animation;
}

} // namespace viewer
