#include "frames/Content.h"

#include "viewer/opencl/Verification.h"

#include <stdexcept>
#include <utility>

namespace {

constexpr std::size_t kTargets = 8;
constexpr float kSmallest = 0.01F; // the part of a coordinate that the first target adds

// Ten iterations shrink small triangles, which makes their normals less exact.
constexpr double kSmoothedNormalBound = 1e-3;

void addNothing(viewer::Model& /*model*/) {}

// The shape of the targets does not affect their cost. All have a weight in each frame.
void addTargets(viewer::Model& model)
{
    for (viewer::Mesh& mesh : model.meshes) {
        mesh.bones.clear(); // the chain has no skin
        for (std::size_t target = 0; target < kTargets; ++target) {
            const float part = kSmallest * static_cast<float>(target + 1);
            viewer::MorphTarget added;
            for (std::size_t i = 0; i < mesh.vertexCount(); ++i) {
                added.positionDeltas.push_back(part * mesh.positions[i]);
                added.normalDeltas.push_back(part *
                                             mesh.normals[(i + target) % mesh.vertexCount()]);
            }
            added.weight = 0.5F;
            mesh.morphTargets.push_back(std::move(added));
        }
    }
}

} // namespace

const std::vector<Content>& contents()
{
    static const std::vector<Content> theContents{{"skin-twist",
                                                   "skin,twist",
                                                   {1, 2, 5, 16, 50, 156, 500, 1560},
                                                   addNothing,
                                                   makeSkinTwist,
                                                   makePlainSkinTwist,
                                                   viewer::kNormalBound},
                                                  {"double-skin",
                                                   "skin:precision=double,twist",
                                                   {156},
                                                   addNothing,
                                                   makeSkinTwist,
                                                   nullptr,
                                                   viewer::kNormalBound},
                                                  {"morph-smooth",
                                                   "morph,smooth:iterations=10",
                                                   {1, 16, 156},
                                                   addTargets,
                                                   makeMorphSmooth,
                                                   nullptr,
                                                   kSmoothedNormalBound}};
    return theContents;
}

const Content& contentOf(const std::string& name)
{
    std::string names;
    for (const Content& content : contents()) {
        if (content.name == name)
            return content;
        names += (names.empty() ? "" : ", ") + std::string(content.name);
    }
    throw std::runtime_error("there is no content '" + name + "'; there are " + names);
}
