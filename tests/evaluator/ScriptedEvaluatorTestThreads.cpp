// Many meshes over several queues, and kernels that are replaced meanwhile. Under ThreadSanitizer a
// lock that is missing shows as a race here.
#include "ScriptedEvaluator.h"

using namespace scripted;

namespace {

TEST_F(EvaluatorTest, ManyMeshesOverSeveralQueuesWhileKernelsAreReplaced)
{
    constexpr int kMeshes = 24;
    constexpr int kRounds = 20;
    startIn(1, 1);
    const auto geometry = grid(4, "shared");
    const vyra::ConstantArray weights(std::vector<float>{1, 2});
    std::vector<vyra::DeformableMesh*> meshes;
    for (int i = 0; i < kMeshes; ++i) {
        meshes.push_back(&addMesh(geometry));
        meshes.back()->add<TestDeformer>("skin", "full").weights = weights;
        meshes.back()->add<TestDeformer>("twist").file = i % 3 ? "test.cl" : "missing.cl";
    }
    for (int round = 0; round < kRounds; ++round) {
        for (vyra::DeformableMesh* mesh : meshes)
            deformer(*mesh).numbers[0] = static_cast<float>(round);
        if (round % 5 == 4) {
            EXPECT_TRUE(evaluator->replaceKernelFile("test.cl", kKernelText).ok());
        }
        const Lines lines = callsOfEvaluation();
        EXPECT_EQ(countOf(lines, "clEnqueueNDRangeKernel"), 2U * (kMeshes - kMeshes / 3));
        EXPECT_EQ(evaluator->status().message, meshes[0]->status().message);
        for (int i = 0; i < kMeshes; ++i)
            EXPECT_EQ(meshes[static_cast<std::size_t>(i)]->status().ok(), i % 3 != 0);
    }
    EXPECT_EQ(evaluator->counts().programsBuilt, 1U + kRounds / 5);
}

} // namespace
