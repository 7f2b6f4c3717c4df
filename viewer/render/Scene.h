// The characters on the stage.
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

// The two levels of detail of a mesh, which all characters share.
struct MeshLevels {
    static constexpr std::size_t kCount = 2;
    Mesh meshes[kCount]; // the finest first
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
    vyra::DeformableMesh* deformable = nullptr; // the evaluator's; null in a scene without one
    MeshPose pose;

    const Mesh& mesh() const { return levels->meshes[level]; }
    const MeshShape& shape() const { return levels->shapes[level]; }
};

struct Character {
    QMatrix4x4 placement; // from the character's space to the stage
    QVector3D tint;       // that tells it from its neighbours, near 1
    double phase = 0;     // seconds ahead of the others
    Pose pose;
    std::vector<std::unique_ptr<CharacterMesh>> meshes;
};

// Characters on a grid, each at a moment of the animation of its own. All operations need the
// renderer's context to be current.
class Scene {
public:
    // Borrows the OpenGL functions and the model. `animation` is of the model, or null.
    Scene(QOpenGLFunctions_3_3_Core& gl, const Model& model, const Animation* animation, int crowd);
    ~Scene();
    Scene(const Scene&) = delete;
    Scene& operator=(const Scene&) = delete;

    // Adds every mesh to the evaluator, with these deformers. The evaluator is borrowed, and
    // destroyed after the scene.
    void attach(vyra::Evaluator& evaluator, std::vector<DeformerChoice> deformers);

    // From the next pose on, all deformers are off, or on again.
    void toggleDeformers();
    // The same for one deformer of the chain, counted from 0. Ignores a number without a deformer.
    void toggleDeformer(std::size_t number);
    const std::vector<DeformerChoice>& deformers() const { return fDeformers; }

    // Moves every character to its pose at this time, in parallel.
    void pose(double seconds);

    // Replaces both vertex buffers of a mesh by those of its other level of detail. Not while
    // deformers run.
    void changeLevel(CharacterMesh& mesh);

    const std::vector<Character>& characters() const { return fCharacters; }
    // All meshes of all characters.
    const std::vector<CharacterMesh*>& meshes() const { return fMeshes; }
    // The mesh that `deformable` deforms.
    const CharacterMesh& meshOf(const vyra::DeformableMesh& deformable) const
    {
        return *fByDeformable.at(&deformable);
    }
    std::size_t meshesPerCharacter() const { return fLevels.size(); }
    QVector3D size() const { return fSize; } // of the stage, centred at the origin, feet at y = 0
    // Whether the model's extent over the animation is finite and not 0. Without it nothing is
    // seen.
    bool hasExtent() const;
    // The outermost points of all characters over the animation, in many directions.
    std::vector<QVector3D> outline() const;

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
