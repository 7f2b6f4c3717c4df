// The evaluator: the cost of its kernels, and its overhead relative to direct calls.
#include "cases/Cases.h"
#include "evaluator/Evaluator.h"
#include "evaluator/SkinDeformer.h"
#include "evaluator/TwistDeformer.h"
#include "fixtures/DirectKernel.h"
#include "fixtures/GLBuffers.h"
#include "fixtures/Runtime.h"
#include "host/EvaluationId.h"
#include "runtime/TopenCLInfo.h"

#include <array>
#include <cmath>
#include <cstdint>
#include <memory>
#include <stdexcept>
#include <string>
#include <utility>

#include <CL/cl_gl.h>
#include <tbb/global_control.h>

namespace {

constexpr std::uint32_t kBones = 32;
// Vertices of a mesh for measuring kernels, and of one for measuring commands.
constexpr std::size_t kManyVertices = 16384;
constexpr std::size_t kFewVertices = GLBuffers::kBytes / sizeof(vyra::Vector3);
constexpr std::size_t kMeshes = 64;

std::shared_ptr<const vyra::MeshGeometry> makeGeometry(std::size_t vertexCount)
{
    auto geometry = std::make_shared<vyra::MeshGeometry>();
    for (std::size_t i = 0; i < vertexCount; ++i) {
        const float t = static_cast<float>(i) / static_cast<float>(vertexCount);
        geometry->rest.positions.push_back({std::sin(9 * t), t, std::cos(9 * t)});
        geometry->rest.normals.push_back({std::sin(9 * t), 0, std::cos(9 * t)});
    }
    return geometry;
}

vyra::SkinWeights makeWeights(std::size_t vertexCount)
{
    std::vector<vyra::SkinWeights::BoneIndices> bones;
    for (std::uint32_t i = 0; i < vertexCount; ++i)
        bones.push_back({i % kBones, (i + 3) % kBones, (i + 7) % kBones, (i + 12) % kBones});
    return {bones,
            std::vector<vyra::SkinWeights::BoneWeights>(vertexCount, {0.4F, 0.3F, 0.2F, 0.1F})};
}

// Copies the vertices: a minimal kernel.
class CopyDeformer final : public vyra::Deformer {
public:
    const char* name() const override { return "copy"; }
    vyra::KernelSource kernel(unsigned /*pass*/) const override
    {
        return {.file = "copy.cl",
                .function = "copy",
                .text =
                    "kernel void copy(const uint vertexCount, global const float* positions,\n"
                    "                 global const float* normals, global float* newPositions,\n"
                    "                 global float* newNormals)\n"
                    "{\n"
                    "    if (get_global_id(0) >= vertexCount)\n"
                    "        return;\n"
                    "    const size_t at = 3 * get_global_id(0);\n"
                    "    for (int i = 0; i < 3; ++i) {\n"
                    "        newPositions[at + i] = positions[at + i];\n"
                    "        newNormals[at + i] = normals[at + i];\n"
                    "    }\n"
                    "}\n"};
    }
    void setArguments(unsigned /*pass*/, vyra::KernelArguments& /*arguments*/) override {}
    void deform(const vyra::MeshGeometry& /*geometry*/, vyra::Surface& /*surface*/) const override
    {
    }
};

// An evaluator limited to the calling thread, which makes instruction counts repeatable.
class OneThreadEvaluator {
public:
    explicit OneThreadEvaluator(Runtime& runtime)
    {
        TopenCLInfo::theOne().setMinimumBufferSize(0); // also for small meshes
        vyra::EvaluatorSettings settings;
        settings.finishRenderer = [&runtime] { runtime.gl().glFinish(); };
        fEvaluator = std::make_unique<vyra::Evaluator>(std::move(settings));
    }

    vyra::Evaluator* operator->() const { return fEvaluator.get(); }

    void frame()
    {
        fEvaluator->evaluate(em::Id(fFrame));
        fFrame = static_cast<std::uint16_t>((fFrame + 1) % kEvaluationNumbers);
        if (!fEvaluator->status().ok())
            throw std::runtime_error(fEvaluator->status().message);
        fEvaluator->waitUntilDrawable();
        fEvaluator->renderingComplete();
    }

private:
    static constexpr std::uint16_t kEvaluationNumbers = 0x7fff;

    tbb::global_control fOneThread{tbb::global_control::max_allowed_parallelism, 1};
    std::unique_ptr<vyra::Evaluator> fEvaluator;
    std::uint16_t fFrame = 0;
};

// One large mesh with several deformers, of which one is enabled at a time.
class KernelsOfAMesh {
public:
    explicit KernelsOfAMesh(Runtime& runtime)
        : fBuffers(runtime, 2, kManyVertices * sizeof(vyra::Vector3)), fEvaluator(runtime),
          fMesh(fEvaluator->createMesh(makeGeometry(kManyVertices),
                                       {fBuffers.names()[0], fBuffers.names()[1]}))
    {
        fMesh.add<CopyDeformer>();
        const vyra::SkinWeights weights = makeWeights(kManyVertices);
        for (const unsigned precision :
             {vyra::SkinDeformer::kSingle, vyra::SkinDeformer::kDouble}) {
            auto& skin = fMesh.add<vyra::SkinDeformer>(weights);
            skin.bones.assign(kBones, vyra::kIdentityRows);
            skin.precision = precision;
        }
        fMesh.add<vyra::TwistDeformer>().angle = 1;
    }

    // Returns the case that runs only the deformer with this index, per vertex.
    static Case caseOf(const char* name, const std::shared_ptr<KernelsOfAMesh>& mesh,
                       std::size_t index)
    {
        return {name,
                [mesh, index](std::size_t times) {
                    for (const auto& deformer : mesh->fMesh.deformers())
                        deformer->enabled = deformer == mesh->fMesh.deformers()[index];
                    mesh->fEvaluator.frame();
                    return timedLoop(times, [&] { mesh->fEvaluator.frame(); });
                },
                {},
                kManyVertices};
    }

private:
    GLBuffers fBuffers; // outlives the mesh
    OneThreadEvaluator fEvaluator;
    vyra::DeformableMesh& fMesh;
};

// Changes a bone, as an animation does in each frame.
void move(vyra::SkinDeformer& skin)
{
    skin.bones[0][3] = skin.bones[0][3] < 1 ? skin.bones[0][3] + 0.125F : 0;
}

// Many small meshes, deformed by the evaluator.
class EvaluatedMeshes {
public:
    explicit EvaluatedMeshes(Runtime& runtime) : fBuffers(runtime, 2 * kMeshes), fEvaluator(runtime)
    {
        const auto geometry = makeGeometry(kFewVertices);
        const vyra::SkinWeights weights = makeWeights(kFewVertices);
        for (std::size_t i = 0; i < kMeshes; ++i) {
            vyra::DeformableMesh& mesh = fEvaluator->createMesh(
                geometry, {fBuffers.names()[2 * i], fBuffers.names()[2 * i + 1]});
            fSkins.push_back(&mesh.add<vyra::SkinDeformer>(weights));
            fSkins.back()->bones.assign(kBones, vyra::kIdentityRows);
            mesh.add<vyra::TwistDeformer>().angle = 1;
        }
    }

    void frame()
    {
        for (vyra::SkinDeformer* skin : fSkins)
            move(*skin);
        fEvaluator.frame();
    }

private:
    GLBuffers fBuffers; // outlives the meshes
    OneThreadEvaluator fEvaluator;
    std::vector<vyra::SkinDeformer*> fSkins;
};

// The same meshes, deformed by direct calls: one acquire; an upload and two kernels for each mesh;
// one release.
class DirectMeshes {
public:
    explicit DirectMeshes(Runtime& runtime) : fRuntime(runtime), fBuffers(runtime, 2 * kMeshes)
    {
        const vyra::SkinWeights weights = makeWeights(kFewVertices);
        const auto geometry = makeGeometry(kFewVertices);
        fRest = {createMemory(geometry->rest.positions), createMemory(geometry->rest.normals)};
        fScratch = {createMemory(geometry->rest.positions), createMemory(geometry->rest.normals)};
        for (const unsigned name : fBuffers.names())
            fShared.push_back(share(name));
        for (std::size_t i = 0; i < kMeshes; ++i)
            fMeshes.push_back(std::make_unique<Mesh>(weights, fConstants, target(2 * i)));
    }

    void frame()
    {
        fRuntime.gl().glFinish();
        const cl_command_queue queue = Runtime::queue();
        std::vector<cl_mem>& handles = fHandles;
        handles.clear();
        for (const auto& memory : fShared)
            handles.push_back(memory.get());
        const auto count = static_cast<cl_uint>(handles.size());
        requireSuccess(
            clEnqueueAcquireGLObjects(queue, count, handles.data(), 0, nullptr, nullptr));
        for (const auto& mesh : fMeshes) {
            move(mesh->skin);
            mesh->skinKernel.enqueue(queue, kFewVertices, fRest, fScratch);
            mesh->twistKernel.enqueue(queue, kFewVertices, fScratch, mesh->target);
        }
        requireSuccess(
            clEnqueueReleaseGLObjects(queue, count, handles.data(), 0, nullptr, nullptr));
        clFinish(queue);
    }

private:
    struct Mesh {
        Mesh(const vyra::SkinWeights& weights, ConstantCopies& constants, DeviceSurface vertices)
            : skin(weights), skinKernel(skin, 0, constants), twistKernel(twist, 0, constants),
              target(std::move(vertices))
        {
            skin.bones.assign(kBones, vyra::kIdentityRows);
            twist.angle = 1;
        }
        vyra::SkinDeformer skin;
        vyra::TwistDeformer twist;
        DirectKernel skinKernel;
        DirectKernel twistKernel;
        DeviceSurface target;
    };

    static AutoCLObject<cl_mem> createMemory(const std::vector<vyra::Vector3>& contents)
    {
        cl_int status = CL_SUCCESS;
        AutoCLObject<cl_mem> memory;
        memory.adopt(clCreateBuffer(Runtime::context(), CL_MEM_READ_WRITE | CL_MEM_COPY_HOST_PTR,
                                    contents.size() * sizeof(vyra::Vector3),
                                    const_cast<vyra::Vector3*>(contents.data()), &status));
        requireSuccess(status);
        return memory;
    }

    static AutoCLObject<cl_mem> share(unsigned name)
    {
        cl_int status = CL_SUCCESS;
        AutoCLObject<cl_mem> memory;
        memory.adopt(clCreateFromGLBuffer(Runtime::context(), CL_MEM_READ_WRITE, name, &status));
        requireSuccess(status);
        return memory;
    }

    DeviceSurface target(std::size_t first) const { return {fShared[first], fShared[first + 1]}; }

    Runtime& fRuntime;
    GLBuffers fBuffers; // outlives the memory objects made from it
    ConstantCopies fConstants;
    DeviceSurface fRest;
    DeviceSurface fScratch;
    std::vector<AutoCLObject<cl_mem>> fShared;
    std::vector<cl_mem> fHandles;
    std::vector<std::unique_ptr<Mesh>> fMeshes;
};

Group kernels(const std::string& name, Runtime& runtime)
{
    const auto mesh = std::make_shared<KernelsOfAMesh>(runtime);
    return {name,
            {KernelsOfAMesh::caseOf("copy", mesh, 0), KernelsOfAMesh::caseOf("skin", mesh, 1),
             KernelsOfAMesh::caseOf("twist", mesh, 3)}};
}

Group doublePrecision(const std::string& name, Runtime& runtime)
{
    const auto mesh = std::make_shared<KernelsOfAMesh>(runtime);
    return {name,
            {KernelsOfAMesh::caseOf("single precision", mesh, 1),
             KernelsOfAMesh::caseOf("double precision", mesh, 2)}};
}

Group frames(const std::string& name, Runtime& runtime)
{
    const auto direct = std::make_shared<DirectMeshes>(runtime);
    const auto evaluated = std::make_shared<EvaluatedMeshes>(runtime);
    return {
        name,
        {{"direct calls",
          [direct](std::size_t times) { return timedLoop(times, [&] { direct->frame(); }); },
          {},
          kMeshes},
         {"evaluator",
          [evaluated](std::size_t times) { return timedLoop(times, [&] { evaluated->frame(); }); },
          {},
          kMeshes}}};
}

} // namespace

std::vector<GroupFactory> evaluatorGroups(Runtime* runtime)
{
    const std::string kernelsName = "deformer kernels, 16384 vertices";
    const std::string precisionName = "skin kernel in double precision";
    const std::string framesName = "deforming 64 meshes of 341 vertices";
    return {{kernelsName, [=] { return kernels(kernelsName, *runtime); }},
            {precisionName, [=] { return doublePrecision(precisionName, *runtime); }},
            {framesName, [=] { return frames(framesName, *runtime); }}};
}
