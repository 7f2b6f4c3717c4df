// The calls of evaluations without faults: how many there are, in which order, and which memory
// each deformer reads and writes.
#include "ScriptedEvaluator.h"
#include "fake/FakeHost.h"

#include <map>

using namespace scripted;
using testing::Contains, testing::HasSubstr;

namespace {

TEST_F(ImplicitModesTest, SteadyStateMakesThreeCommandsPerMeshAndOnlyLastWaitsForAcquire)
{
    const std::size_t queues = runtime().created(Kind::kQueue) - 2;
    std::vector<vyra::DeformableMesh*> meshes;
    while (meshes.size() < 2 * queues + 1)
        meshes.push_back(&addChain());
    for (int warmUp = 0; warmUp < 3; ++warmUp)
        frame();
    ASSERT_TRUE(evaluator->status().ok()) << evaluator->status().message;

    const auto check = [&](std::size_t uploads) {
        const Lines lines = callsOfEvaluation();
        const Lines releases = linesOf(lines, "clEnqueueRelease");
        ASSERT_EQ(releases.size(), 1U);
        EXPECT_EQ(namesAt(releases[0], releases[0].rfind('[')).size(), 1 + queues)
            << "the acquire, one event a queue";
        const Lines acquires = linesOf(lines, "clEnqueueAcquire");
        ASSERT_EQ(acquires.size(), 1U);
        const std::string acquired = acquires[0].substr(acquires[0].rfind(' ') + 1);
        const Lines kernelLines = linesOf(lines, "clEnqueueNDRangeKernel");
        EXPECT_EQ(kernelLines.size(), 2 * meshes.size());
        for (const std::string& waits : {std::string(), acquired})
            EXPECT_THAT(kernelLines,
                        Contains(HasSubstr(", [" + waits + "]) on")).Times(meshes.size()));
        EXPECT_EQ(countOf(lines, "clEnqueueWriteBuffer"), uploads);
        EXPECT_EQ(countOf(lines, "clEnqueue"), 2 + uploads + 2 * meshes.size());
        for (const char* none : {"clSetKernelArg", "clCreate", "clGet", "clFinish"})
            EXPECT_EQ(countOf(lines, none), 0U) << none;
    };
    check(0);
    deformer(*meshes[0]).numbers[2] = 7;
    check(1);
    for (vyra::DeformableMesh* mesh : meshes)
        deformer(*mesh).numbers[0] = 8;
    check(queues);
    check(0);
    EXPECT_EQ(evaluator->batchSize(), 2 * meshes.size());
}

TEST_F(ImplicitModesTest, UploadCoversOnlyChangedFrameData)
{
    vyra::DeformableMesh& mesh = addMesh();
    for (int i = 0; i < 3; ++i)
        mesh.add<TestDeformer>("skin", "full").numbers.resize(6); // two float4 each
    evaluate();
    const auto expectUpload = [this](const char* range) {
        EXPECT_THAT(linesOf(callsOfEvaluation(), "clEnqueueWrite"),
                    testing::ElementsAre(HasSubstr(std::string(range) + ", ptr, []")));
    };
    deformer(mesh, 1).numbers[4] = 9;
    expectUpload(", 0, 32, 24");
    deformer(mesh, 0).numbers[4] = 9;
    deformer(mesh, 2).numbers[0] = 9;
    expectUpload(", 0, 0, 88");
    deformer(mesh, 1).numbers[4] = 8;
    deformer(mesh, 0).enabled = false; // the data of the others move to the front
    expectUpload(", 0, 0, 56");
    deformer(mesh, 2).numbers[4] = 7;
    runtime().plan({.function = "clEnqueueWriteBuffer"});
    evaluate();
    EXPECT_FALSE(mesh.status().ok());
    expectUpload(", 0, 0, 56"); // all bytes whose upload may have failed
}

// Returns what the kernels read and write, one pair of letters each: R is the rest pose, V the
// vertex buffer, A and B are memory of the pool. `first` is 0 for positions and 1 for normals.
std::string memoryOf(const Lines& kernelLines, std::size_t first)
{
    std::map<std::string, char> letters;
    std::string text;
    char next = 'A';
    for (std::size_t i = 0; i < kernelLines.size(); ++i) {
        const Lines memory = namesAt(kernelLines[i], kernelLines[i].rfind('['));
        text += text.empty() ? "" : " ";
        letters.try_emplace(memory[first], i == 0 ? 'R' : next);
        text += letters[memory[first]];
        if (letters.try_emplace(memory[first + 2], i + 1 == kernelLines.size() ? 'V' : next).second)
            next = static_cast<char>(next + 1);
        text += letters[memory[first + 2]];
    }
    return text;
}

TEST_F(ImplicitModesTest, DeformersRunInPlaceUnlessTheyReadNeighbours)
{
    // i: may run in place, n: reads neighbours, -: not enabled, 2: two passes
    for (const auto& [chain, memory] : {std::pair("n", "RV"),
                                        {"ii", "RA AV"},
                                        {"nnnn", "RA AB BA AV"},
                                        {"nin", "RA AA AV"},
                                        {"ini", "RA AB BV"},
                                        {"innii", "RA AB BA AA AV"},
                                        {"i-n", "RA AV"},
                                        {"-n-", "RV"},
                                        {"n22", "RA AB BA AB BV"}}) {
        makeEvaluator();
        vyra::DeformableMesh& mesh = addMesh();
        for (const char kind : std::string(chain)) {
            auto& added = mesh.add<TestDeformer>();
            added.neighbours = kind == 'n' || kind == '2';
            added.enabled = kind != '-';
            added.passes = kind == '2' ? 2 : 1;
        }
        evaluate();
        for (int evaluation = 0; evaluation < 2; ++evaluation) {
            const Lines kernelLines = linesOf(callsOfEvaluation(), "clEnqueueNDRangeKernel");
            EXPECT_EQ(memoryOf(kernelLines, 0), memory) << chain;
            EXPECT_EQ(memoryOf(kernelLines, 1), memory) << chain;
        }
        EXPECT_LE(evaluator->counts().buffersCreated, 4U) << chain;
    }
}

TEST_F(ImplicitModesTest, WithoutEnabledDeformersRestPoseIsCopiedOnce)
{
    vyra::DeformableMesh& mesh = addMesh();
    auto& deformer = mesh.add<TestDeformer>();
    const auto expect = [&](bool enabled, unsigned passes, std::size_t kernelsRun,
                            std::size_t copies) {
        deformer.enabled = enabled;
        deformer.passes = passes;
        const Lines lines = callsOfEvaluation();
        EXPECT_EQ(countOf(lines, "clEnqueueNDRangeKernel"), kernelsRun);
        EXPECT_EQ(countOf(lines, "clEnqueueCopyBuffer"), copies);
    };
    expect(false, 1, 0, 2);
    expect(false, 1, 0, 0);
    expect(true, 0, 0, 0);
    expect(true, 1, 1, 0);
    expect(true, 0, 0, 2);
    runtime().plan({.function = "clEnqueueCopyBuffer", .nth = 2});
    expect(true, 1, 1, 0);
    expect(false, 1, 0, 2); // the second one fails
    EXPECT_FALSE(mesh.status().ok());
    expect(false, 1, 0, 2);
    expect(false, 1, 0, 0);
}

TEST_F(ImplicitModesTest, SharedConstantsAreUploadedOnce)
{
    const auto geometry = grid(4, "shared");
    std::vector<vyra::DeformableMesh*> meshes;
    const vyra::ConstantArray weights(std::vector<float>{1, 2, 3});
    calls();
    for (int i = 0; i < 4; ++i) {
        meshes.push_back(&addMesh(geometry));
        meshes.back()->add<TestDeformer>("skin", "full").weights = weights;
    }
    EXPECT_TRUE(evaluator->prepare().ok());
    EXPECT_EQ(linesOf(calls(), "clCreateBuffer").size(), 3 + runtime().created(Kind::kQueue) - 2)
        << "positions, normals, weights, and the frame data of each queue";
    Lines lines = callsOfEvaluation();
    EXPECT_EQ(countOf(lines, "clCreateBuffer"), 0U);
    deformer(*meshes[0]).weights = vyra::ConstantArray(std::vector<float>{4});
    deformer(*meshes[1]).weights = {};
    lines = callsOfEvaluation();
    EXPECT_EQ(countOf(lines, "clCreateBuffer"), 1U);
    EXPECT_EQ(countOf(lines, "clSetKernelArg"), 2U);
    EXPECT_TRUE(evaluator->status().ok()) << evaluator->status().message;
}

// Each is acquired on its mesh's queue; one command releases all.
TEST_F(EvaluatorTest, UnbatchedBuffersAreReleasedTogetherAfterRendererCommands)
{
    setEnvironment("VYRA_OPENCL_FORCE_THREADING", "1");
    startIn(1, 1);
    addChain();
    addChain();
    evaluate();
    for (int i = 0; i < 2; ++i) {
        const Lines lines = callsOfEvaluation();
        EXPECT_EQ(lines[0], "finishRenderer()");
        EXPECT_EQ(countOf(lines, "clEnqueueAcquire"), 4U);
        EXPECT_EQ(countOf(lines, "clEnqueueAcquireGLObjects(queue#1"), 0U);
        EXPECT_EQ(countOf(lines, "clEnqueueReleaseGLObjects(queue#1"), 1U);
        EXPECT_EQ(countOf(lines, "clEnqueueRelease"), 1U);
        evaluator->waitUntilDrawable();
    }
    EXPECT_EQ(evaluator->batchSize(), 0U);
    EXPECT_EQ(evaluator->counts().acquires, 12U);
    EXPECT_EQ(evaluator->counts().releases, 3U);
    EXPECT_EQ(evaluator->counts().evaluations, 3U);
}

struct ModeRow : Named {
    int graphicsToCL;
    int clToGraphics;
    const char* beforeEvaluation;     // the first function that evaluate calls
    const char* whenDrawable;         // functions of waitUntilDrawable
    const char* afterRendering;       // functions of renderingComplete
    cl_int finalStatus = CL_COMPLETE; // of each command
};

class EvaluatorModeTest : public EvaluatorTest, public ::testing::WithParamInterface<ModeRow> {
protected:
    // Returns the names of the functions called, without clFlush, each followed by a space.
    std::string functions()
    {
        std::string names;
        for (const std::string& line : calls()) {
            if (!line.starts_with("clFlush("))
                names += functionOf(line) + ' ';
        }
        return names;
    }
};

TEST_P(EvaluatorModeTest, EvaluatorMakesWaitsOfMode)
{
    settings.flushRenderer = [] { runtime().log("flushRenderer()"); };
    startIn(GetParam().graphicsToCL, GetParam().clToGraphics);
    addChain();
    frame();
    runtime().scriptEventStatuses({CL_RUNNING, CL_RUNNING, GetParam().finalStatus});
    calls();
    evaluate();
    EXPECT_THAT(functions(), testing::StartsWith(GetParam().beforeEvaluation));
    evaluator->waitUntilDrawable();
    EXPECT_EQ(functions(), GetParam().whenDrawable);
    evaluator->renderingComplete();
    EXPECT_EQ(functions(), GetParam().afterRendering);
}
INSTANTIATE_TEST_SUITE_P(
    Modes, EvaluatorModeTest,
    ::testing::Values(
        ModeRow{"Implicit", 1, 1, "clRetainEvent ", "", "flushRenderer "},
        ModeRow{"FinishAndQuery", 3, 2, "finishRenderer ",
                "clGetEventInfo clGetEventInfo clGetEventInfo ", "flushRenderer "},
        ModeRow{"QueryOfFailedCommand", 1, 2, "clRetainEvent ",
                "clGetEventInfo clGetEventInfo clGetEventInfo clGetEventInfo ", "flushRenderer ",
                CL_OUT_OF_RESOURCES},
        ModeRow{"FenceAndSyncObject", 2, 3, "clRetainEvent ", "", "glFenceSync flushRenderer "},
        ModeRow{"Finish", 1, 4, "clRetainEvent ", "clFinish clFinish ", "flushRenderer "}),
    ::testing::PrintToStringParamName());

// Under ThreadSanitizer a missing lock shows as a race here.
TEST_F(ImplicitModesTest, KernelsAreReplacedWhileQueuesDeform)
{
    constexpr std::size_t kMeshes = 24;
    const auto geometry = grid(4, "shared");
    const vyra::ConstantArray weights(std::vector<float>{1, 2});
    std::vector<vyra::DeformableMesh*> meshes;
    for (std::size_t i = 0; i < kMeshes; ++i) {
        meshes.push_back(&addMesh(geometry));
        meshes.back()->add<TestDeformer>("skin", "full").weights = weights;
        meshes.back()->add<TestDeformer>("twist").file = i % 3 ? "test.cl" : "missing.cl";
    }
    for (unsigned round = 0; round < 20; ++round) {
        for (vyra::DeformableMesh* mesh : meshes)
            deformer(*mesh).numbers[0] = static_cast<float>(round);
        if (round % 5 == 4) {
            EXPECT_TRUE(evaluator->replaceKernelFile("test.cl", kKernelText).ok());
        }
        EXPECT_EQ(countOf(callsOfEvaluation(), "clEnqueueNDRangeKernel"), kMeshes * 4 / 3);
        for (std::size_t i = 0; i < kMeshes; ++i)
            EXPECT_EQ(meshes[i]->status().ok(), i % 3 != 0);
        EXPECT_EQ(evaluator->counts().programsBuilt, 1 + (round + 1) / 5);
    }
}

TEST_F(EvaluatorTest, TraceReceivesEachCommandOnceInHostTime)
{
    host().sampling = true;
    std::int64_t now = 0;
    std::map<std::string, int> commands;
    settings.traceClock = [&now] { return now += 1'000'000; };
    settings.traceCommand = [&](const std::string& track, const char* name, std::int64_t begin,
                                std::int64_t end) {
        EXPECT_EQ(track, "OpenCL queue 1");
        EXPECT_LT(begin, end);
        EXPECT_GT(begin, 0);
        ++commands[name];
    };
    startIn(1, 1);
    addChain();
    runtime().holdCommands(true);
    for (int i = 0; i < 2; ++i)
        frame();
    EXPECT_EQ(commands, (std::map<std::string, int>{{"Upload", 1}, {"skin", 2}, {"twist", 2}}));
}

} // namespace
