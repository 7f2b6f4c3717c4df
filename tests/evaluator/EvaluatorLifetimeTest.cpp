// Evaluations that the host opens, and the order of destruction: the runtime reports as misuse if
// memory is released while an incomplete command uses it.
#include "ScriptedEvaluator.h"

#include "bridge/IDeformerEvaluatorBridge.h"

using namespace scripted;
using testing::HasSubstr;

namespace {

const em::Id kHosts(7);

class EvaluatorLifetimeTest : public EvaluatorTest {
protected:
    // Starts with two meshes that have been drawn. Later commands stay incomplete.
    void startWithMeshes(int clToGraphics = 1)
    {
        startIn(1, clToGraphics);
        fMesh = &addChain();
        fOther = &addChain();
        frame();
        frame();
        runtime().holdCommands(true);
        calls();
    }
    // Evaluates twice within an evaluation of the host.
    void expectHostsStaysOpen(bool inBatch, bool acquireFails)
    {
        if (acquireFails)
            runtime().plan({.function = "clEnqueueAcquireGLObjects"});
        manager().PreEvaluate(kHosts);
        runtime().clearFaults();
        if (evaluator->batchSize() == 0 && !fMesh)
            addChain();
        calls();
        evaluator->evaluate(kHosts);
        evaluator->evaluate(kHosts);
        EXPECT_EQ(evaluator->status().ok(), !acquireFails);
        EXPECT_EQ(callsOf("clEnqueueReleaseGLObjects(queue#1").size(), inBatch ? 0U : 2U);
        manager().PostEvaluate(kHosts);
        EXPECT_EQ(callsOf("clEnqueueReleaseGLObjects(queue#1").size(), inBatch ? 1U : 0U);
        if (acquireFails) {
            EXPECT_FALSE(warnings().empty());
            runtime().takeMisuse(); // the release after the failed acquire
        }
    }

    vyra::DeformableMesh* fMesh = nullptr;
    vyra::DeformableMesh* fOther = nullptr;
};

TEST_F(EvaluatorLifetimeTest, DestroyMeshAfterEvaluationWaitsForCommands)
{
    startWithMeshes();
    evaluate();
    evaluator->destroyMesh(*fMesh);
    EXPECT_EQ(evaluator->batchSize(), 2U);
    EXPECT_EQ(countOf(callsOfEvaluation(), "clEnqueueNDRangeKernel"), 2U);
    manager().PreEvaluate(kHosts);
    evaluator->destroyMesh(*fOther);
    evaluator->deform();
    manager().PostEvaluate(kHosts);
    EXPECT_TRUE(evaluator->status().ok());
}

TEST_F(EvaluatorLifetimeTest, DestroyMeshInHostsEvaluationReleasesItFirst)
{
    startWithMeshes();
    manager().PreEvaluate(kHosts);
    EXPECT_TRUE(evaluator->deform().ok());
    evaluator->destroyMesh(*fMesh);
    EXPECT_EQ(callsOf("clEnqueueRelease").size(), 2U) << "one for each vertex buffer of the mesh";
    manager().PostEvaluate(kHosts);
    EXPECT_EQ(callsOf("clEnqueueRelease").size(), 1U) << "the rest of the batch";
    evaluate();
}

TEST_F(EvaluatorLifetimeTest, DestructorInHostsEvaluationLeavesNothingAcquired)
{
    startWithMeshes(3);
    // A second evaluator, so that the batch has buffers to release in the end.
    vyra::Evaluator second(settings);
    second.createMesh(grid(4, "z"), {.positions = 90, .normals = 91});
    manager().PreEvaluate(kHosts);
    addChain(); // outside the batch
    evaluator->deform();
    addMesh();
    evaluator.reset();
    manager().PostEvaluate(kHosts);
}

TEST_F(EvaluatorLifetimeTest, ReplacedConstantsAndKernelsOutliveCommands)
{
    startWithMeshes();
    for (int i = 0; i < 3; ++i) {
        evaluate();
        deformer(*fMesh).weights = vyra::ConstantArray(std::vector<float>{3});
        if (i == 1) {
            EXPECT_TRUE(evaluator->replaceKernelFile("test.cl", kKernelText).ok());
        }
    }
    runtime().completeCommands();
    evaluate();
    evaluate();
    // The rest pose, the weights in use, the frame data and the memory between the two deformers.
    const std::size_t queues = runtime().created(Kind::kQueue) - 2;
    EXPECT_LE(countOf(runtime().balance(), "mem"), 4U + 4U + 3U + queues + 2 * queues);
}

TEST_F(EvaluatorLifetimeTest, GrowingFrameDataWaitsForKernelsThatReadFormerMemory)
{
    startWithMeshes();
    for (const std::size_t count : {16U, 400U, 4U, 1000U}) {
        deformer(*fMesh).numbers.assign(count, 5);
        evaluate();
        EXPECT_TRUE(evaluator->status().ok());
    }
}

TEST_F(EvaluatorLifetimeTest, GeometryMemoryIsReleasedWithLastMesh)
{
    startIn(1, 1);
    std::shared_ptr<const vyra::MeshGeometry> geometry = grid(4, "shared");
    vyra::DeformableMesh& first = addMesh(geometry);
    vyra::DeformableMesh& second = addMesh(std::move(geometry));
    calls();
    evaluator->destroyMesh(first);
    EXPECT_EQ(callsOf("clReleaseMemObject").size(), 2U) << "the vertex buffers";
    evaluator->destroyMesh(second);
    EXPECT_EQ(callsOf("clReleaseMemObject").size(), 4U) << "and the rest pose";
}

// evaluate() leaves an evaluation that the host opened with the same id open, and closes its own.
TEST_F(EvaluatorLifetimeTest, HostsEvaluationStaysOpen)
{
    startIn(1, 1);
    // Whether the meshes are in the batch when the host opens its evaluation.
    for (const auto& [batched, acquireFails] :
         {std::pair(false, false), {true, false}, {true, true}}) {
        SCOPED_TRACE(testing::Message() << batched << acquireFails);
        makeEvaluator();
        if (batched) {
            addChain();
            frame();
        }
        for (int round = 0; round < 2; ++round)
            expectHostsStaysOpen(batched || round > 0, acquireFails);
        const Lines lines = callsOfEvaluation();
        EXPECT_TRUE(evaluator->status().ok()) << evaluator->status().message;
        EXPECT_EQ(countOf(lines, "clEnqueueReleaseGLObjects(queue#1"), 1U) << "the evaluator's";
    }
}

TEST_F(EvaluatorLifetimeTest, HostsEvaluationStaysOpenWithoutBatching)
{
    setEnvironment("VYRA_OPENCL_FORCE_THREADING", "1");
    startWithMeshes();
    expectHostsStaysOpen(false, false);
    evaluator->destroyMesh(*fMesh); // its buffers are acquired after their last release
}

TEST_F(EvaluatorLifetimeTest, DestructorWithdrawsOnlyItselfFromBridge)
{
    startIn(1, 1);
    IDeformerEvaluatorBridge::setAPI(evaluator.get());
    addChain();
    calls();
    IDeformerEvaluatorBridge::getAPI()->evaluate(em::Id(1));
    EXPECT_EQ(callsOf("clEnqueueNDRangeKernel").size(), 2U);
    {
        const vyra::Evaluator second(settings);
    }
    EXPECT_EQ(IDeformerEvaluatorBridge::getAPI(), evaluator.get());
    evaluator.reset();
    EXPECT_EQ(IDeformerEvaluatorBridge::getAPI(), nullptr);
}

TEST_F(EvaluatorLifetimeTest, TwoEvaluatorsShareTheBatch)
{
    startWithMeshes();
    vyra::Evaluator second(settings);
    second.createMesh(grid(4, "z"), {.positions = 90, .normals = 91}).add<TestDeformer>();
    evaluate();
    evaluate();
    EXPECT_TRUE(evaluator->status().ok()) << evaluator->status().message;
    for (std::uint16_t id = 20; id < 23; ++id)
        second.evaluate(em::Id(id));
    EXPECT_TRUE(second.status().ok()) << second.status().message;
}

TEST_F(EvaluatorTest, WithoutQueueMeshesAreDeformedOnCpuAndStatusNamesReason)
{
    startIn(1, 1);
    runtime().plan({.function = "clCreateCommandQueue", .onwards = true});
    makeEvaluator();
    runtime().clearFaults();
    EXPECT_FALSE(evaluator->usesOpenCL());
    addChain();
    evaluate();
    EXPECT_THAT(evaluator->status().message, HasSubstr("OpenCL creates no command queue"));
    EXPECT_THAT(evaluator->prepare().message, HasSubstr("OpenCL creates no command queue"));
    EXPECT_FALSE(warnings().empty());
}

} // namespace
