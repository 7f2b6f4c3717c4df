// Makes each OpenCL and OpenGL call of an evaluation fail, once and permanently: affected meshes
// report it and all others are deformed, every enqueued command is reported to the release, nothing
// stays acquired, and later evaluations succeed.
#include "ScriptedEvaluator.h"

#include <algorithm>
#include <iterator>
#include <map>
#include <set>
#include <string_view>

#include <tbb/global_control.h>

using namespace scripted;
using testing::HasSubstr;

namespace {

constexpr std::size_t kMeshes = 3;

enum class Start {
    kFirst,    // kernels are built and constants uploaded in the evaluation that fails
    kSteady,   // after two evaluations
    kRestPose, // the same, with all deformers disabled
    kInHosts   // the meshes are created, and deformed, in an evaluation that the host opened
};

struct Row : Named {
    Start start;
    bool batching;
    int graphicsToCL;
    int clToGraphics;
};

bool isRelease(const std::string& function)
{
    return function == "clEnqueueReleaseGLObjects";
}

class EvaluatorFaultTest : public EvaluatorTest, public ::testing::WithParamInterface<Row> {
protected:
    void SetUp() override
    {
        if (!GetParam().batching)
            setEnvironment("VYRA_OPENCL_FORCE_THREADING", "1");
        startIn(GetParam().graphicsToCL, GetParam().clToGraphics);
    }

    void prepareSubject();
    void run();
    void runWith(const Fault& fault, const Lines& functions);
    void checkFailure(const Fault& fault, const Lines& functions, const Lines& lines);
    void checkReported(const Lines& lines);
    void recover(bool releaseFailed);
    std::size_t deformedMeshes(const Lines& lines) const;

    static bool in(Start start) { return GetParam().start == start; }
    static bool batched() { return GetParam().batching && !in(Start::kInHosts); }

    std::vector<vyra::DeformableMesh*> fMeshes;
    // One thread: the calls are in the same order in each run.
    tbb::global_control fOneThread{tbb::global_control::max_allowed_parallelism, 1};
};

// Creates an evaluator and its meshes, ready for the evaluation that will fail.
void EvaluatorFaultTest::prepareSubject()
{
    makeEvaluator();
    fMeshes.clear();
    if (!in(Start::kInHosts)) {
        while (fMeshes.size() < kMeshes)
            fMeshes.push_back(&addChain());
    }
    for (int i = 0; (in(Start::kSteady) || in(Start::kRestPose)) && i < 2; ++i)
        frame();
    for (vyra::DeformableMesh* mesh : fMeshes) {
        deformer(*mesh).numbers[0] += 1;
        for (const auto& each : mesh->deformers())
            each->enabled = !in(Start::kRestPose);
    }
    calls();
}

void EvaluatorFaultTest::run()
{
    if (!in(Start::kInHosts)) {
        frame();
        return;
    }
    manager().PreEvaluate(em::Id(7));
    while (fMeshes.size() < kMeshes)
        fMeshes.push_back(&addChain());
    evaluator->deform();
    manager().PostEvaluate(em::Id(7));
    evaluator->waitUntilDrawable();
    evaluator->renderingComplete();
}

std::size_t EvaluatorFaultTest::deformedMeshes(const Lines& lines) const
{
    const char* command = in(Start::kRestPose) ? "clEnqueueCopyBuffer" : "clEnqueueNDRangeKernel";
    return static_cast<std::size_t>(std::ranges::count_if(
               linesOf(lines, command),
               [](const std::string& line) { return line.find(" ! ") == std::string::npos; })) /
           2;
}

// Returns the number of meshes that fail if one call of the function fails.
std::size_t failingMeshes(const std::string& function, bool batching)
{
    constexpr std::string_view kOne =
        "clEnqueueNDRangeKernel clEnqueueCopyBuffer clSetKernelArg clCreateKernel "
        "clCreateProgramWithSource clBuildProgram clGetProgramBuildInfo clGetKernelInfo "
        "clGetKernelWorkGroupInfo clCreateFromGLBuffer clGetMemObjectInfo";
    if (function == "clEnqueueAcquireGLObjects")
        return batching ? kMeshes : 1;
    return kOne.find(function) != std::string_view::npos ? 1 : 0;
}

void EvaluatorFaultTest::checkFailure(const Fault& fault, const Lines& functions,
                                      const Lines& lines)
{
    std::size_t failed = 0;
    for (const vyra::DeformableMesh* mesh : fMeshes) {
        const vyra::Status& status = mesh->status();
        if (status.ok())
            continue;
        ++failed;
        EXPECT_THAT(status.message, HasSubstr("mesh '" + mesh->geometry().name + "': "));
        EXPECT_NE(status.openCL, CL_SUCCESS) << status.message;
    }
    EXPECT_GE(deformedMeshes(lines) + failed, kMeshes);
    if (fault.onwards)
        return;
    const std::string& function = functions[fault.nth - 1];
    // Memory belongs to one mesh or to one queue, an upload to one queue.
    if (function == "clEnqueueWriteBuffer" || function == "clCreateBuffer")
        EXPECT_THAT(failed, testing::AllOf(testing::Ge(1U), testing::Lt(kMeshes)));
    else if (function == "clEnqueueMarkerWithWaitList") // of a queue, or after the release
        EXPECT_LE(failed, 1U);
    else
        EXPECT_EQ(failed, failingMeshes(function, batched()));
    const bool releaseFails = isRelease(function) && !batched();
    EXPECT_EQ(evaluator->status().ok(), failed == 0 && !releaseFails)
        << evaluator->status().message;
    if (!isRelease(function))
        checkReported(lines);
}

// Requires that the release waits for the last command of each queue that acquired buffers, and
// that the batch's release waits for the last command of each queue.
void EvaluatorFaultTest::checkReported(const Lines& lines)
{
    std::map<std::string, std::string> lastEvents; // by queue
    std::set<std::string> acquiring;               // queues that acquired outside the batch
    Lines reported;
    for (const std::string& line : linesOf(lines, "clEnqueue")) {
        const std::size_t event = line.rfind(" = event#");
        if (isRelease(functionOf(line))) {
            std::ranges::copy(namesAt(line, line.rfind('[')), std::back_inserter(reported));
        } else if (event != std::string::npos) {
            const std::size_t begin = line.find("queue#");
            const std::string queue = line.substr(begin, line.find_first_of(",)", begin) - begin);
            lastEvents[queue] = line.substr(event + 3);
            if (functionOf(line) == "clEnqueueAcquireGLObjects")
                acquiring.insert(queue);
        }
    }
    lastEvents.erase("queue#1");
    for (const auto& [queue, event] : lastEvents) {
        if (batched() || acquiring.contains(queue)) {
            EXPECT_THAT(reported, testing::Contains(event)) << queue;
        }
    }
}

// Requires that the next evaluation succeeds; after a failed release the second one, because the
// runtime rejects buffers that are still acquired.
void EvaluatorFaultTest::recover(bool releaseFailed)
{
    for (int i = 0; i < (releaseFailed ? 2 : 1); ++i) {
        for (vyra::DeformableMesh* mesh : fMeshes)
            deformer(*mesh).numbers[0] += 1;
        calls();
        run();
    }
    EXPECT_EQ(runtime().acquired(), Lines{});
    // A mesh whose creation failed keeps its status.
    std::size_t created = 0;
    for (const vyra::DeformableMesh* mesh : fMeshes) {
        created += mesh->status().ok() ? 1 : 0;
        EXPECT_THAT(mesh->status().message,
                    testing::AnyOf("", HasSubstr("buffer of"), HasSubstr("rest pose")));
    }
    if (!in(Start::kRestPose)) {
        EXPECT_EQ(deformedMeshes(calls()), created);
    }
}

void EvaluatorFaultTest::runWith(const Fault& fault, const Lines& functions)
{
    SCOPED_TRACE(functions[fault.nth - 1] + ", call " + std::to_string(fault.nth) +
                 (fault.onwards ? " and all later" : ""));
    prepareSubject();
    runtime().plan(fault);
    run();
    runtime().clearFaults();
    const Lines lines = calls();
    const auto first = functions.begin() + fault.nth - 1;
    const bool releaseFailed =
        std::any_of(first, fault.onwards ? functions.end() : first + 1, isRelease);
    if (!releaseFailed) {
        EXPECT_EQ(runtime().acquired(), Lines{});
    }
    checkFailure(fault, functions, lines);
    recover(releaseFailed);
    EXPECT_EQ(leftOver(), Lines{});
    // The rules require the release of a batch whose acquire failed, and the acquire of one whose
    // release failed.
    for (const std::string& note : runtime().takeMisuse())
        EXPECT_THAT(note, testing::AnyOf("clEnqueueReleaseGLObjects: not acquired",
                                         "clEnqueueAcquireGLObjects: already acquired"));
    warnings();
}

TEST_P(EvaluatorFaultTest, EachFailingCallIsReportedAndRetrySucceeds)
{
    // The second run equals all later ones: the renderer's fence is pending.
    Lines functions;
    for (int i = 0; i < 2; ++i) {
        prepareSubject();
        run();
        functions = functionsOf(calls());
        ASSERT_TRUE(evaluator->status().ok()) << evaluator->status().message;
        EXPECT_EQ(leftOver(), Lines{});
    }
    for (unsigned nth = 1; nth <= functions.size(); ++nth) {
        for (const bool onwards : {false, true})
            runWith({.function = "*", .nth = nth, .onwards = onwards}, functions);
        if (HasFailure())
            break; // later faults would report the same
    }
}

INSTANTIATE_TEST_SUITE_P(Evaluator, EvaluatorFaultTest,
                         ::testing::Values(Row{"First", Start::kFirst, true, 2, 3},
                                           Row{"FirstUnbatched", Start::kFirst, false, 1, 2},
                                           Row{"SteadyQuery", Start::kSteady, true, 1, 2},
                                           Row{"SteadySync", Start::kSteady, true, 2, 3},
                                           Row{"SteadyFinish", Start::kSteady, true, 3, 4},
                                           Row{"SteadyUnbatched", Start::kSteady, false, 2, 3},
                                           Row{"RestPose", Start::kRestPose, true, 2, 3},
                                           Row{"RestUnbatched", Start::kRestPose, false, 1, 2},
                                           Row{"InHosts", Start::kInHosts, true, 2, 3},
                                           Row{"InHostsUnbatched", Start::kInHosts, false, 1, 2}),
                         ::testing::PrintToStringParamName());

} // namespace
