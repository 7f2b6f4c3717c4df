// Characters of the viewer, with their vertex buffers.
#pragma once

#include "viewer/model/CharacterSpace.h"
#include "viewer/model/DeformerChain.h"
#include "viewer/model/MeshShape.h"
#include "viewer/model/Model.h"
#include "viewer/model/Pose.h"
#include "viewer/render/VertexBuffer.h"

#include "evaluator/Evaluator.h"

#include <cstdint>
#include <memory>
#include <string>
#include <unordered_map>
#include <vector>

#include <QMatrix4x4>
#include <QOpenGLFunctions_3_3_Core>
#include <QVector3D>

namespace viewer {

// Levels of detail of one mesh, shared by all characters.
struct MeshLevels {
    static constexpr std::size_t kCount = 2;
    Mesh meshes[kCount]; // finest first
    MeshShape shapes[kCount];
    GLuint indexBuffers[kCount] = {};
};

// One mesh of one character.
struct CharacterMesh {
    const MeshLevels* levels = nullptr;
    std::size_t level = 0;
    VertexBuffer positions;
    VertexBuffer normals;
    GLuint vertexArray = 0;
    vyra::DeformableMesh* deformable = nullptr; // owned by the evaluator; null before attach()
    MeshPose pose;

    [[nodiscard]] const Mesh& mesh() const noexcept { return levels->meshes[level]; }
    [[nodiscard]] const MeshShape& shape() const noexcept { return levels->shapes[level]; }
};

struct Character {
    QMatrix4x4 placement; // from character space to world space
    QVector3D tint;       // factor of the colours, near 1, to distinguish neighbours
    double phase = 0;     // offset of the animation time, seconds
    Pose pose;
    std::vector<std::unique_ptr<CharacterMesh>> meshes;
};

// Characters on a grid, each with its own animation time. In world space, the grid is centred at
// the origin, y is up, feet are at y = 0, and the largest extent of a character is 1. The OpenGL
// context must be current in all operations and the destructor.
class Scene {
public:
    // Borrows the OpenGL functions, the model and the animation, which is one of the model or null.
    // `crowd` is the number of characters.
    Scene(QOpenGLFunctions_3_3_Core& gl, const Model& model, const Animation* animation, int crowd);
    ~Scene();
    Scene(const Scene&) = delete;
    Scene& operator=(const Scene&) = delete;

    // Adds every mesh to the evaluator with the chain `deformers`. The evaluator is borrowed and
    // must outlive the scene.
    void attach(vyra::Evaluator& evaluator, std::vector<DeformerChoice> deformers);

    // Disables all deformers if any is enabled, else enables all, from the next pose() on.
    void toggleDeformers();
    // Toggles the deformer at this index of the chain. Ignores an index past the end.
    void toggleDeformer(std::size_t index);
    [[nodiscard]] const std::vector<DeformerChoice>& deformers() const noexcept
    {
        return fDeformers;
    }

    // Computes the pose of every character at this time, in parallel.
    void pose(double seconds);

    // Switches a mesh to its other level of detail, which re-creates both vertex buffers. Must not
    // be called while deformers run.
    void changeLevel(CharacterMesh& mesh);

    [[nodiscard]] const std::vector<Character>& characters() const noexcept { return fCharacters; }
    // All meshes of all characters.
    [[nodiscard]] const std::vector<CharacterMesh*>& meshes() const noexcept { return fMeshes; }
    // Returns the mesh of `deformable`. Throws std::out_of_range if it is not of this scene.
    [[nodiscard]] const CharacterMesh& meshOf(const vyra::DeformableMesh& deformable) const
    {
        return *fByDeformable.at(&deformable);
    }
    [[nodiscard]] std::size_t meshesPerCharacter() const noexcept { return fLevels.size(); }
    // Extent of the grid of characters in world space.
    [[nodiscard]] QVector3D size() const noexcept { return fSize; }
    // Returns whether the extent of the model over the animation is finite and not 0. A model
    // without extent is invisible.
    [[nodiscard]] bool hasExtent() const;
    // Returns the outermost points of all characters over the animation, in many directions.
    [[nodiscard]] std::vector<QVector3D> outline() const;

private:
    void createCharacter(const QMatrix4x4& placement, int number, int crowd);
    void createBuffers(CharacterMesh& mesh);
    void attach(CharacterMesh& mesh);
    void poseCharacter(Character& character, double seconds) const;

    QOpenGLFunctions_3_3_Core& fGL;
    const Model& fModel;
    const Animation* fAnimation;
    CharacterSpace fSpace;
    Pose fRest;
    QVector3D fSize;
    std::vector<std::unique_ptr<MeshLevels>> fLevels;
    std::vector<Character> fCharacters;
    std::vector<CharacterMesh*> fMeshes;
    vyra::Evaluator* fEvaluator = nullptr; // null until attach()
    std::unordered_map<const vyra::DeformableMesh*, const CharacterMesh*> fByDeformable;
    std::vector<DeformerChoice> fDeformers;
};

} // namespace viewer
