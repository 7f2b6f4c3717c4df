// A steady evaluation allocates nothing. If an earlier allocation fails, nothing stays acquired,
// nothing leaks, and the next evaluation succeeds.
#include "FailingAllocations.h"
#include "ScriptedEvaluator.h"

#include <utility>

#include <tbb/global_control.h>

using namespace scripted;

namespace {

class EvaluatorAllocationTest : public EvaluatorTest {
protected:
    void SetUp() override { startIn(2, 3); }

    // Runs the operation with each of its allocations failing in turn, until none does, on a
    // subject that `prepare` creates. Returns how many allocations failed.
    template <typename Prepare, typename Operation>
    unsigned failEach(const Prepare& prepare, const Operation& operation)
    {
        for (unsigned nth = 1;; ++nth) {
            SCOPED_TRACE(nth);
            makeEvaluator();
            prepare();
            allocationsLeft = nth;
            operation();
            if (std::exchange(allocationsLeft, 0U) != 0)
                return nth - 1;
            EXPECT_EQ(runtime().acquired(), Lines{});
            frame();
            EXPECT_TRUE(evaluator->status().ok()) << evaluator->status().message;
            EXPECT_EQ(runtime().acquired(), Lines{});
            EXPECT_EQ(linesOf(leftOver(), "program"), leftOver())
                << "objects other than the store's programs";
            if (HasFailure())
                return nth;
        }
    }

    // One thread: allocations are counted by thread.
    tbb::global_control fOneThread{tbb::global_control::max_allowed_parallelism, 1};
};

TEST_F(EvaluatorAllocationTest, SteadyStateAllocatesNothing)
{
    vyra::DeformableMesh& mesh = addChain();
    mesh.add<TestDeformer>().neighbours = true;
    addMesh().add<TestDeformer>("skin", "full");
    for (int i = 0; i < 3; ++i) {
        deformer(mesh).numbers[0] += 1;
        frame();
    }
    for (const bool changed : {false, true}) {
        deformer(mesh).numbers[0] += changed ? 1 : 0;
        allocations = 0;
        evaluate();
        EXPECT_EQ(allocations, 0U) << changed;
        EXPECT_TRUE(evaluator->status().ok());
    }
}

TEST_F(EvaluatorAllocationTest, FailedAllocationInGrowingEvaluationIsReported)
{
    const auto prepare = [this] {
        vyra::DeformableMesh& mesh = addChain();
        addChain();
        frame();
        deformer(mesh).numbers.resize(400, 7);
        mesh.add<TestDeformer>("smooth", "full").passes = 3;
        addChain();
    };
    EXPECT_GT(failEach(prepare, [this] { evaluate(); }), 20U);
}

TEST_F(EvaluatorAllocationTest, FailedAllocationInHostsEvaluationIsReported)
{
    const auto run = [this] {
        {
            const InsideRuntime notCounted;
            manager().PreEvaluate(em::Id(7));
            addMesh().add<TestDeformer>();
        }
        evaluator->deform();
        const InsideRuntime notCounted;
        manager().PostEvaluate(em::Id(7));
    };
    const auto prepare = [this] {
        addChain();
        addChain();
    };
    EXPECT_GT(failEach(prepare, run), 20U);
}

TEST_F(EvaluatorAllocationTest, FailedCreateMeshLeavesNothing)
{
    const auto geometry = grid(4, "geometry of a name that is not short");
    const auto create = [&] {
        try {
            evaluator->createMesh(geometry, {.positions = 90, .normals = 91});
        } catch (const std::bad_alloc&) {
            const InsideRuntime notCounted;
            EXPECT_EQ(evaluator->batchSize(), 0U);
        }
    };
    EXPECT_GT(failEach([] {}, create), 5U);
}

TEST_F(EvaluatorAllocationTest, FailedAllocationKeepsShapeOfCpuMeshes)
{
    std::size_t written = 0;
    settings.writeVertices = [&](vyra::DeformableMesh& mesh, const vyra::Surface& surface) {
        EXPECT_EQ(surface.vertexCount(), mesh.geometry().rest.vertexCount());
        ++written;
    };
    const auto prepare = [this] {
        for (int i = 0; i < 2; ++i)
            addMesh(kSmallest - 1).add<TestDeformer>();
    };
    EXPECT_GT(failEach(prepare, [this] { evaluate(); }), 1U);
    EXPECT_GT(written, 0U);
}

TEST_F(EvaluatorAllocationTest, FailedAllocationKeepsFormerKernelFile)
{
    const auto prepare = [this] {
        addChain();
        addChain();
        frame();
    };
    const auto replace = [this] {
        try {
            EXPECT_TRUE(evaluator->replaceKernelFile("test.cl", kKernelText).ok());
        } catch (const std::bad_alloc&) {
            return; // the former kernels stay in use
        }
        evaluate();
    };
    EXPECT_GT(failEach(prepare, replace), 10U);
    expectedLeft = leftOver(); // the store keeps a program whose kernel ran out of memory
    EXPECT_LT(expectedLeft.size(), 4U);
}

} // namespace
