// The fixture of the evaluator's tests on the scripted runtime, and a deformer with settable
// behaviour.
#pragma once

#include "ScriptedTest.h"
#include "evaluator/Evaluator.h"
#include "host/EvaluationId.h"

#include <filesystem>
#include <functional>
#include <memory>
#include <string>
#include <vector>

namespace scripted {

class TestDeformer : public vyra::Deformer {
public:
    explicit TestDeformer(const char* nameText = "test", const char* kernelFunction = "plain")
        : label(nameText), function(kernelFunction)
    {
    }

    std::string label;
    std::string file = "test.cl";
    std::string function; // "plain" takes the common arguments, "full" all kinds
    std::string options;
    std::string text;    // of the kernels; empty: they are in the file
    std::string problem; // what mismatch returns
    unsigned passes = 1;
    bool neighbours = false;
    std::function<void()> onArguments; // called by setArguments
    std::function<void()> onDeform;    // called by deform
    vyra::ConstantArray weights{std::vector<float>{1, 2}};
    std::vector<float> numbers{1, 2, 3, 4};
    float amount = 1; // added to x on the CPU

    const char* name() const override { return label.c_str(); }
    std::string mismatch(const vyra::MeshGeometry& /*geometry*/) const override { return problem; }
    unsigned passCount() const override { return passes; }
    vyra::KernelSource kernel(unsigned /*pass*/) const override
    {
        return {file, function, options, text};
    }
    bool readsNeighbours() const override { return neighbours; }
    void setArguments(unsigned pass, vyra::KernelArguments& arguments) override;
    void deform(const vyra::MeshGeometry& geometry, vyra::Surface& surface) const override;
};

class EvaluatorTest : public ScriptedTest {
protected:
    static constexpr unsigned kSmallest = 4; // vertices of a mesh that OpenCL deforms

    EvaluatorTest();
    ~EvaluatorTest() override;
    void TearDown() override;

    // Starts OpenCL in these modes and creates the evaluator.
    void startIn(int graphicsToCL, int clToGraphics);
    void makeEvaluator();
    // Adds a grid of two rows, named a, b, c, ..., with vertex buffers of its own.
    vyra::DeformableMesh& addMesh(unsigned vertices = kSmallest);
    vyra::DeformableMesh& addMesh(std::shared_ptr<const vyra::MeshGeometry> geometry);
    // Adds a mesh with a chain like skin and twist: one upload, two kernels.
    vyra::DeformableMesh& addChain();
    static std::shared_ptr<vyra::MeshGeometry> grid(unsigned vertices, std::string name);

    void evaluate() { evaluator->evaluate(em::Id(++fEvaluations)); }
    // Evaluates and draws one frame.
    void frame();
    // Returns the calls of one evaluation.
    Lines callsOfEvaluation();
    static TestDeformer& deformer(const vyra::DeformableMesh& mesh, std::size_t index = 0)
    {
        return static_cast<TestDeformer&>(*mesh.deformers()[index]);
    }

    // Destroys the evaluator and returns the objects created since start-up, except those that the
    // library keeps: the event of the last batch acquire, and the renderer's fence.
    Lines leftOver();
    void writeKernels(const std::string& file, const std::string& text) const;
    static TopenCLSharedBufferMgr& manager() { return info().sharedBufferMgr(); }

    vyra::EvaluatorSettings settings; // of the next evaluator
    std::unique_ptr<vyra::Evaluator> evaluator;
    std::filesystem::path kernels; // a directory of this process
    Lines expectedLeft;            // of leftOver, when the test ends

private:
    Lines objectsSinceStart() const;

    std::uint16_t fEvaluations = 0;
    unsigned fMeshes = 0;
};

// Starts in the modes that order OpenCL and OpenGL without waits.
class ImplicitModesTest : public EvaluatorTest {
protected:
    void SetUp() override { startIn(1, 1); }
};

inline constexpr const char* kKernelText =
    "kernel void plain(const uint count, global const float* positions, global const float* "
    "normals, global float* newPositions, global float* newNormals) {}\n"
    "kernel void full(const uint count, global const float* positions, global const float* "
    "normals, global float* newPositions, global float* newNormals, global const float* weights, "
    "global const float4* numbers, const uint first, const float amount) {}\n";

} // namespace scripted
