#include "viewer/render/Scene.h"

#include "viewer/model/DetailLevel.h"
#include "viewer/model/Pose.h"

#include <algorithm>
#include <cmath>
#include <utility>

#include <QtMath>
#include <tbb/parallel_for.h>

namespace viewer {
namespace {

// Distance between neighbours, in largest extents of a character.
constexpr float kGap = 0.25f;
// Difference of phase between neighbours, in cycles. With the golden ratio, no two move alike.
constexpr double kPhaseStep = 0.61803398875;
// Range of the phases of a model without an animation.
constexpr double kPhaseSpread = 4.0; // seconds
// Twist between feet and head that the framed outline includes, in radians.
constexpr float kFramedTwist = 0.5f;
constexpr double kFullTurn = 6.28318530718;
// Largest difference of a tint from white.
constexpr float kTintDepth = 0.13f;

// Square grid of characters, centred at the origin.
class Grid {
public:
    Grid(int crowd, const QVector3D& character)
        : fColumns(static_cast<int>(std::ceil(std::sqrt(static_cast<double>(crowd))))),
          fRows((crowd + fColumns - 1) / fColumns), fCharacter(character)
    {
    }

    QMatrix4x4 placement(int number) const
    {
        const int row = number / fColumns;
        const int column = number % fColumns;
        QMatrix4x4 placement;
        placement.translate(fromMiddle(column, fColumns) * (fCharacter.x() + kGap), 0,
                            fromMiddle(row, fRows) * (fCharacter.z() + kGap));
        return placement;
    }

    QVector3D size() const
    {
        return {static_cast<float>(fColumns) * (fCharacter.x() + kGap) - kGap, fCharacter.y(),
                static_cast<float>(fRows) * (fCharacter.z() + kGap) - kGap};
    }

private:
    static float fromMiddle(int index, int count)
    {
        return static_cast<float>(index) - 0.5f * static_cast<float>(count - 1);
    }

    int fColumns;
    int fRows;
    QVector3D fCharacter; // size of one
};

QVector3D tintOf(int number)
{
    if (number == 0)
        return {1, 1, 1};
    const double angle = kFullTurn * kPhaseStep * number;
    const auto channel = [angle](double shift) {
        return 1.0f - kTintDepth * static_cast<float>(0.5 + 0.5 * std::cos(angle + shift));
    };
    return {channel(0), channel(kFullTurn / 3), channel(2 * kFullTurn / 3)};
}

// Returns the points, and the points after the largest twist in both directions.
std::vector<QVector3D> twisted(const std::vector<QVector3D>& points, float height)
{
    const float perHeight = qRadiansToDegrees(kFramedTwist) / std::max(height, kGap);
    std::vector<QVector3D> result = points;
    for (const float angle : {-perHeight, perHeight}) {
        for (const QVector3D& point : points) {
            QMatrix4x4 turn;
            turn.rotate(angle * point.y(), 0, 1, 0);
            result.push_back(turn.map(point));
        }
    }
    return result;
}

// Returns directions spread evenly over the sphere, on a spiral from pole to pole.
std::vector<QVector3D> evenDirections()
{
    constexpr int kDirections = 200;
    std::vector<QVector3D> directions;
    for (int i = 0; i < kDirections; ++i) {
        const double y = 1 - (2 * i + 1.0) / kDirections;
        const double radius = std::sqrt(1 - y * y);
        const double angle = kFullTurn * kPhaseStep * i;
        directions.emplace_back(radius * std::cos(angle), y, radius * std::sin(angle));
    }
    return directions;
}

QVector3D outermost(const std::vector<QVector3D>& points, const QVector3D& direction)
{
    return *std::max_element(points.begin(), points.end(), [&](const auto& a, const auto& b) {
        return QVector3D::dotProduct(a, direction) < QVector3D::dotProduct(b, direction);
    });
}

GLuint createIndexBuffer(QOpenGLFunctions_3_3_Core& gl, const Mesh& mesh)
{
    GLuint buffer = 0;
    gl.glGenBuffers(1, &buffer);
    gl.glBindVertexArray(0);
    gl.glBindBuffer(GL_ELEMENT_ARRAY_BUFFER, buffer);
    gl.glBufferData(GL_ELEMENT_ARRAY_BUFFER,
                    static_cast<GLsizeiptr>(mesh.triangles.size() * sizeof(std::uint32_t)),
                    mesh.triangles.data(), GL_STATIC_DRAW);
    return buffer;
}

} // namespace

Scene::Scene(QOpenGLFunctions_3_3_Core& gl, const Model& model, const Animation* animation,
             int crowd)
    : fGL(gl), fModel(model), fAnimation(animation), fSpace(characterSpace(model, animation)),
      fRest(poseAt(model, nullptr, 0))
{
    for (const Mesh& mesh : fModel.meshes) {
        auto levels = std::make_unique<MeshLevels>();
        levels->meshes[0] = mesh;
        levels->meshes[1] = coarserMesh(mesh);
        for (std::size_t level = 0; level < MeshLevels::kCount; ++level) {
            levels->shapes[level] = shapeOf(levels->meshes[level]);
            levels->indexBuffers[level] = createIndexBuffer(gl, levels->meshes[level]);
        }
        fLevels.push_back(std::move(levels));
    }

    const Grid grid(crowd, fSpace.size);
    for (int i = 0; i < crowd; ++i)
        createCharacter(grid.placement(i), i, crowd);
    fSize = grid.size();
}

Scene::~Scene()
{
    for (CharacterMesh* mesh : fMeshes) {
        if (mesh->deformable)
            fEvaluator->destroyMesh(*mesh->deformable);
        mesh->positions.destroy(fGL);
        mesh->normals.destroy(fGL);
        fGL.glDeleteVertexArrays(1, &mesh->vertexArray);
    }
    for (const auto& levels : fLevels)
        fGL.glDeleteBuffers(MeshLevels::kCount, levels->indexBuffers);
}

bool Scene::hasExtent() const
{
    const float extent = fSpace.size.length();
    return std::isfinite(extent) && extent > 0;
}

// All characters have the same outline, so the outermost point in a direction belongs to the
// outermost character.
std::vector<QVector3D> Scene::outline() const
{
    std::vector<QVector3D> places;
    for (const Character& character : fCharacters)
        places.push_back(character.placement.map(QVector3D()));
    const std::vector<QVector3D> character = twisted(fSpace.outline, fSpace.size.y());
    std::vector<QVector3D> points;
    for (const QVector3D& direction : evenDirections())
        points.push_back(outermost(places, direction) + outermost(character, direction));
    return points;
}

void Scene::createCharacter(const QMatrix4x4& placement, int number, int crowd)
{
    Character character;
    character.placement = placement;
    character.tint = crowd > 1 ? tintOf(number) : QVector3D(1, 1, 1);
    const double cycle = fAnimation ? fAnimation->seconds : 0.0;
    character.phase = std::fmod(kPhaseStep * number, 1.0) * std::max(cycle, kPhaseSpread);
    for (const auto& levels : fLevels) {
        auto mesh = std::make_unique<CharacterMesh>();
        mesh->levels = levels.get();
        createBuffers(*mesh);
        fMeshes.push_back(mesh.get());
        character.meshes.push_back(std::move(mesh));
    }
    fCharacters.push_back(std::move(character));
}

void Scene::createBuffers(CharacterMesh& mesh)
{
    mesh.positions.create(fGL, mesh.shape().geometry->rest.positions);
    mesh.normals.create(fGL, mesh.shape().geometry->rest.normals);
    fGL.glGenVertexArrays(1, &mesh.vertexArray);
    fGL.glBindVertexArray(mesh.vertexArray);
    const VertexBuffer* attributes[] = {&mesh.positions, &mesh.normals};
    for (GLuint location = 0; location < 2; ++location) {
        fGL.glBindBuffer(GL_ARRAY_BUFFER, attributes[location]->name());
        fGL.glVertexAttribPointer(location, 3, GL_FLOAT, GL_FALSE, 0, nullptr);
        fGL.glEnableVertexAttribArray(location);
    }
    fGL.glBindBuffer(GL_ELEMENT_ARRAY_BUFFER, mesh.levels->indexBuffers[mesh.level]);
    fGL.glBindVertexArray(0);
}

void Scene::attach(vyra::Evaluator& evaluator, std::vector<DeformerChoice> deformers)
{
    fEvaluator = &evaluator;
    fDeformers = std::move(deformers);
    for (CharacterMesh* mesh : fMeshes)
        attach(*mesh);
}

void Scene::attach(CharacterMesh& mesh)
{
    mesh.deformable = &fEvaluator->createMesh(mesh.shape().geometry,
                                              {mesh.positions.name(), mesh.normals.name()});
    fByDeformable[mesh.deformable] = &mesh;
    addDeformers(fDeformers, mesh.shape(), *mesh.deformable);
    applyPose(fDeformers, mesh.shape(), mesh.pose, *mesh.deformable);
}

void Scene::toggleDeformers()
{
    const bool anyEnabled = std::any_of(fDeformers.begin(), fDeformers.end(),
                                        [](const DeformerChoice& each) { return each.enabled; });
    for (DeformerChoice& deformer : fDeformers)
        deformer.enabled = !anyEnabled;
}

void Scene::toggleDeformer(std::size_t index)
{
    if (index < fDeformers.size())
        fDeformers[index].enabled = !fDeformers[index].enabled;
}

void Scene::changeLevel(CharacterMesh& mesh)
{
    if (mesh.deformable) {
        fByDeformable.erase(mesh.deformable);
        fEvaluator->destroyMesh(*mesh.deformable);
    }
    mesh.positions.destroy(fGL);
    mesh.normals.destroy(fGL);
    fGL.glDeleteVertexArrays(1, &mesh.vertexArray);
    mesh.level = (mesh.level + 1) % MeshLevels::kCount;
    createBuffers(mesh);
    if (fEvaluator)
        attach(mesh);
}

void Scene::pose(double seconds)
{
    tbb::parallel_for(std::size_t{0}, fCharacters.size(), [&](std::size_t i) {
        poseCharacter(fCharacters[i], seconds + fCharacters[i].phase);
    });
}

void Scene::poseCharacter(Character& character, double seconds) const
{
    poseAt(fModel, fAnimation, seconds, character.pose);
    for (const auto& mesh : character.meshes) {
        MeshPose& pose = mesh->pose;
        boneMatrices(mesh->mesh(), character.pose, pose.bones);
        morphWeights(mesh->mesh(), fAnimation, seconds, pose.morphWeights);
        pose.seconds = seconds;
        pose.height = fSpace.size.y();
        pose.skinnedToCharacter = fSpace.fromModel * meshToModel(mesh->mesh(), character.pose);
        pose.restToCharacter = mesh->mesh().hasBones()
                                   ? fSpace.fromModel * restToModel(mesh->mesh(), fRest)
                                   : pose.skinnedToCharacter;
        if (mesh->deformable)
            applyPose(fDeformers, mesh->shape(), pose, *mesh->deformable);
    }
}

} // namespace viewer
