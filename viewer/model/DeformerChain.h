// The deformers that the user chose, and how a pose drives them.
#pragma once

#include "evaluator/DeformableMesh.h"
#include "evaluator/Deformer.h"
#include "evaluator/Geometry.h"
#include "viewer/Failure.h"
#include "viewer/model/MeshShape.h"

#include <memory>
#include <string>
#include <utility>
#include <vector>

#include <QMatrix4x4>

namespace viewer {

// One deformer of --deformers.
struct DeformerChoice {
    std::string name;
    std::vector<std::pair<std::string, std::string>> parameters;
    std::shared_ptr<vyra::Deformer> prototype; // with these parameters, without a mesh's data
    bool enabled = true;
};

// Without --deformers: meshes without targets or bones leave the first two out.
inline constexpr const char kDefaultDeformers[] = "morph,skin,twist";

// Reads "skin,twist,wave:amplitude=0.1:wavelength=0.5". A failure lists the names or values there
// are.
Result<std::vector<DeformerChoice>> parseDeformers(const std::string& text);

// One line for each deformer and each of its parameters.
std::string deformerHelp();

// The chain in one line, with what is switched off.
std::string chainText(const std::vector<DeformerChoice>& choices);

// What the deformers of one mesh need in one frame.
struct MeshPose {
    std::vector<vyra::MatrixRows> bones; // empty in a mesh without bones
    std::vector<float> morphWeights;     // one per target
    double seconds = 0;                  // of the character's own time
    float height = 1;                    // of the character, in its space
    // To the character's space (feet at y = 0, upright along y, centred, its largest extent 1):
    // from the mesh's rest pose, and from the space in which its bones leave it.
    QMatrix4x4 restToCharacter;
    QMatrix4x4 skinnedToCharacter;
    // From the space in which the chain leaves the mesh. Set by applyPose.
    QMatrix4x4 geometryMatrix;
};

// Adds the chosen deformers that apply to the mesh.
void addDeformers(const std::vector<DeformerChoice>& choices, const MeshShape& shape,
                  vyra::DeformableMesh& deformable);

// Enables and drives the deformers that addDeformers added.
void applyPose(const std::vector<DeformerChoice>& choices, const MeshShape& shape, MeshPose& pose,
               vyra::DeformableMesh& deformable);

} // namespace viewer
