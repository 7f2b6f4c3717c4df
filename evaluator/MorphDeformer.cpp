#include "evaluator/MorphDeformer.h"

#include "evaluator/VectorMath.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <span>
#include <utility>

namespace vyra {
namespace {

// The number of targets that one pass adds, each a kernel argument.
constexpr unsigned kTargetsPerPass = 8;
constexpr float kLargestStrength = 10;

void appendComponents(const std::vector<Vector3>& vectors, std::size_t count,
                      std::vector<float>& to)
{
    for (float Vector3::*component : {&Vector3::x, &Vector3::y, &Vector3::z}) {
        for (const Vector3& vector : vectors)
            to.push_back(vector.*component);
        to.insert(to.end(), count - vectors.size(), 0.0f);
    }
}

Vector componentsAt(std::span<const float> components, std::size_t count, std::size_t vertex)
{
    return {components[vertex], components[count + vertex], components[2 * count + vertex]};
}

} // namespace

MorphTargets::MorphTargets(const std::vector<MorphTarget>& targets)
{
    if (targets.empty())
        return;
    fVertexCount = targets.front().positionDeltas.size();
    for (std::size_t i = 0; i < targets.size() && fProblem.empty(); ++i) {
        const MorphTarget& target = targets[i];
        const std::string name = "morph target " + std::to_string(i);
        if (target.positionDeltas.size() != fVertexCount)
            fProblem = name + " has " + std::to_string(target.positionDeltas.size()) +
                       " positions, and the first target has " + std::to_string(fVertexCount);
        else if (!target.normalDeltas.empty() && target.normalDeltas.size() != fVertexCount)
            fProblem = name + " has " + std::to_string(target.normalDeltas.size()) +
                       " normals and " + std::to_string(fVertexCount) + " positions";
        fHasNormals = fHasNormals || !target.normalDeltas.empty();
    }
    if (!fProblem.empty())
        return;
    for (const MorphTarget& target : targets) {
        std::vector<float> components;
        components.reserve((fHasNormals ? 6 : 3) * fVertexCount);
        appendComponents(target.positionDeltas, fVertexCount, components);
        if (fHasNormals)
            appendComponents(target.normalDeltas, fVertexCount, components);
        fDeltas.emplace_back(components);
    }
}

MorphDeformer::MorphDeformer(MorphTargets targets)
    : weights(targets.targetCount()), fTargets(std::move(targets))
{
}

std::string MorphDeformer::mismatch(const MeshGeometry& geometry) const
{
    if (!fTargets.problem().empty())
        return fTargets.problem() + "; give all targets the size of the mesh";
    if (weights.size() != fTargets.targetCount())
        return "there are " + std::to_string(weights.size()) + " weights and " +
               std::to_string(fTargets.targetCount()) +
               " morph targets; set one weight for each target";
    if (fTargets.targetCount() > 0 && fTargets.vertexCount() != geometry.rest.vertexCount())
        return "the morph targets have " + std::to_string(fTargets.vertexCount()) +
               " vertices, and the mesh has " + std::to_string(geometry.rest.vertexCount()) +
               "; use the targets of this mesh";
    const auto isFinite = [](float weight) { return std::isfinite(weight); };
    if (!isFinite(strength) || !std::all_of(weights.begin(), weights.end(), isFinite))
        return "a weight or the strength is not a finite number; set one that is";
    return {};
}

unsigned MorphDeformer::passCount() const
{
    unsigned active = 0;
    for (std::size_t i = 0; i < weights.size(); ++i)
        active += effectiveWeight(i) != 0 ? 1 : 0;
    return (active + kTargetsPerPass - 1) / kTargetsPerPass;
}

KernelSource MorphDeformer::kernel(unsigned /*pass*/) const
{
    return {"morph.cl", fTargets.hasNormals() ? "morph" : "morphPositions"};
}

void MorphDeformer::setArguments(unsigned pass, KernelArguments& arguments)
{
    std::array<const ConstantArray*, kTargetsPerPass> deltas{};
    cl_float8 passWeights{};
    unsigned active = 0;
    for (std::size_t i = 0; i < weights.size(); ++i) {
        if (effectiveWeight(i) == 0)
            continue;
        if (active / kTargetsPerPass == pass) {
            deltas[active % kTargetsPerPass] = &fTargets.deltas(i);
            passWeights.s[active % kTargetsPerPass] = effectiveWeight(i);
        }
        ++active;
    }
    // Unused arguments add the first target with the weight 0.
    for (const ConstantArray* array : deltas)
        arguments.constant(array ? *array : *deltas[0]);
    arguments.value(passWeights);
    if (fTargets.hasNormals())
        arguments.value(cl_uint{pass + 1 == passCount()});
}

void MorphDeformer::deform(const MeshGeometry& /*geometry*/, Surface& surface) const
{
    const std::size_t count = surface.vertexCount();
    std::vector<Vector> positions(count);
    std::vector<Vector> normals(count);
    std::transform(surface.positions.begin(), surface.positions.end(), positions.begin(),
                   [](const Vector3& p) { return wide(p); });
    std::transform(surface.normals.begin(), surface.normals.end(), normals.begin(),
                   [](const Vector3& n) { return wide(n); });
    for (std::size_t target = 0; target < weights.size(); ++target) {
        const double weight = effectiveWeight(target);
        if (weight == 0)
            continue;
        const auto deltas = fTargets.deltas(target).values<float>();
        for (std::size_t i = 0; i < count; ++i) {
            positions[i] += weight * componentsAt(deltas, count, i);
            if (fTargets.hasNormals())
                normals[i] += weight * componentsAt(deltas.subspan(3 * count), count, i);
        }
    }
    for (std::size_t i = 0; i < count; ++i) {
        surface.positions[i] = narrow(positions[i]);
        surface.normals[i] = narrow(fTargets.hasNormals() ? normalised(normals[i]) : normals[i]);
    }
}

std::vector<DeformerParameter> MorphDeformer::parameters()
{
    return {{"strength", "factor of all weights", &strength, -kLargestStrength, kLargestStrength}};
}

} // namespace vyra
