#include "viewer/model/import/SceneConversion.h"

#include "viewer/model/import/AnimationConversion.h"
#include "viewer/model/import/AssimpConversion.h"
#include "viewer/model/import/MeshConversion.h"
#include "viewer/model/import/UprightRotation.h"

#include <algorithm>

#include <assimp/scene.h>

namespace viewer {
namespace {

void addNodes(const aiNode& source, std::size_t parent, Model& model)
{
    const std::size_t index = model.nodes.size();
    model.nodes.push_back({source.mName.C_Str(), parent, toQt(source.mTransformation)});
    for (unsigned i = 0; i < source.mNumChildren; ++i)
        addNodes(*source.mChildren[i], index, model);
}

NodeIndex indexByName(const Model& model)
{
    NodeIndex index;
    for (std::size_t i = 0; i < model.nodes.size(); ++i)
        index.emplace(model.nodes[i].name, i);
    return index;
}

// Adds a mesh for each node that uses it. Visits the nodes in the order of addNodes: `node` is the
// index of `source`, and on return that of the next node.
void addMeshes(const aiScene& scene, const aiNode& source, const NodeIndex& nodes,
               double creaseAngle, std::size_t& node, Model& model)
{
    for (unsigned i = 0; i < source.mNumMeshes; ++i) {
        const aiMesh& mesh = *scene.mMeshes[source.mMeshes[i]];
        if ((mesh.mPrimitiveTypes & aiPrimitiveType_TRIANGLE) != 0)
            model.meshes.push_back(convertMesh(scene, mesh, node, nodes, creaseAngle));
    }
    ++node;
    for (unsigned i = 0; i < source.mNumChildren; ++i)
        addMeshes(scene, *source.mChildren[i], nodes, creaseAngle, node, model);
}

} // namespace

Model convertScene(const aiScene& scene, const ImportSettings& settings)
{
    Model model;
    // An additional root turns the model upright; the file's nodes are its descendants.
    model.nodes.push_back({"vyra-viewer upright", 0, uprightRotation(scene, settings.up)});
    addNodes(*scene.mRootNode, 0, model);
    const NodeIndex nodes = indexByName(model);
    std::size_t firstNode = 1;
    addMeshes(scene, *scene.mRootNode, nodes, settings.creaseAngle, firstNode, model);
    std::size_t targetCount = 0;
    for (const Mesh& mesh : model.meshes)
        targetCount = std::max(targetCount, mesh.morphTargets.size());
    for (unsigned i = 0; i < scene.mNumAnimations; ++i)
        model.animations.push_back(convertAnimation(*scene.mAnimations[i], nodes, targetCount));
    return model;
}

} // namespace viewer
