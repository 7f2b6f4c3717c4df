// Kernel files: the status of the mesh reports their errors, a replacement is used only if it
// builds with the same arguments, and the host's warning sink receives every warning.
#include "ScriptedEvaluator.h"

#include "diagnostics/CLInternalWarning.h"
#include "diagnostics/CLWarningSink.h"
#include "evaluator/WarningCapture.h"

#include <atomic>
#include <optional>

using namespace scripted;
using testing::HasSubstr;
using testing::StartsWith;

namespace {

class EvaluatorKernelFileTest : public EvaluatorTest {
protected:
    void startWithMesh(const char* file = "test.cl")
    {
        startIn(1, 1);
        fMesh = &addMesh();
        fDeformer = &fMesh->add<TestDeformer>("skin");
        fDeformer->file = file;
        fOther = &addMesh();
        fOther->add<TestDeformer>();
    }
    // Evaluates, and requires that the other mesh is deformed.
    std::string messageOfMesh()
    {
        evaluate();
        EXPECT_TRUE(fOther->status().ok());
        EXPECT_EQ(evaluator->status().message, fMesh->status().message);
        return fMesh->status().message;
    }
    vyra::DeformableMesh* fMesh = nullptr;
    TestDeformer* fDeformer = nullptr;
    vyra::DeformableMesh* fOther = nullptr;
};

TEST_F(EvaluatorKernelFileTest, MissingFileIsFoundAfterItIsCreated)
{
    settings.kernelDirectories.insert(settings.kernelDirectories.begin(), "/nowhere");
    startWithMesh("late.cl");
    EXPECT_EQ(messageOfMesh(),
              "mesh 'a': deformer 'skin': there is no kernel file 'late.cl' in '/nowhere', '" +
                  kernels.string() +
                  "', 'scripted/resources/kernels'; put it there, or add its directory to "
                  "EvaluatorSettings::kernelDirectories");
    writeKernels("late.cl", kKernelText);
    EXPECT_EQ(messageOfMesh(), "");
    fDeformer->file = "/nowhere/at all.cl";
    EXPECT_THAT(messageOfMesh(), HasSubstr("there is no kernel file '/nowhere/at all.cl'; check"));
    fDeformer->file = (kernels / "late.cl").string();
    EXPECT_EQ(messageOfMesh(), "");
}

TEST_F(EvaluatorKernelFileTest, FailedBuildReportsLogAndKeepsFormerKernel)
{
    startWithMesh("own.cl");
    writeKernels("own.cl", "#error");
    const std::string path = "'" + (kernels / "own.cl").string() + "'";
    EXPECT_THAT(messageOfMesh(), StartsWith("mesh 'a': deformer 'skin': the kernel file " + path +
                                            " does not compile:\n"));
    EXPECT_THAT(fMesh->status().message, HasSubstr(machine.buildLog));
    EXPECT_EQ(fMesh->status().openCL, CL_BUILD_PROGRAM_FAILURE);
    EXPECT_EQ(warnings(), (Lines{"OpenCL error: CL_BUILD_PROGRAM_FAILURE", machine.buildLog}));
    EXPECT_EQ(evaluator->prepare().message, fMesh->status().message);
    writeKernels("own.cl", "");
    EXPECT_THAT(messageOfMesh(), HasSubstr(path + " is empty"));
    writeKernels("own.cl", kKernelText);
    runtime().plan({.function = "clCreateProgramWithSource", .status = CL_OUT_OF_HOST_MEMORY});
    EXPECT_THAT(messageOfMesh(), HasSubstr(path + " cannot be built:\nOpenCL error: CL_OUT_OF_HOST_"
                                                  "MEMORY"));
    runtime().plan({.function = "clGetKernelInfo", .status = CL_OUT_OF_RESOURCES});
    EXPECT_THAT(messageOfMesh(), HasSubstr("the kernel 'plain' of own.cl cannot be examined "
                                           "(CL_OUT_OF_RESOURCES)"));
    EXPECT_EQ(messageOfMesh(), "");
    warnings();
}

TEST_F(EvaluatorKernelFileTest, WrongArgumentsAndMissingFunctionAreFoundInReplacement)
{
    writeKernels("own.cl", "kernel void plain(uint count, float* p) {}");
    startWithMesh("own.cl");
    EXPECT_EQ(messageOfMesh(),
              "mesh 'a': deformer 'skin': the kernel 'plain' of own.cl takes 2 arguments, and its "
              "deformer passes 5, with the 5 common ones; make the two agree");
    fDeformer->function = "full";
    EXPECT_EQ(messageOfMesh(), "mesh 'a': deformer 'skin': the kernel file own.cl has no kernel "
                               "'full'; check the names");
    EXPECT_EQ(warnings(), Lines{"OpenCL error: CL_INVALID_KERNEL_NAME"});
    // As a file watcher does.
    EXPECT_THAT(evaluator->replaceKernelFile("own.cl", "#error").message,
                HasSubstr("does not compile"));
    EXPECT_TRUE(evaluator->replaceKernelFile("own.cl", kKernelText).ok());
    EXPECT_EQ(messageOfMesh(), "");
    fDeformer->file = "memory.cl";
    fDeformer->text = "#error";
    EXPECT_THAT(messageOfMesh(), HasSubstr("the kernel file 'memory.cl' does not compile"));
    EXPECT_TRUE(evaluator->replaceKernelFile("memory.cl", kKernelText).ok());
    EXPECT_EQ(messageOfMesh(), "");
    warnings();
}

TEST_F(EvaluatorKernelFileTest, InvalidReplacementChangesNothing)
{
    startWithMesh();
    evaluate();
    const auto replace = [this](const std::string& file, const std::string& text) {
        std::string message = evaluator->replaceKernelFile(file, text).message;
        const Lines lines = callsOfEvaluation();
        EXPECT_EQ(countOf(lines, "clCreateKernel"), 0U) << message;
        EXPECT_EQ(countOf(lines, "clEnqueueNDRangeKernel"), 2U);
        return message;
    };
    EXPECT_THAT(replace("test.cl", "#error"),
                testing::AllOf(StartsWith("the kernel file 'test.cl' does not compile:\n"),
                               HasSubstr(machine.buildLog)));
    EXPECT_EQ(replace("test.cl", "kernel void plain(float* p)"),
              "the kernel 'plain' of test.cl takes 1 arguments, and its deformer passes 5");
    EXPECT_EQ(replace("test.cl", "nothing"),
              "the kernel file test.cl has no kernel 'plain'; check the names");
    EXPECT_EQ(replace("unused.cl", "#error"), "");
    warnings();

    EXPECT_TRUE(evaluator->replaceKernelFile("test.cl", kKernelText + std::string("// new")).ok());
    const Lines lines = callsOfEvaluation();
    EXPECT_EQ(countOf(lines, "clCreateKernel"), 2U);
    EXPECT_EQ(countOf(lines, "clBuildProgram"), 0U);
    EXPECT_EQ(countOf(lines, "clSetKernelArg"), 10U) << "all arguments of the new kernel objects";
    EXPECT_EQ(evaluator->counts().programsBuilt, 2U);
    EXPECT_EQ(evaluator->counts().kernelsCreated, 4U);
    expectedLeft = {"program#4 x1"}; // the store keeps the program that lacks the kernel
}

TEST_F(EvaluatorKernelFileTest, OptionsSelectSeparatePrograms)
{
    startWithMesh();
    fDeformer->options = "-D Fast";
    EXPECT_EQ(messageOfMesh(), "");
    EXPECT_EQ(evaluator->counts().programsBuilt, 2U);
    fDeformer->options = "";
    EXPECT_EQ(messageOfMesh(), "");
    fDeformer->function = "full"; // another kernel of a program that is built
    EXPECT_EQ(messageOfMesh(), "");
    EXPECT_EQ(evaluator->counts().programsBuilt, 2U);
    EXPECT_EQ(runtime().created(Kind::kProgram), 2U);
}

std::atomic<int> received = 0;
const CLWarningSink kReceive = [](const char* /*text*/) { ++received; };

TEST_F(EvaluatorKernelFileTest, SinkReplacedDuringBuildIsKeptAndCalledOnce)
{
    const CLWarningSink hosts = setCLWarningSink(nullptr);
    setCLWarningSink(hosts);
    CLWarningSink former = nullptr;
    {
        const vyra::WarningCapture capture;
        CLInternalWarning("first");
        EXPECT_EQ(capture.text(), "first\n");
        former = setCLWarningSink(kReceive);
        CLInternalWarning("second");
    }
    EXPECT_EQ(warnings(), Lines{"first"});
    EXPECT_EQ(received, 1);
    EXPECT_EQ(setCLWarningSink(former), kReceive) << "the host's new sink stayed installed";
    CLInternalWarning("third"); // the former sink forwards to the host's
    {
        const vyra::WarningCapture capture;
        CLInternalWarning("fourth");
        EXPECT_EQ(capture.text(), "fourth\n");
    }
    EXPECT_EQ(warnings(), (Lines{"third", "fourth"}));
    EXPECT_EQ(setCLWarningSink(hosts), hosts);
}

TEST_F(EvaluatorKernelFileTest, ConcurrentCapturesKeepHostsWarnings)
{
    constexpr int kThreads = 4;
    constexpr int kRounds = 2000;
    setCLWarningSink(kReceive);
    onThreads(kThreads, [](int thread) {
        for (int round = 0; round < kRounds; ++round) {
            std::optional<vyra::WarningCapture> capture;
            if (thread > 0)
                capture.emplace();
            CLInternalWarning("%d", thread);
            EXPECT_TRUE(!capture || capture->text() == std::to_string(thread) + "\n");
        }
    });
    EXPECT_EQ(received, kThreads * kRounds);
    EXPECT_EQ(setCLWarningSink(kReceive), kReceive);
}

} // namespace
