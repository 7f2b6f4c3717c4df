#include "viewer/model/import/ModelImport.h"

#include "viewer/model/import/ModelFile.h"
#include "viewer/model/import/SceneConversion.h"
#include "viewer/model/import/SceneRepair.h"

#include <algorithm>
#include <cctype>
#include <exception>
#include <new>

#include <assimp/Importer.hpp>
#include <assimp/config.h>
#include <assimp/postprocess.h>
#include <assimp/scene.h>

namespace viewer {
namespace {

constexpr unsigned kPostProcessing = aiProcess_JoinIdenticalVertices | aiProcess_Triangulate |
                                     aiProcess_LimitBoneWeights | aiProcess_SortByPType;

Failure failure(const std::string& file, const std::string& text)
{
    return {ExitCode::kModel, "the model '" + file + "' " + text};
}

// Returns Assimp's reason on one line, shortened: it may quote the rest of the file.
std::string reasonOf(const Assimp::Importer& importer)
{
    constexpr std::size_t kLongestReason = 200;
    std::string reason = importer.GetErrorString();
    std::replace_if(
        reason.begin(), reason.end(), [](unsigned char letter) { return std::iscntrl(letter); },
        ' ');
    while (!reason.empty() && (reason.back() == ' ' || reason.back() == '.'))
        reason.pop_back();
    if (reason.size() > kLongestReason)
        reason = reason.substr(0, kLongestReason) + " ...";
    return reason.empty() ? "Assimp names no reason" : reason;
}

// Throws std::bad_alloc if the import failed for memory, which is not a fault of the file.
void throwIfMemoryRanOut(const Assimp::Importer& importer)
{
    if (!importer.GetException())
        return;
    try {
        std::rethrow_exception(importer.GetException());
    } catch (const std::bad_alloc&) {
        throw;
    } catch (...) { // NOLINT(bugprone-empty-catch): the error string has its text
    }
}

Failure unreadable(const std::string& file, const Assimp::Importer& importer)
{
    throwIfMemoryRanOut(importer);
    return failure(file, "cannot be read (" + reasonOf(importer) +
                             "); it may be truncated or damaged, or in a format that Assimp does "
                             "not support: export it again, best as glTF");
}

Result<Model> readModel(Assimp::Importer& importer, const std::string& file,
                        const ImportSettings& settings)
{
    importer.SetPropertyInteger(AI_CONFIG_PP_LBW_MAX_WEIGHTS, static_cast<int>(kBonesPerVertex));
    const aiScene* scene = importer.ReadFile(file, aiProcess_ValidateDataStructure);
    if (!scene || !scene->mRootNode)
        return unreadable(file, importer);
    if (const auto found = findNonFiniteNumber(*scene))
        return failure(file, "has a number that is infinite or not a number: " + *found +
                                 "; correct it in the program that made the file");
    // The importer owns the scene and returns it as const, although post-processing modifies it.
    rescaleExtremeScene(const_cast<aiScene&>(*scene));
    if (const auto found = findNonFiniteNumber(*scene))
        return failure(file, "has numbers that are too far apart: scaled to a usual size, " +
                                 *found + "; correct it in the program that made the file");
    scene = importer.ApplyPostProcessing(kPostProcessing);
    if (!scene)
        return unreadable(file, importer);
    return convertScene(*scene, settings);
}

bool hasArea(const Mesh& mesh)
{
    for (std::size_t i = 0; i + 2 < mesh.triangles.size(); i += 3) {
        const QVector3D& a = mesh.positions[mesh.triangles[i]];
        const QVector3D& b = mesh.positions[mesh.triangles[i + 1]];
        const QVector3D& c = mesh.positions[mesh.triangles[i + 2]];
        if (!QVector3D::crossProduct(b - a, c - a).isNull())
            return true;
    }
    return false;
}

} // namespace

Result<Model> importModel(const std::string& name, const ImportSettings& settings)
{
    const Result<std::string> file = findModelFile(name);
    if (!file)
        return file.failure();
    Assimp::Importer importer;
    Result<Model> model = readModel(importer, file.value(), settings);
    if (!model)
        return model;
    const std::vector<Mesh>& meshes = model.value().meshes;
    if (meshes.empty())
        return failure(file.value(), "has no meshes with triangles; give one that has something to "
                                     "draw");
    if (std::none_of(meshes.begin(), meshes.end(), hasArea))
        return failure(file.value(), "has no triangle with an area: all corners of each are on one "
                                     "point or line; give one that has something to draw");
    return model;
}

} // namespace viewer
