#include "viewer/model/DeformerChain.h"

#include "evaluator/MorphDeformer.h"
#include "evaluator/SkinDeformer.h"
#include "evaluator/SmoothDeformer.h"
#include "evaluator/TwistDeformer.h"
#include "evaluator/WaveDeformer.h"
#include "viewer/model/Pose.h"

#include <algorithm>
#include <cmath>
#include <iterator>
#include <memory>
#include <sstream>

namespace viewer {
namespace {

constexpr double kFullTurn = 6.28318530718;
constexpr double kTwistPeriod = 4.0; // seconds
// Keeps the twist of a flat character finite.
constexpr float kLeastHeight = 0.25F;
constexpr double kWavePeriod = 2.0; // seconds

bool always(const MeshShape& /*shape*/)
{
    return true;
}

// Operations of the viewer on one type of deformer.
struct DeformerType {
    const char* name;
    const char* description;
    bool (*applies)(const MeshShape&);
    std::unique_ptr<vyra::Deformer> (*create)(const MeshShape&);
    // Sets the animated parameters. `prototype` has the parameters that the user chose;
    // `toCharacter` is the transform to character space from the mesh after the previous ones.
    void (*animate)(vyra::Deformer&, const vyra::Deformer& prototype, const MeshPose&,
                    const QMatrix4x4& toCharacter);
};

template <typename T>
T& as(vyra::Deformer& deformer)
{
    return static_cast<T&>(deformer);
}

template <typename T>
const T& as(const vyra::Deformer& deformer)
{
    return static_cast<const T&>(deformer);
}

void animateNothing(vyra::Deformer& /*deformer*/, const vyra::Deformer& /*prototype*/,
                    const MeshPose& /*pose*/, const QMatrix4x4& /*toCharacter*/)
{
}

const DeformerType kTypes[] = {
    {"skin", "bones move the vertices (meshes with bones)",
     [](const MeshShape& shape) { return shape.skinWeights.vertexCount() > 0; },
     [](const MeshShape& shape) -> std::unique_ptr<vyra::Deformer> {
         return std::make_unique<vyra::SkinDeformer>(shape.skinWeights);
     },
     [](vyra::Deformer& deformer, const vyra::Deformer& /*prototype*/, const MeshPose& pose,
        const QMatrix4x4& /*toCharacter*/) {
         as<vyra::SkinDeformer>(deformer).bones = pose.bones;
     }},
    {"morph", "blends morph targets by the animation's weights (meshes with targets)",
     [](const MeshShape& shape) { return shape.morphTargets.targetCount() > 0; },
     [](const MeshShape& shape) -> std::unique_ptr<vyra::Deformer> {
         return std::make_unique<vyra::MorphDeformer>(shape.morphTargets);
     },
     [](vyra::Deformer& deformer, const vyra::Deformer& /*prototype*/, const MeshPose& pose,
        const QMatrix4x4& /*toCharacter*/) {
         as<vyra::MorphDeformer>(deformer).weights = pose.morphWeights;
     }},
    {"twist", "turns the character around its vertical axis, to and fro", always,
     [](const MeshShape& /*shape*/) -> std::unique_ptr<vyra::Deformer> {
         return std::make_unique<vyra::TwistDeformer>();
     },
     [](vyra::Deformer& deformer, const vyra::Deformer& prototype, const MeshPose& pose,
        const QMatrix4x4& toCharacter) {
         auto& twist = as<vyra::TwistDeformer>(deformer);
         const auto sway = static_cast<float>(std::sin(kFullTurn * pose.seconds / kTwistPeriod));
         const float wholeAngle = as<vyra::TwistDeformer>(prototype).angle; // head to feet
         twist.angle = wholeAngle * sway / std::max(pose.height, kLeastHeight);
         twist.space = rowsOf(toCharacter);
     }},
    {"wave", "a travelling wave", always,
     [](const MeshShape& /*shape*/) -> std::unique_ptr<vyra::Deformer> {
         return std::make_unique<vyra::WaveDeformer>();
     },
     [](vyra::Deformer& deformer, const vyra::Deformer& prototype, const MeshPose& pose,
        const QMatrix4x4& toCharacter) {
         auto& wave = as<vyra::WaveDeformer>(deformer);
         wave.phase =
             as<vyra::WaveDeformer>(prototype).phase +
             static_cast<float>(std::fmod(kFullTurn * pose.seconds / kWavePeriod, kFullTurn));
         wave.space = rowsOf(toCharacter);
     }},
    {"smooth", "Laplacian smoothing", always,
     [](const MeshShape& shape) -> std::unique_ptr<vyra::Deformer> {
         return std::make_unique<vyra::SmoothDeformer>(shape.topology);
     },
     animateNothing},
};

const DeformerType* findType(const std::string& name)
{
    const auto* found = std::find_if(std::begin(kTypes), std::end(kTypes),
                                     [&](const DeformerType& type) { return type.name == name; });
    return found == std::end(kTypes) ? nullptr : found;
}

std::string typeNames()
{
    std::string names;
    for (const DeformerType& type : kTypes)
        names += std::string(names.empty() ? "" : ", ") + type.name;
    return names;
}

std::vector<std::string> split(const std::string& text, char separator)
{
    std::vector<std::string> parts;
    std::istringstream stream(text);
    for (std::string part; std::getline(stream, part, separator);)
        parts.push_back(part);
    if (text.empty() || text.back() == separator)
        parts.emplace_back();
    return parts;
}

Failure deformerError(const std::string& text)
{
    return {ExitCode::kUsage, "--deformers: " + text};
}

// Creates a deformer without mesh data, as a holder of parameters.
[[nodiscard]] std::unique_ptr<vyra::Deformer> createEmpty(const DeformerType& type)
{
    return type.create(MeshShape());
}

Result<DeformerChoice> parseDeformer(const std::string& text)
{
    const std::vector<std::string> parts = split(text, ':');
    const DeformerType* type = findType(parts.front());
    if (!type)
        return deformerError("there is no deformer '" + parts.front() + "'; there are " +
                             typeNames());
    DeformerChoice choice{type->name, {}, createEmpty(*type)};
    for (auto part = parts.begin() + 1; part != parts.end(); ++part) {
        const std::size_t equals = part->find('=');
        if (equals == std::string::npos)
            return deformerError("'" + *part + "' is not PARAMETER=VALUE");
        std::string name = part->substr(0, equals);
        std::string value = part->substr(equals + 1);
        if (const std::string problem = setParameter(*choice.prototype, name, value);
            !problem.empty())
            return deformerError(problem);
        choice.parameters.emplace_back(std::move(name), std::move(value));
    }
    return choice;
}

} // namespace

Result<std::vector<DeformerChoice>> parseDeformers(const std::string& text)
{
    std::vector<DeformerChoice> choices;
    for (const std::string& part : split(text, ',')) {
        Result<DeformerChoice> choice = parseDeformer(part);
        if (!choice)
            return choice.failure();
        choices.push_back(std::move(choice.value()));
    }
    return choices;
}

std::string deformerHelp()
{
    std::ostringstream text;
    for (const DeformerType& type : kTypes) {
        text << "  " << type.name << ": " << type.description << '\n';
        for (const vyra::DeformerParameter& parameter : createEmpty(type)->parameters())
            text << "    " << parameter.name << ": " << parameter.description << '\n';
    }
    return text.str();
}

std::string chainText(const std::vector<DeformerChoice>& choices)
{
    std::string text;
    for (const DeformerChoice& choice : choices) {
        text += (text.empty() ? "" : ", ") + choice.name;
        for (const auto& [name, value] : choice.parameters)
            text.append(":").append(name).append("=").append(value);
        text += choice.enabled ? "" : " (off)";
    }
    return text;
}

void addDeformers(const std::vector<DeformerChoice>& choices, const MeshShape& shape,
                  vyra::DeformableMesh& deformable)
{
    for (const DeformerChoice& choice : choices) {
        const DeformerType& type = *findType(choice.name);
        if (!type.applies(shape))
            continue;
        std::unique_ptr<vyra::Deformer> deformer = type.create(shape);
        for (const auto& [name, value] : choice.parameters)
            setParameter(*deformer, name, value); // checked by parseDeformers
        deformable.add(std::move(deformer));
    }
}

void applyPose(const std::vector<DeformerChoice>& choices, const MeshShape& shape, MeshPose& pose,
               vyra::DeformableMesh& deformable)
{
    pose.geometryMatrix = pose.restToCharacter;
    auto deformer = deformable.deformers().begin();
    for (const DeformerChoice& choice : choices) {
        const DeformerType& type = *findType(choice.name);
        if (!type.applies(shape))
            continue;
        (*deformer)->enabled = choice.enabled;
        type.animate(**deformer, *choice.prototype, pose, pose.geometryMatrix);
        if (choice.enabled && dynamic_cast<vyra::SkinDeformer*>(deformer->get()))
            pose.geometryMatrix = pose.skinnedToCharacter;
        ++deformer;
    }
}

} // namespace viewer
