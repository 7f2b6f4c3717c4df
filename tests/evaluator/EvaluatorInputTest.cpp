// Invalid input: the status of each mesh that cannot be deformed names it and the reason; all other
// meshes are deformed.
#include "ScriptedEvaluator.h"

#include <cmath>
#include <stdexcept>
#include <utility>

using namespace scripted;
using testing::HasSubstr;
using testing::StartsWith;

namespace {

// Requires that the invalid mesh fails with the message, in prepare and in each evaluation, and
// that the valid one is deformed.
class EvaluatorInputTest : public EvaluatorTest {
protected:
    void expectFailure(vyra::DeformableMesh& bad, const std::string& message)
    {
        addChain();
        EXPECT_EQ(evaluator->prepare().message, message);
        for (int i = 0; i < 2; ++i) {
            EXPECT_EQ(countOf(callsOfEvaluation(), "clEnqueueNDRangeKernel"), 2U) << message;
            EXPECT_EQ(bad.status().message, message);
            EXPECT_EQ(evaluator->status().message, message);
            EXPECT_EQ(runtime().acquired(), Lines{});
        }
    }
};

TEST_F(EvaluatorInputTest, InvalidMeshesAndBuffersAreRejectedWithReason)
{
    using Spoil = void (*)(vyra::MeshGeometry&);
    machine.sharedBytes[91] = 47;
    startIn(1, 1);
    for (const auto& [spoil, message] : std::initializer_list<std::pair<Spoil, const char*>>{
             {[](auto& g) { g.rest = {}; }, "it has no vertices"},
             {[](auto& g) { g.rest.normals.pop_back(); },
              "it has 4 positions and 3 normals; the numbers must be equal"},
             {[](auto& g) { g.triangles.pop_back(); },
              "the number of its triangle indices is not a multiple of 3"},
             {[](auto& g) { g.triangles[4] = 4; },
              "a triangle refers to vertex 4, and there are 4 vertices"},
             {[](auto& g) { g.rest.positions[2].y = NAN; }, "position 2 is not a finite number"},
             {[](auto& g) { g.rest.normals[3].z = INFINITY; },
              "normal 3 is not a finite number"}}) {
        makeEvaluator();
        const auto geometry = grid(4, "bad");
        spoil(*geometry);
        vyra::DeformableMesh& bad = addMesh(geometry);
        bad.add<TestDeformer>();
        expectFailure(bad, std::string("mesh 'bad': ") + message);
    }
    makeEvaluator();
    vyra::DeformableMesh& none = addMesh(std::shared_ptr<const vyra::MeshGeometry>());
    expectFailure(none, "mesh '': it has no geometry");
    makeEvaluator();
    expectFailure(evaluator->createMesh(grid(4, "small"), {.positions = 90, .normals = 91}),
                  "mesh 'small': its buffer of normals has 47 bytes, and the vertices need 48");
    EXPECT_EQ(evaluator->batchSize(), 2U) << "the buffers of the other mesh";
    makeEvaluator();
    runtime().plan({.function = "clCreateFromGLBuffer", .status = CL_INVALID_GL_OBJECT, .nth = 2});
    expectFailure(addMesh(grid(4, "gone")),
                  "mesh 'gone': OpenCL cannot share its buffer of normals "
                  "(CL_INVALID_GL_OBJECT); check that the renderer created it");
    makeEvaluator();
    runtime().clearFaults();
    runtime().plan({.function = "clGetMemObjectInfo", .status = CL_OUT_OF_RESOURCES});
    expectFailure(addMesh(grid(4, "unknown")),
                  "mesh 'unknown': the size of its buffer of positions is unknown "
                  "(CL_OUT_OF_RESOURCES); check the OpenCL driver");
}

TEST_F(EvaluatorInputTest, InvalidOrThrowingDeformersAreReported)
{
    using Spoil = void (*)(TestDeformer&);
    startIn(1, 1);
    for (const auto& [spoil, message] : std::initializer_list<std::pair<Spoil, const char*>>{
             {[](auto& d) { d.problem = "it has 3 bones"; }, "it has 3 bones"},
             {[](auto& d) { d.onArguments = [] { throw std::runtime_error("no pose"); }; },
              "it threw an exception: no pose"},
             {[](auto& d) { d.onArguments = [] { throw std::bad_alloc(); }; }, "out of memory"},
             {[](auto& d) { d.onArguments = [] { throw 7; }; }, "it threw an exception"}}) {
        makeEvaluator();
        vyra::DeformableMesh& bad = addMesh(grid(4, "bad"));
        spoil(bad.add<TestDeformer>("skin"));
        expectFailure(bad, std::string("mesh 'bad': deformer 'skin': ") + message);
        deformer(bad).problem.clear();
        deformer(bad).onArguments = nullptr;
        evaluate();
        EXPECT_TRUE(bad.status().ok()) << bad.status().message;
    }
}

// Records the meshes that the CPU deforms.
class EvaluatorOnCpuTest : public EvaluatorTest {
protected:
    void SetUp() override
    {
        settings.writeVertices = [this](vyra::DeformableMesh& mesh, const vyra::Surface& surface) {
            written.push_back(mesh.geometry().name + " " +
                              std::to_string(static_cast<int>(surface.positions[0].x)));
            if (onWrite)
                onWrite();
        };
    }
    Lines written; // name, and x of the first vertex
    std::function<void()> onWrite;
};

TEST_F(EvaluatorOnCpuTest, WithoutOpenCLMeshesAreDeformedAndFailuresReported)
{
    machine.platforms.clear();
    EXPECT_FALSE(start());
    settings.finishRenderer = nullptr;
    makeEvaluator();
    EXPECT_FALSE(evaluator->usesOpenCL());
    vyra::DeformableMesh& a = addChain();
    vyra::DeformableMesh& b = addChain();
    frame();
    EXPECT_EQ(written, (Lines{"a 2", "b 2"}));
    EXPECT_TRUE(evaluator->status().ok());
    EXPECT_FALSE(a.usesOpenCL());

    const auto expectFailure = [&](const char* reason) {
        written.clear();
        frame();
        EXPECT_EQ(written, Lines{"b 2"});
        EXPECT_EQ(a.status().message, std::string("mesh 'a': deformer 'twist': ") + reason);
        EXPECT_EQ(evaluator->status().message, a.status().message);
    };
    deformer(a, 1).problem = "no";
    expectFailure("no");
    deformer(a, 1).problem.clear();
    deformer(a, 1).onDeform = [] { throw std::runtime_error("no pose"); };
    expectFailure("it threw an exception: no pose");
    deformer(a, 1).onDeform = [] { throw 7; };
    expectFailure("it threw an exception");
    deformer(a, 1).enabled = false;
    written.clear();
    frame();
    EXPECT_EQ(written, (Lines{"a 1", "b 2"}));
    evaluator->destroyMesh(b);
    EXPECT_TRUE(evaluator->replaceKernelFile("test.cl", "#error").ok());
    EXPECT_EQ(calls(), Lines{});
}

// Calls the evaluator from functions of the settings, which run during an evaluation.
TEST_F(EvaluatorOnCpuTest, MeshesChangeAndNestedEvaluationsAreRejectedDuringEvaluation)
{
    std::vector<vyra::DeformableMesh*> gone;
    onWrite = [&] {
        if (gone.empty())
            return;
        evaluate();
        EXPECT_THAT(evaluator->status().message, HasSubstr("inside an evaluation"));
        EXPECT_THAT(evaluator->deform().message, StartsWith("nothing was evaluated: "));
        for (vyra::DeformableMesh* mesh : std::exchange(gone, {}))
            evaluator->destroyMesh(*mesh);
        addChain();
    };
    settings.finishRenderer = onWrite;
    startIn(3, 1);
    vyra::DeformableMesh& first = addChain();
    addChain();
    gone = {&first}; // when the renderer finishes
    evaluate();
    EXPECT_EQ(evaluator->batchSize(), 4U);
    EXPECT_EQ(countOf(callsOfEvaluation(), "clEnqueueNDRangeKernel"), 4U);

    settings.finishRenderer = [] {};
    makeEvaluator();
    vyra::DeformableMesh& large = addChain();
    gone = {&large, &addMesh(kSmallest - 1)}; // when the small mesh is written
    EXPECT_FALSE(gone[1]->usesOpenCL());
    frame();
    EXPECT_THAT(evaluator->status().message, HasSubstr("inside an evaluation"));
    EXPECT_EQ(evaluator->batchSize(), 2U);
    const Lines lines = callsOfEvaluation();
    EXPECT_TRUE(evaluator->status().ok()) << evaluator->status().message;
    EXPECT_EQ(countOf(lines, "clEnqueueAcquire"), 1U);
    EXPECT_EQ(countOf(lines, "clEnqueueRelease"), 1U);
    EXPECT_EQ(countOf(lines, "clEnqueueNDRangeKernel"), 2U);
}

TEST_F(ImplicitModesTest, InvalidEvaluationsAreRejectedWithoutCalls)
{
    addChain();
    calls();
    evaluator->evaluate(em::Id(0xFFFE));
    EXPECT_THAT(evaluator->status().message, HasSubstr("65534 never names an evaluation"));
    EXPECT_EQ(calls(), Lines{});
    evaluate();
    calls();
    EXPECT_THAT(evaluator->deform().message, HasSubstr("no evaluation is open"));
    EXPECT_EQ(callsOf("clEnqueue"), Lines{});
    evaluate();
    EXPECT_TRUE(evaluator->status().ok());

    settings.finishRenderer = nullptr;
    makeEvaluator();
    addChain();
    calls();
    evaluate();
    EXPECT_THAT(evaluator->status().message, HasSubstr("finishRenderer is not set"));
    EXPECT_EQ(evaluator->deform().message, evaluator->status().message);
    EXPECT_EQ(calls(), Lines{});
}

} // namespace
