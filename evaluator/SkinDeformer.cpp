#include "evaluator/SkinDeformer.h"

#include "evaluator/VectorMath.h"

#include "runtime/TopenCLInfo.h"

#include <algorithm>
#include <cmath>
#include <numeric>
#include <utility>

namespace vyra {
namespace {

using Influence = SkinWeights::Influence;
using BoneIndices = SkinWeights::BoneIndices;
using BoneWeights = SkinWeights::BoneWeights;

// Returns the columns of a 3x4 matrix, four floats each; a kernel reads two columns with one load.
constexpr std::size_t kFloatsPerBone = 16;

bool isWeight(float weight)
{
    return weight >= 0 && std::isfinite(weight);
}

double sum(const BoneWeights& weights)
{
    return std::accumulate(weights.begin(), weights.end(), 0.0);
}

std::string atVertex(std::size_t vertex)
{
    return " of vertex " + std::to_string(vertex);
}

// Sorts the influences by descending weight; equal ones keep their order.
std::vector<Influence> heaviest(std::vector<Influence> influences)
{
    std::stable_sort(influences.begin(), influences.end(),
                     [](const Influence& a, const Influence& b) { return a.weight > b.weight; });
    influences.resize(std::min(influences.size(), SkinWeights::kInfluences));
    return influences;
}

// Scales the weights to the sum 1 and lets unused influences refer to the heaviest bone.
void complete(BoneIndices& bones, BoneWeights& weights)
{
    const auto heaviest = static_cast<std::size_t>(
        std::max_element(weights.begin(), weights.end()) - weights.begin());
    const double scale = 1 / sum(weights);
    for (std::size_t i = 0; i < SkinWeights::kInfluences; ++i) {
        weights[i] = static_cast<float>(scale * weights[i]);
        if (weights[i] == 0)
            bones[i] = bones[heaviest];
    }
}

Affine blend(const std::vector<Affine>& bones, const BoneIndices& indices,
             const BoneWeights& weights)
{
    Affine result{};
    for (std::size_t i = 0; i < SkinWeights::kInfluences; ++i) {
        const Affine& bone = bones[indices[i]];
        for (std::size_t row = 0; row < 3; ++row)
            result.rows[row] += double{weights[i]} * bone.rows[row];
        result.offset += double{weights[i]} * bone.offset;
    }
    return result;
}

} // namespace

SkinWeights::SkinWeights(const std::vector<std::vector<Influence>>& influences)
{
    std::vector<BoneIndices> bones(influences.size(), BoneIndices{});
    std::vector<BoneWeights> weights(influences.size(), BoneWeights{});
    for (std::size_t vertex = 0; vertex < influences.size(); ++vertex) {
        const std::vector<Influence>& all = influences[vertex];
        const bool good = std::all_of(all.begin(), all.end(),
                                      [](const Influence& one) { return isWeight(one.weight); });
        if (!good && fProblem.empty())
            fProblem = "a weight" + atVertex(vertex) + " is negative or not a number";
        const std::vector<Influence> kept = good ? heaviest(all) : std::vector<Influence>();
        for (std::size_t i = 0; i < kept.size(); ++i) {
            bones[vertex][i] = kept[i].bone;
            weights[vertex][i] = kept[i].weight;
        }
        if (!(sum(weights[vertex]) > 0) && fProblem.empty())
            fProblem = "the weights" + atVertex(vertex) + " are all 0";
    }
    store(std::move(bones), std::move(weights));
}

SkinWeights::SkinWeights(const std::vector<BoneIndices>& bones,
                         const std::vector<BoneWeights>& weights)
{
    if (bones.size() != weights.size())
        fProblem = "there are bone indices for " + std::to_string(bones.size()) +
                   " vertices and weights for " + std::to_string(weights.size());
    for (std::size_t vertex = 0; vertex < weights.size() && fProblem.empty(); ++vertex) {
        const BoneWeights& four = weights[vertex];
        if (!std::all_of(four.begin(), four.end(), isWeight))
            fProblem = "a weight" + atVertex(vertex) + " is negative or not a number";
        else if (std::abs(sum(four) - 1) > kTolerance)
            fProblem = "the weights" + atVertex(vertex) + " add up to " +
                       std::to_string(sum(four)) + ", not to 1";
    }
    store(std::vector(bones), std::vector(weights));
}

// Stores no arrays if the weights are invalid.
void SkinWeights::store(std::vector<BoneIndices>&& bones, std::vector<BoneWeights>&& weights)
{
    if (!fProblem.empty())
        return;
    for (std::size_t vertex = 0; vertex < bones.size(); ++vertex) {
        complete(bones[vertex], weights[vertex]);
        fHighestBone =
            std::max(fHighestBone, *std::max_element(bones[vertex].begin(), bones[vertex].end()));
    }
    fBones = ConstantArray(bones);
    fWeights = ConstantArray(weights);
}

std::size_t SkinWeights::vertexCount() const
{
    return fBones.sizeInBytes() / sizeof(BoneIndices);
}

SkinDeformer::SkinDeformer(SkinWeights weights) : fWeights(std::move(weights)) {}

std::string SkinDeformer::mismatch(const MeshGeometry& geometry) const
{
    if (!fWeights.problem().empty())
        return fWeights.problem() + "; correct the skin weights";
    if (fWeights.vertexCount() != geometry.rest.vertexCount())
        return "there are skin weights for " + std::to_string(fWeights.vertexCount()) +
               " vertices, and the mesh has " + std::to_string(geometry.rest.vertexCount()) +
               "; use the weights of this mesh";
    if (fWeights.highestBone() >= bones.size())
        return "the skin weights refer to bone " + std::to_string(fWeights.highestBone()) +
               ", and there are " + std::to_string(bones.size()) +
               " bone matrices; set one for each bone";
    if (precision > kDouble)
        return "the precision is 0 (single) or 1 (double), not " + std::to_string(precision);
    if (precision == kDouble && TopenCLInfo::isValid() &&
        !TopenCLInfo::theOne().supportsDoublePrecision())
        return "the OpenCL device does not compute in double precision; set the precision to "
               "single";
    return {};
}

KernelSource SkinDeformer::kernel(unsigned /*pass*/) const
{
    return {"skin.cl", "skin", precision == kDouble ? "-D UseDouble" : ""};
}

void SkinDeformer::setArguments(unsigned /*pass*/, KernelArguments& arguments)
{
    fColumns.resize(kFloatsPerBone * bones.size());
    float* next = fColumns.data();
    for (const MatrixRows& rows : bones) {
        for (std::size_t column = 0; column < 4; ++column) {
            for (std::size_t row = 0; row < 3; ++row)
                *next++ = rows[4 * row + column];
            *next++ = 0;
        }
    }
    arguments.constant(fWeights.bones());
    arguments.constant(fWeights.weights());
    arguments.frame(std::span<const float>(fColumns));
}

void SkinDeformer::deform(const MeshGeometry& /*geometry*/, Surface& surface) const
{
    std::vector<Affine> matrices;
    matrices.reserve(bones.size());
    for (const MatrixRows& rows : bones)
        matrices.push_back(wide(rows));
    const auto indices = fWeights.bones().values<BoneIndices>();
    const auto weights = fWeights.weights().values<BoneWeights>();
    for (std::size_t i = 0; i < surface.vertexCount(); ++i) {
        const Affine m = blend(matrices, indices[i], weights[i]);
        const Vector n = wide(surface.normals[i]);
        const std::array<Vector, 3> c = cofactors(m);
        const double side = determinant(m) < 0 ? -1 : 1;
        surface.positions[i] = narrow(transformPoint(m, wide(surface.positions[i])));
        surface.normals[i] =
            narrow(normalised(side * Vector{dot(c[0], n), dot(c[1], n), dot(c[2], n)}));
    }
}

std::vector<DeformerParameter> SkinDeformer::parameters()
{
    return {{"precision", "arithmetic of the kernel", &precision, 0, 0, {"single", "double"}}};
}

} // namespace vyra
