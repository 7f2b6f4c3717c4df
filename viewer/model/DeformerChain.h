// Chain of deformers that the user chose, and their animation.
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

// One deformer of --deformers. Copies share the prototype.
struct DeformerChoice {
    std::string name;
    std::vector<std::pair<std::string, std::string>> parameters;
    std::shared_ptr<vyra::Deformer> prototype; // has these parameters and no mesh data
    bool enabled = true;
};

// Default of --deformers. Meshes without targets or bones skip the first two.
inline constexpr const char kDefaultDeformers[] = "morph,skin,twist";

// Parses text such as "skin,twist,wave:amplitude=0.1:wavelength=0.5". A failure lists the valid
// names or values.
[[nodiscard]] Result<std::vector<DeformerChoice>> parseDeformers(const std::string& text);

// Returns help with one line for each deformer and each of its parameters.
[[nodiscard]] std::string deformerHelp();

// Returns the chain in one line; disabled deformers are marked with "(off)".
[[nodiscard]] std::string chainText(const std::vector<DeformerChoice>& choices);

// Input of the deformers of one mesh in one frame.
struct MeshPose {
    std::vector<vyra::MatrixRows> bones; // empty in a mesh without bones
    std::vector<float> morphWeights;     // one per target
    double seconds = 0;                  // animation time of the character
    float height = 1;                    // of the character, in character space
    // Transforms to character space, from the mesh at rest and from the mesh after skinning.
    QMatrix4x4 restToCharacter;
    QMatrix4x4 skinnedToCharacter;
    // Transform to character space from the mesh after the whole chain. Set by applyPose.
    QMatrix4x4 geometryMatrix;
};

// Adds the chosen deformers to the mesh, except deformers that need bones or targets that it lacks.
void addDeformers(const std::vector<DeformerChoice>& choices, const MeshShape& shape,
                  vyra::DeformableMesh& deformable);

// Sets `enabled` and the animated parameters of the deformers that addDeformers added.
void applyPose(const std::vector<DeformerChoice>& choices, const MeshShape& shape, MeshPose& pose,
               vyra::DeformableMesh& deformable);

} // namespace viewer
