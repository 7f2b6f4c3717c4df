// What the shared-buffer manager does beside the rules of its model: creation's odd answers, the
// host's window, timeouts, profiling, missing abilities, copies.
#include "Objects.h"
#include "ScriptedTest.h"
#include "host/EvaluationId.h"
#include "host/GLFunctionTable.h"
#include "interop/ProfilerScope.h"

#include <cstddef>
#include <memory>

using namespace scripted;

namespace {

// A record's address serves as a list of one memory object.
static_assert(offsetof(TopenCLSharedBuffer, fMem) == 0);

const em::Id kId(1);

class SharedBufferTest : public ScriptedTest {
protected:
    const TopenCLSharedBuffer* create(int expectedStatus = CL_SUCCESS)
    {
        int status = 1;
        const auto* buffer = makeShared(manager(), &status);
        EXPECT_EQ(status, expectedStatus);
        return buffer;
    }
    void destroy(const TopenCLSharedBuffer* buffer) { manager().DestroySharedCLBuffer(buffer); }
    // One evaluation of a batch, so that what is left alive is what the manager keeps: the events
    // of its acquire and release.
    void expectEventsLeft() { expectLeft({"event#1 x1", "event#2 x1"}); }
    static void evaluate()
    {
        manager().PreEvaluate(kId);
        manager().PostEvaluate(kId);
    }
    static cl_command_queue queue() { return TopenCLInfo::theOne().openCLCommandQueue(); }
    static TopenCLSharedBufferMgr& manager() { return TopenCLInfo::theOne().sharedBufferMgr(); }
};

TEST_F(SharedBufferTest, AHandleWithAStatusIsReleasedOnce)
{
    startInModes(1, 1);
    runtime().plan({.function = "clCreateFromGLBuffer", .status = -60, .withHandle = true});
    EXPECT_EQ(create(-60), nullptr);
    EXPECT_EQ(calls(), (Lines{"clCreateFromGLBuffer(context#1, 1, 7) = mem#1 ! -60",
                              "clReleaseMemObject(mem#1)"}));
    manager().PreEvaluate(kId); // nothing became of it
    EXPECT_EQ(calls(), Lines{});
    manager().PostEvaluate(kId);
}

TEST_F(SharedBufferTest, NoHandleWithSuccessIsNoBuffer)
{
    startInModes(1, 1);
    runtime().scriptNextSharedMem(nullptr);
    EXPECT_EQ(create(), nullptr);
    EXPECT_EQ(calls().size(), 1U);
}

TEST_F(SharedBufferTest, TheSameHandleAgainKeepsOneRecordAndOneReference)
{
    startInModes(1, 1);
    const auto* first = create();
    evaluate();
    ASSERT_TRUE(first->fInBatch);
    runtime().scriptNextSharedMem(first->fMem.get());
    EXPECT_EQ(create(), first);
    EXPECT_TRUE(first->fInBatch);
    EXPECT_EQ(runtime().references(Kind::kMem, first->fMem.get()), 2U) << "record and batch";
    calls();
    manager().PreEvaluate(kId);
    EXPECT_EQ(callsOf("clRetainMemObject").size(), 1U) << "the batch is made anew";
    manager().PostEvaluate(kId);
    destroy(first);
    expectLeft({"event#3 x1", "event#4 x1"});
}

TEST_F(SharedBufferTest, AFailedCreationLeavesTheBatchAsItIs)
{
    startInModes(1, 1);
    const auto* buffer = create();
    evaluate();
    runtime().plan({.function = "clCreateFromGLBuffer"});
    EXPECT_EQ(create(CL_OUT_OF_RESOURCES), nullptr);
    calls();
    manager().PreEvaluate(kId);
    EXPECT_EQ(callsOf("clRetainMemObject"), Lines{});
    manager().PostEvaluate(kId);
    destroy(buffer);
    expectLeft({"event#3 x1", "event#4 x1"});
}

TEST_F(SharedBufferTest, CreationPassesItsArgumentsOn)
{
    startInModes(1, 1);
    unsigned glBuffer = 70000;
    int status = CL_SUCCESS;
    const cl_mem_flags flags = CL_MEM_WRITE_ONLY | cl_mem_flags{1} << 40;
    EXPECT_EQ(manager().CreateSharedCLBuffer(nullptr, flags, &glBuffer, &status), nullptr);
    EXPECT_EQ(status, CL_INVALID_CONTEXT);
    EXPECT_EQ(calls(), Lines{"clCreateFromGLBuffer(null, 1099511627778, 70000) ! -34"});
    expectMisuse("clCreateFromGLBuffer: null");
}

// The first manager of the process alone says that nothing is batched.
class FirstManagerTest : public SharedBufferTest, public ::testing::WithParamInterface<bool> {};

TEST_P(FirstManagerTest, IsTheOnlyOneThatSaysSo)
{
    if (GetParam())
        setEnvironment("VYRA_OPENCL_FORCE_THREADING", "1");
    startInModes(1, 1);
    setEnvironment("VYRA_OPENCL_FORCE_THREADING", "1");
    testing::internal::CaptureStderr();
    {
        const TopenCLSharedBufferMgr second;
    }
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "");
}
INSTANTIATE_TEST_SUITE_P(SharedBuffers, FirstManagerTest, ::testing::Bool());

TEST_F(SharedBufferTest, WithoutBatchingNothingIsProfiled)
{
    setEnvironment("VYRA_OPENCL_FORCE_THREADING", "1");
    startInModes(2, 3);
    host().sampling = true;
    manager().PreEvaluate(kId);
    EXPECT_NE(manager().EnqueueReleaseBatchedSharedCLBuffer(0, nullptr), nullptr);
    manager().PostEvaluate(kId);
    manager().RenderingComplete();
    EXPECT_EQ(calls(), Lines{});
}

TEST_F(SharedBufferTest, AFailedWaitDissolvesTheBatchAllTheSame)
{
    startInModes(1, 1);
    const auto* first = create();
    const auto* second = create();
    evaluate();
    calls();
    runtime().plan({.function = "clWaitForEvents"});
    EXPECT_EQ(manager().DestroySharedCLBuffer(first), CL_OUT_OF_RESOURCES);
    EXPECT_EQ(warnings(), Lines{"OpenCL error: CL_OUT_OF_RESOURCES"});
    EXPECT_FALSE(second->fInBatch);
    EXPECT_EQ(callsOf("clReleaseMemObject").size(), 3U) << "the batch's two and the record's";
    destroy(second);
    expectEventsLeft();
}

TEST_F(SharedBufferTest, ABufferWhoseOwnReleaseFailsLeavesTheBatchAllTheSame)
{
    startInModes(1, 1);
    const auto* first = create();
    const auto* second = create();
    manager().PreEvaluate(kId);
    runtime().plan({.function = "clEnqueueReleaseGLObjects"});
    EXPECT_EQ(manager().DestroyBatchedSharedCLBuffer(first), CL_SUCCESS);
    EXPECT_EQ(warnings(), Lines{"OpenCL error: CL_OUT_OF_RESOURCES"});
    calls();
    manager().PostEvaluate(kId);
    EXPECT_EQ(callsOf("clEnqueueReleaseGLObjects"),
              Lines{"clEnqueueReleaseGLObjects(queue#1, [mem#2], [event#1]) = event#2"});
    destroy(second);
    expectEventsLeft();
}

TEST_F(SharedBufferTest, ABatchWhoseAcquireFailedIsReleasedAllTheSame)
{
    startInModes(1, 1);
    const auto* buffer = create();
    runtime().plan({.function = "clEnqueueAcquireGLObjects"});
    manager().PreEvaluate(kId);
    EXPECT_EQ(warnings(), Lines{"OpenCL error: CL_OUT_OF_RESOURCES"});
    const cl_event other = makeEvent();
    cl_event event = other;
    calls();
    EXPECT_EQ(manager().EnqueueAcquireSharedCLBuffer(nullptr, buffer, &event), CL_SUCCESS);
    EXPECT_EQ(event, nullptr);
    EXPECT_EQ(calls(), Lines{});
    manager().PostEvaluate(kId);
    EXPECT_EQ(callsOf("clEnqueueReleaseGLObjects").size(), 1U);
    expectMisuse("clEnqueueReleaseGLObjects: not acquired");
    EXPECT_EQ(warnings(), Lines{"OpenCL error: CL_INVALID_GL_OBJECT"});
    destroy(buffer);
    ocl.clReleaseEvent(other);
}

TEST_F(SharedBufferTest, AnEvaluationWhoseReleaseFailedIsClosedAllTheSame)
{
    startInModes(1, 3);
    const auto* batched = create();
    manager().PreEvaluate(kId);
    const auto* alone = create();
    const cl_mem mem = alone->fMem.get();
    manager().EnqueueAcquireSharedCLBuffer(queue(), alone, nullptr);
    AutoCLObject<cl_event> released;
    manager().EnqueueReleaseSharedCLBuffer(queue(), 1, &mem, 0, nullptr, released.receive());
    runtime().plan({.function = "clEnqueueReleaseGLObjects"});
    calls();
    manager().PostEvaluate(kId);
    EXPECT_EQ(warnings(), Lines{"OpenCL error: CL_OUT_OF_RESOURCES"});
    EXPECT_EQ(callsOf("glWaitSync").size(), 1U) << "for the single release";
    EXPECT_TRUE(alone->fInBatch);
    EXPECT_EQ(*manager().EnqueueReleaseBatchedSharedCLBuffer(0, nullptr), nullptr);
    manager().PostEvaluate(kId);
    EXPECT_EQ(calls(), Lines{}) << "released but once";
    destroy(batched);
    destroy(alone);
    expectLeft({"event#1 x1"});
}

TEST_F(SharedBufferTest, EveryIdOpensAnEvaluation)
{
    startInModes(1, 1);
    const auto* buffer = create();
    for (const unsigned value : {0U, 0xFFFDU, 0xFFFEU, 0xFFFFU}) {
        const em::Id id(static_cast<std::uint16_t>(value));
        calls();
        manager().PreEvaluate(id);
        if (value != 0xFFFE) // stands for none
            manager().PreEvaluate(id);
        EXPECT_EQ(callsOf("clEnqueueAcquire").size(), 1U) << value;
        manager().PostEvaluate(id);
    }
    destroy(buffer);
    expectLeft({"event#7 x1", "event#8 x1"});
}

TEST_F(SharedBufferTest, SingleCommandsPassWholeListsOn)
{
    startInModes(1, 1);
    const TopenCLSharedBuffer* buffers[] = {create(), create()};
    const cl_mem mems[] = {buffers[0]->fMem.get(), buffers[1]->fMem.get()};
    const cl_command_queue queue = TopenCLInfo::theOne().secondaryOpenCLCommandQueue();
    cl_event events[2] = {};
    calls();
    for (int i = 0; i < 2; ++i)
        EXPECT_EQ(manager().EnqueueAcquireSharedCLBuffer(queue, buffers[i], &events[i]), 0);
    EXPECT_EQ(manager().EnqueueReleaseSharedCLBuffer(queue, 2, mems, 2, events, nullptr), 0);
    EXPECT_EQ(calls(),
              (Lines{"clEnqueueAcquireGLObjects(queue#2, [mem#1], []) = event#1",
                     "clEnqueueAcquireGLObjects(queue#2, [mem#2], []) = event#2",
                     "clEnqueueReleaseGLObjects(queue#2, [mem#1, mem#2], [event#1, event#2])"}));
    for (int i = 0; i < 2; ++i) {
        destroy(buffers[i]);
        ocl.clReleaseEvent(events[i]);
    }
}

TEST_F(SharedBufferTest, TheProfilersScopesEncloseTheCommands)
{
    startInModes(1, 1);
    const auto* buffer = create();
    host().sampling = true;
    for (const auto operation :
         {&TopenCLSharedBufferMgr::PreEvaluate, &TopenCLSharedBufferMgr::PostEvaluate}) {
        calls();
        (manager().*operation)(kId);
        const Lines lines = calls();
        EXPECT_GT(lines.size(), 2U);
        EXPECT_THAT(lines.front(), testing::StartsWith("eventBegin("));
        EXPECT_EQ(lines.back(), "eventEnd(5)");
    }
    EXPECT_STREQ(sfAcquireBatchEventType.description(),
                 "Acquiring the quorview shared buffer from the OpenCl buffer manager");
    EXPECT_STREQ(sfReleaseBatchEventType.description(),
                 "Releasing the quorview shared buffer from the OpenCl buffer manager");
    destroy(buffer);
    expectEventsLeft();
}

TEST_F(SharedBufferTest, BuffersWithoutMemoryAreRefused)
{
    startInModes(1, 1);
    const TopenCLSharedBuffer empty;
    cl_event event = nullptr;
    EXPECT_EQ(manager().EnqueueAcquireSharedCLBuffer(queue(), nullptr, &event),
              CL_INVALID_ARG_VALUE);
    EXPECT_EQ(manager().EnqueueAcquireSharedCLBuffer(queue(), &empty, &event),
              CL_INVALID_ARG_VALUE);
    EXPECT_EQ(calls(), Lines{});
}

TEST_F(SharedBufferTest, SingleCommandsPassTheirArgumentsOn)
{
    startInModes(1, 3);
    const auto* buffer = create();
    const cl_mem mem = buffer->fMem.get();
    const cl_command_queue queue = TopenCLInfo::theOne().secondaryOpenCLCommandQueue();
    cl_event event = nullptr;
    manager().EnqueueAcquireSharedCLBuffer(queue, buffer, &event);
    calls();
    EXPECT_EQ(manager().EnqueueReleaseSharedCLBuffer(queue, 1, &mem, 1, &event, nullptr), 0);
    EXPECT_EQ(calls(), Lines{"clEnqueueReleaseGLObjects(queue#2, [mem#1], [event#1])"});
    // A failed release returns its status, and its event is not waited for.
    cl_event released = event;
    runtime().plan({.function = "clEnqueueReleaseGLObjects", .status = -36});
    EXPECT_EQ(manager().EnqueueReleaseSharedCLBuffer(queue, 1, &mem, 0, nullptr, &released), -36);
    calls();
    destroy(buffer);
    evaluate();
    EXPECT_EQ(callsOf("gl"), Lines{});
    ocl.clReleaseEvent(event);
}

TEST_F(SharedBufferTest, ANullEventIsHandedOverLikeAnyOther)
{
    startInModes(1, 1);
    const auto* buffer = create();
    manager().PreEvaluate(kId);
    const cl_event none = nullptr;
    manager().EnqueueReleaseBatchedSharedCLBuffer(1, &none);
    calls();
    manager().PostEvaluate(kId);
    EXPECT_THAT(callsOf("clEnqueueReleaseGLObjects"),
                testing::ElementsAre(testing::HasSubstr("[event#1, null]")));
    EXPECT_THAT(warnings(), testing::Each(testing::StartsWith("OpenCL error: ")));
    EXPECT_EQ(runtime().takeMisuse().size(), 3U) << "retain, wait list, release";
    destroy(buffer);
    expectLeft({"event#1 x1"}); // of the acquire: a strict runtime refuses such a release
}

TEST_F(SharedBufferTest, AFenceIsWaitedForInSlicesOnceInTheHostsContext)
{
    startInModes(2, 1);
    const ResourceWindow window;
    const auto* buffer = create();
    for (const unsigned last : {0x911AU, 0x911CU, 0x911DU}) { // signalled, satisfied, failed
        manager().RenderingComplete();
        runtime().scriptClientWaits({0x911B, 0x911B, last});
        calls();
        manager().EnqueueAcquireSharedCLBuffer(queue(), buffer, nullptr);
        const Lines waiting = calls();
        EXPECT_EQ(waiting.size(), 7U);
        EXPECT_EQ(waiting[0], "resourceWindow()");
        EXPECT_EQ(waiting[1], "makeCurrent()");
        EXPECT_THAT(waiting[4], ::testing::MatchesRegex("glClientWaitSync.*, 1, 1000000000."));
        EXPECT_THAT(waiting[5], ::testing::StartsWith("glDeleteSync"));
        const cl_mem mem = buffer->fMem.get();
        manager().EnqueueReleaseSharedCLBuffer(queue(), 1, &mem, 0, nullptr, nullptr);
    }
    manager().EnqueueAcquireSharedCLBuffer(queue(), buffer, nullptr);
    EXPECT_EQ(callsOf("gl"), Lines{}) << "each fence is waited for once";
    destroy(buffer);
}

TEST_F(SharedBufferTest, AFenceOutlastsATimeInWhichSyncObjectsCannotBeUsed)
{
    startInModes(2, 1);
    const auto* buffer = create();
    const cl_mem mem = buffer->fMem.get();
    manager().RenderingComplete();
    for (const bool usable : {false, true}) {
        installFunctionTable(usable, false);
        if (!usable)
            manager().RenderingComplete();
        calls();
        manager().EnqueueAcquireSharedCLBuffer(queue(), buffer, nullptr);
        EXPECT_EQ(callsOf("gl").size(), usable ? 2U : 0U) << "wait and delete";
        manager().EnqueueReleaseSharedCLBuffer(queue(), 1, &mem, 0, nullptr, nullptr);
    }
    destroy(buffer);
}

struct AbilityRow {
    bool functionTable;
    bool syncObjects;
    bool syncFromEvents;
    std::size_t fences;
    std::size_t graphicsWaits;
};

TEST_F(SharedBufferTest, OnlyUsableFunctionsAreCalled)
{
    startInModes(2, 3); // chosen while everything was usable
    for (const AbilityRow& row : {AbilityRow{false, false, false, 0, 0},
                                  {true, false, true, 0, 0},
                                  {true, true, false, 1, 0},
                                  {true, true, true, 1, 1}}) {
        removeFunctionTable();
        if (row.functionTable)
            installFunctionTable(row.syncObjects, row.syncFromEvents);
        const auto* buffer = create();
        manager().RenderingComplete();
        EXPECT_EQ(callsOf("glFenceSync").size(), row.fences);
        manager().PreEvaluate(kId);
        EXPECT_EQ(callsOf("resourceWindow").size(), 1U);
        manager().PostEvaluate(kId);
        EXPECT_EQ(callsOf("glWaitSync").size(), row.graphicsWaits);
        destroy(buffer);
    }
    expectLeft({"event#7 x1", "event#8 x1"}); // of the last evaluation
}

TEST_F(SharedBufferTest, ASyncObjectThatCannotBeMadeIsSkipped)
{
    startInModes(1, 3);
    const auto* buffer = create();
    manager().PreEvaluate(kId);
    runtime().plan({.function = "glCreateSyncFromCLeventARB"});
    calls();
    manager().PostEvaluate(kId);
    EXPECT_EQ(callsOf("gl").size(), 1U);
    destroy(buffer);
    expectEventsLeft();
}

TEST_F(SharedBufferTest, AnotherEvaluationAcquiresOnceMore)
{
    startInModes(1, 1);
    const auto* buffer = create();
    manager().PreEvaluate(kId);
    calls();
    manager().PreEvaluate(em::Id(8));
    EXPECT_EQ(callsOf("clEnqueueAcquire").size(), 1U);
    expectMisuse("clEnqueueAcquireGLObjects: already acquired");
    EXPECT_EQ(warnings(), Lines{"OpenCL error: CL_INVALID_GL_OBJECT"});
    manager().PostEvaluate(kId);
    destroy(buffer);
    expectLeft({"event#2 x1"}); // of the release: the last acquire gave none
}

TEST_F(SharedBufferTest, AReleaseWithoutAnEventIsNotWaitedFor)
{
    startInModes(1, 3);
    const auto* buffer = create();
    const cl_mem mem = buffer->fMem.get();
    manager().EnqueueAcquireSharedCLBuffer(queue(), buffer, nullptr);
    runtime().plan({.function = "clEnqueueReleaseGLObjects", .status = CL_SUCCESS});
    cl_event none = nullptr;
    EXPECT_EQ(manager().EnqueueReleaseSharedCLBuffer(queue(), 1, &mem, 0, nullptr, &none), 0);
    EXPECT_EQ(none, nullptr);
    calls();
    manager().PostEvaluate(kId);
    EXPECT_EQ(callsOf("gl"), Lines{});
    destroy(buffer);
}

TEST_F(SharedBufferTest, TheProfilerSeesEveryEvaluationEvenWithoutWork)
{
    startInModes(1, 1);
    host().sampling = true;
    manager().PreEvaluate(kId);
    manager().PreEvaluate(kId); // open already: the scope all the same
    manager().PostEvaluate(kId);
    const std::string acquire =
        "eventBegin(main, 14, GPUOverrideAcquireQuorSharedBufferBatch, \"\", null, 0)";
    EXPECT_EQ(calls(),
              (Lines{acquire, "eventEnd(5)", acquire, "eventEnd(5)",
                     "eventBegin(main, 14, GPUOverrideReleaseQuorSharedBufferBatch, \"\", null, 0)",
                     "eventEnd(5)"}));
}

TEST_F(SharedBufferTest, ACopyHasReferencesOfItsOwnAndAnEmptyList)
{
    startInModes(1, 1);
    const auto* buffer = create();
    manager().PreEvaluate(kId);
    cl_event handed = nullptr;
    manager().EnqueueAcquireSharedCLBuffer(nullptr, buffer, &handed);
    manager().EnqueueReleaseBatchedSharedCLBuffer(1, &handed);
    {
        const TopenCLSharedBufferMgr copy(manager());
        EXPECT_EQ(runtime().references(Kind::kMem, buffer->fMem.get()), 4U);
        // The list of the target pays its references back.
        TopenCLSharedBufferMgr target;
        target.EnqueueReleaseBatchedSharedCLBuffer(1, &handed);
        const unsigned before = runtime().references(Kind::kEvent, handed);
        target = copy;
        TopenCLSharedBufferMgr& itself = target;
        target = itself;
        EXPECT_EQ(runtime().references(Kind::kEvent, handed), before); // one less, one more
    }
    EXPECT_EQ(runtime().references(Kind::kMem, buffer->fMem.get()), 2U);
    manager().PostEvaluate(kId);
    destroy(buffer);
    ocl.clReleaseEvent(handed);
    expectEventsLeft();
}

} // namespace
