// The shared-buffer manager: the exact calls of an evaluation, failures, the host's window,
// time-outs, profiling, missing functions, copies.
#include "ManagerTest.h"
#include "interop/ProfilerScope.h"

#include <cstddef>
#include <future>

using namespace scripted;

namespace {

// A record's address serves as a list of one memory object.
static_assert(offsetof(TopenCLSharedBuffer, fMem) == 0);

using SharedBufferTest = ManagerTest;

TEST_F(SharedBufferTest, EvaluationAcquiresOnceAndReleasesOnceAfterReportedEvents)
{
    const auto* buffer = startWithBuffer(2, 3);
    const TopenCLSharedBuffer* buffers[] = {buffer, create(), create()};
    std::ranges::sort(buffers, {}, [](const auto* one) {
        return reinterpret_cast<std::uintptr_t>(one->fMem.get());
    });
    Lines retains;
    std::string list; // of the memory objects, in the order of their handles
    for (const auto* one : buffers) {
        retains.push_back("clRetainMemObject(" + runtime().name(one->fMem.get()) + ')');
        list += (list.empty() ? "" : ", ") + runtime().name(one->fMem.get());
    }
    const AutoCLObject<cl_event> reported = makeEvent(); // event#1
    manager().RenderingComplete();
    calls();
    manager().PreEvaluate(kId);
    EXPECT_EQ(calls(), (Lines{retains[0], retains[1], retains[2], "resourceWindow()",
                              "glClientWaitSync(sync#1, 1, 1000000000)", "glDeleteSync(sync#1)",
                              "clEnqueueAcquireGLObjects(queue#1, [" + list + "], []) = event#2",
                              "clRetainEvent(event#2)"}));

    AutoCLObject<cl_event> acquired;
    EXPECT_EQ(manager().EnqueueAcquireSharedCLBuffer(nullptr, buffer, acquired.receive()), 0);
    const cl_event events[] = {reported.get(), reported.get(), acquired.get()};
    const cl_event* slot = manager().EnqueueReleaseBatchedSharedCLBuffer(3, events);
    EXPECT_EQ(manager().EnqueueReleaseBatchedSharedCLBuffer(3, nullptr), slot);
    EXPECT_EQ(calls(), (Lines{"clRetainEvent(event#2)", "clRetainEvent(event#1)",
                              "clRetainEvent(event#1)", "clRetainEvent(event#2)"}));
    manager().PostEvaluate(kId);
    EXPECT_EQ(calls(),
              (Lines{"clEnqueueReleaseGLObjects(queue#1, [" + list +
                         "], [event#2, event#1, event#1, event#2]) = event#3",
                     "clReleaseEvent(event#2)", "clReleaseEvent(event#1)",
                     "clReleaseEvent(event#1)", "clReleaseEvent(event#2)",
                     "glCreateSyncFromCLeventARB(context#1, event#3, 0) = sync#2",
                     "glWaitSync(sync#2, 0, 18446744073709551615)", "glDeleteSync(sync#2)"}));
    EXPECT_EQ(runtime().name(*slot), "event#3");
}

TEST_F(SharedBufferTest, GraphicsWaitsForBatchThenForUnbatchedReleasesInOrder)
{
    startWithBuffer(1, 3);
    manager().PreEvaluate(kId);
    const TopenCLSharedBuffer* late[] = {create(), create()};
    AutoCLObject<cl_event> released[2];
    for (int i : {1, 0}) {
        acquire(late[i]);
        release(late[i], released[i].receive());
    }
    calls();
    manager().PostEvaluate(kId);
    EXPECT_EQ(callsOf("glCreateSync"),
              (Lines{"glCreateSyncFromCLeventARB(context#1, event#4, 0) = sync#1",
                     "glCreateSyncFromCLeventARB(context#1, event#2, 0) = sync#2",
                     "glCreateSyncFromCLeventARB(context#1, event#3, 0) = sync#3"}));
}

TEST_F(SharedBufferTest, RenderingCompleteReplacesPendingFenceUnlessItIsAwaited)
{
    const auto* buffer = startWithBuffer(2, 1);
    std::future<void> set;
    host().duringFenceWait = [&] {
        set = std::async(std::launch::async, [&] { manager().RenderingComplete(); });
        EXPECT_EQ(set.wait_for(std::chrono::seconds(10)), std::future_status::ready)
            << "RenderingComplete waited for a lock";
    };
    manager().RenderingComplete();
    manager().RenderingComplete();
    acquire(buffer);
    release(buffer);
    acquire(buffer);
    EXPECT_EQ(callsOf("gl"),
              (Lines{"glFenceSync(37143, 0) = sync#1", "glDeleteSync(sync#1)",
                     "glFenceSync(37143, 0) = sync#2", "glFenceSync(37143, 0) = sync#3",
                     "glClientWaitSync(sync#2, 1, 1000000000)", "glDeleteSync(sync#2)",
                     "glClientWaitSync(sync#3, 1, 1000000000)", "glDeleteSync(sync#3)"}));
}

TEST_F(SharedBufferTest, DestructorReleasesEventsBeforeMemory)
{
    startWithBuffer(1, 1);
    evaluate();
    calls();
    dropManager();
    EXPECT_EQ(calls(), (Lines{"clReleaseEvent(event#2)", "clReleaseEvent(event#1)",
                              "clReleaseMemObject(mem#1)", "clReleaseMemObject(mem#1)"}));
}

TEST_F(SharedBufferTest, FailedCreateReturnsNullAndKeepsBatch)
{
    startWithBuffer(1, 1);
    evaluate();
    calls();
    runtime().plan({.function = "clCreateFromGLBuffer", .status = -60, .withHandle = true});
    EXPECT_EQ(create(-60), nullptr);
    runtime().scriptNextSharedMem(nullptr); // success without a handle
    EXPECT_EQ(create(), nullptr);
    unsigned glBuffer = 70000;
    int status = CL_SUCCESS;
    const cl_mem_flags flags = CL_MEM_WRITE_ONLY | cl_mem_flags{1} << 40;
    EXPECT_EQ(manager().CreateSharedCLBuffer(nullptr, flags, &glBuffer, &status), nullptr);
    EXPECT_EQ(status, CL_INVALID_CONTEXT);
    expectMisuse("clCreateFromGLBuffer: null");
    manager().PreEvaluate(kId);
    EXPECT_EQ(calls(), (Lines{"clCreateFromGLBuffer(context#1, 1, 7) = mem#2 ! -60",
                              "clReleaseMemObject(mem#2)", "clCreateFromGLBuffer(context#1, 1, 7)",
                              "clCreateFromGLBuffer(null, 1099511627778, 70000) ! -34",
                              "clReleaseEvent(event#2)", "clReleaseEvent(event#1)",
                              "clEnqueueAcquireGLObjects(queue#1, [mem#1], []) = event#3",
                              "clRetainEvent(event#3)"}))
        << "the batch is not rebuilt";
    manager().PostEvaluate(kId);
}

TEST_F(SharedBufferTest, CreateWithSameHandleKeepsOneRecord)
{
    const auto* first = startWithBuffer(1, 1);
    evaluate();
    runtime().scriptNextSharedMem(first->fMem.get());
    EXPECT_EQ(create(), first);
    EXPECT_TRUE(first->fInBatch);
    EXPECT_EQ(runtime().references(Kind::kMem, first->fMem.get()), 2U) << "record and batch";
    calls();
    manager().PreEvaluate(kId);
    EXPECT_EQ(callsOf("clRetainMemObject").size(), 1U) << "the batch is rebuilt";
    manager().PostEvaluate(kId);
}

TEST_F(SharedBufferTest, SecondManagerDoesNotReportForcedThreading)
{
    startInModes(1, 1);
    setEnvironment("VYRA_OPENCL_FORCE_THREADING", "1");
    testing::internal::CaptureStderr();
    const TopenCLSharedBufferMgr second;
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "");
}

TEST_F(SharedBufferTest, DestroyDissolvesBatchWhenWaitFails)
{
    const auto* first = startWithBuffer(1, 1);
    const auto* second = create();
    evaluate();
    calls();
    runtime().plan({.function = "clWaitForEvents"});
    EXPECT_EQ(manager().DestroySharedCLBuffer(first), CL_OUT_OF_RESOURCES);
    EXPECT_EQ(warnings(), Lines{"OpenCL error: CL_OUT_OF_RESOURCES"});
    EXPECT_FALSE(second->fInBatch);
    EXPECT_EQ(callsOf("clReleaseMemObject").size(), 3U) << "two of the batch and one of the record";
}

TEST_F(SharedBufferTest, DestroyBatchedLeavesBatchWhenReleaseFails)
{
    const auto* first = startWithBuffer(1, 1);
    create();
    manager().PreEvaluate(kId);
    runtime().plan({.function = "clEnqueueReleaseGLObjects"});
    EXPECT_EQ(manager().DestroyBatchedSharedCLBuffer(first), CL_SUCCESS);
    EXPECT_EQ(warnings(), Lines{"OpenCL error: CL_OUT_OF_RESOURCES"});
    calls();
    manager().PostEvaluate(kId);
    EXPECT_EQ(callsOf("clEnqueueReleaseGLObjects"),
              Lines{"clEnqueueReleaseGLObjects(queue#1, [mem#2], [event#1]) = event#2"});
}

TEST_F(SharedBufferTest, BatchIsReleasedWhenAcquireFailed)
{
    const auto* buffer = startWithBuffer(1, 1);
    const auto* other = create();
    evaluate(); // allocates the wait list's storage; an empty list is passed as null all the same
    runtime().plan({.function = "clEnqueueAcquireGLObjects"});
    manager().PreEvaluate(kId);
    EXPECT_EQ(warnings(), Lines{"OpenCL error: CL_OUT_OF_RESOURCES"});
    auto event = reinterpret_cast<cl_event>(&manager()); // not null
    calls();
    EXPECT_EQ(manager().EnqueueAcquireSharedCLBuffer(nullptr, buffer, &event), CL_SUCCESS);
    EXPECT_EQ(event, nullptr);
    EXPECT_EQ(calls(), Lines{});
    manager().DestroyBatchedSharedCLBuffer(other);
    manager().PostEvaluate(kId);
    EXPECT_EQ(callsOf("clEnqueueReleaseGLObjects").size(), 2U);
    expectMisuse("clEnqueueReleaseGLObjects: not acquired");
    expectMisuse("clEnqueueReleaseGLObjects: not acquired");
    EXPECT_EQ(warnings(), (Lines(2, "OpenCL error: CL_INVALID_GL_OBJECT")));
}

TEST_F(SharedBufferTest, PostEvaluateClosesWhenReleaseFails)
{
    startWithBuffer(1, 3);
    manager().PreEvaluate(kId);
    const auto* unbatched = create();
    AutoCLObject<cl_event> released;
    acquire(unbatched);
    release(unbatched, released.receive());
    runtime().plan({.function = "clEnqueueReleaseGLObjects"});
    calls();
    manager().PostEvaluate(kId);
    EXPECT_EQ(warnings(), Lines{"OpenCL error: CL_OUT_OF_RESOURCES"});
    EXPECT_EQ(callsOf("glWaitSync").size(), 1U) << "for the unbatched release";
    EXPECT_TRUE(unbatched->fInBatch);
    EXPECT_EQ(*manager().EnqueueReleaseBatchedSharedCLBuffer(0, nullptr), nullptr);
    manager().PostEvaluate(kId);
    EXPECT_EQ(calls(), Lines{}) << "released once";
}

TEST_F(SharedBufferTest, PreEvaluateOpensForEveryOtherId)
{
    startWithBuffer(1, 1);
    for (const unsigned value : {0U, 0xFFFDU, 0xFFFEU, 0xFFFFU}) {
        const em::Id id(static_cast<std::uint16_t>(value));
        calls();
        manager().PreEvaluate(id);
        if (value != 0xFFFE) // means no evaluation
            manager().PreEvaluate(id);
        EXPECT_EQ(callsOf("clEnqueueAcquire").size(), 1U) << value;
        manager().PostEvaluate(id);
    }
    manager().PreEvaluate(kId);
    manager().PreEvaluate(em::Id(8));
    EXPECT_EQ(callsOf("clEnqueueAcquire").size(), 2U);
    expectMisuse("clEnqueueAcquireGLObjects: already acquired");
    EXPECT_EQ(warnings(), Lines{"OpenCL error: CL_INVALID_GL_OBJECT"});
    manager().PostEvaluate(kId);
}

TEST_F(SharedBufferTest, UnbatchedCommandsPassWholeListsAndRejectEmptyBuffers)
{
    startIn(1, 1);
    const TopenCLSharedBuffer empty;
    EXPECT_EQ(acquire(nullptr), CL_INVALID_ARG_VALUE);
    EXPECT_EQ(acquire(&empty), CL_INVALID_ARG_VALUE);
    EXPECT_EQ(calls(), Lines{});
    const TopenCLSharedBuffer* buffers[] = {create(), create()};
    const cl_mem mems[] = {buffers[0]->fMem.get(), buffers[1]->fMem.get()};
    const cl_command_queue queue = info().secondaryOpenCLCommandQueue();
    AutoCLObject<cl_event> events[2];
    for (int i = 0; i < 2; ++i)
        manager().EnqueueAcquireSharedCLBuffer(queue, buffers[i], events[i].receive());
    const cl_event list[] = {events[0].get(), events[1].get()};
    EXPECT_EQ(manager().EnqueueReleaseSharedCLBuffer(queue, 2, mems, 2, list, nullptr), 0);
    EXPECT_EQ(callsOf("clEnqueue"),
              (Lines{"clEnqueueAcquireGLObjects(queue#2, [mem#1], []) = event#1",
                     "clEnqueueAcquireGLObjects(queue#2, [mem#2], []) = event#2",
                     "clEnqueueReleaseGLObjects(queue#2, [mem#1, mem#2], [event#1, event#2])"}));
}

TEST_F(SharedBufferTest, GraphicsDoesNotWaitForReleaseWithoutEvent)
{
    const auto* buffer = startWithBuffer(1, 3);
    AutoCLObject<cl_event> acquired;
    acquire(buffer, acquired.receive());
    for (const cl_int status : {-36, CL_SUCCESS}) {
        runtime().plan({.function = "clEnqueueReleaseGLObjects", .status = status});
        cl_event event = status == CL_SUCCESS ? nullptr : acquired.get();
        EXPECT_EQ(release(buffer, &event), status);
    }
    manager().PostEvaluate(kId);
    EXPECT_EQ(callsOf("gl"), Lines{});
}

TEST_F(SharedBufferTest, ProfilerScopesEncloseCommandsEvenIfEmpty)
{
    startWithBuffer(1, 1);
    host().sampling = true;
    // Returns the number of lines in a scope of this type.
    const auto scopeOf = [&](const std::string& type) {
        const Lines lines = calls();
        EXPECT_EQ(lines.front(), "eventBegin(main, 14, " + type + ", \"\", null, 0)");
        EXPECT_EQ(lines.back(), "eventEnd(5)");
        return lines.size();
    };
    calls();
    manager().PreEvaluate(kId);
    EXPECT_GT(scopeOf("GPUOverrideAcquireQuorSharedBufferBatch"), 2U);
    manager().PreEvaluate(kId); // open already
    EXPECT_EQ(scopeOf("GPUOverrideAcquireQuorSharedBufferBatch"), 2U);
    manager().PostEvaluate(kId);
    EXPECT_GT(scopeOf("GPUOverrideReleaseQuorSharedBufferBatch"), 2U);
    EXPECT_STREQ(sfAcquireBatchEventType.description(),
                 "Acquiring the quorview shared buffer from the OpenCl buffer manager");
    EXPECT_STREQ(sfReleaseBatchEventType.description(),
                 "Releasing the quorview shared buffer from the OpenCl buffer manager");
}

TEST_F(SharedBufferTest, ReportedNullEventIsPassedToRelease)
{
    startWithBuffer(1, 1);
    manager().PreEvaluate(kId);
    const cl_event none = nullptr;
    manager().EnqueueReleaseBatchedSharedCLBuffer(1, &none);
    calls();
    manager().PostEvaluate(kId);
    EXPECT_THAT(callsOf("clEnqueueReleaseGLObjects"),
                testing::ElementsAre(testing::HasSubstr("[event#1, null]")));
    EXPECT_THAT(warnings(), testing::Each(testing::StartsWith("OpenCL error: ")));
    EXPECT_EQ(runtime().takeMisuse().size(), 3U) << "retain, wait list, release";
}

TEST_F(SharedBufferTest, FenceWaitRepeatsOneSecondInHostContext)
{
    const auto* buffer = startWithBuffer(2, 1);
    const auto window = makeResourceWindow();
    for (const unsigned last : {0x911AU, 0x911CU, 0x911DU}) { // signalled, satisfied, failed
        manager().RenderingComplete();
        runtime().scriptClientWaits({0x911B, 0x911B, last});
        calls();
        acquire(buffer);
        using namespace ::testing;
        const auto wait = MatchesRegex("glClientWaitSync.*, 1, 1000000000.");
        EXPECT_THAT(calls(), ElementsAre("resourceWindow()", "makeCurrent()", wait, wait, wait,
                                         StartsWith("glDeleteSync"), _));
        release(buffer);
    }
}

TEST_F(SharedBufferTest, PreEvaluateOpensNothingWhenFenceWaitThrows)
{
    startWithBuffer(2, 1);
    const auto window = makeResourceWindow();
    for (const bool hostCloses : {false, true}) {
        calls();
        host().makeCurrentThrows = true;
        EXPECT_THROW(manager().PreEvaluate(kId), std::bad_alloc);
        host().makeCurrentThrows = false;
        if (hostCloses)
            manager().PostEvaluate(kId);
        EXPECT_EQ(callsOf("clEnqueue"), Lines{});
        manager().PreEvaluate(kId);
        EXPECT_EQ(callsOf("clEnqueueAcquire").size(), 1U) << "retry";
        manager().PostEvaluate(kId);
    }
}

TEST_F(SharedBufferTest, UnusableGLFunctionsAreNotCalledAndPendingFenceRemains)
{
    startWithBuffer(2, 3); // chosen while all functions were usable
    manager().RenderingComplete();
    calls();
    const auto expectCalls = [this](const Lines& expected) {
        manager().RenderingComplete();
        evaluate();
        EXPECT_EQ(callsOf("gl"), expected);
    };
    removeFunctionTable();
    expectCalls({});
    installFunctionTable(false, true);
    expectCalls({});
    installFunctionTable(true, false);
    expectCalls({"glDeleteSync(sync#1)", "glFenceSync(37143, 0) = sync#2",
                 "glClientWaitSync(sync#2, 1, 1000000000)", "glDeleteSync(sync#2)"});
    installFunctionTable(true, true);
    expectCalls({"glFenceSync(37143, 0) = sync#3", "glClientWaitSync(sync#3, 1, 1000000000)",
                 "glDeleteSync(sync#3)",
                 "glCreateSyncFromCLeventARB(context#1, event#8, 0) = sync#4",
                 "glWaitSync(sync#4, 0, 18446744073709551615)", "glDeleteSync(sync#4)"});
}

// Parameter: copy construction or copy assignment.
class CopyTest : public SharedBufferTest, public ::testing::WithParamInterface<bool> {
protected:
    std::unique_ptr<TopenCLSharedBufferMgr> copied()
    {
        setEnvironment("VYRA_OPENCL_FORCE_THREADING", nullptr);
        if (GetParam())
            return std::make_unique<TopenCLSharedBufferMgr>(manager());
        auto target = std::make_unique<TopenCLSharedBufferMgr>();
        *target = manager();
        return target;
    }
};

TEST_P(CopyTest, CopyContinuesOriginalsStateWithOwnReferences)
{
    const auto* buffer = startWithBuffer(1, 1);
    evaluate();
    const cl_event released = *manager().EnqueueReleaseBatchedSharedCLBuffer(0, nullptr);
    EXPECT_EQ(*copied()->EnqueueReleaseBatchedSharedCLBuffer(0, nullptr), released);

    manager().PreEvaluate(kId);
    const auto* late = create();
    const auto copy = copied();
    EXPECT_EQ(runtime().references(Kind::kMem, buffer->fMem.get()), 4U) << "records and batches";
    EXPECT_EQ(runtime().references(Kind::kMem, late->fMem.get()), 2U) << "records";
    dropManager();
    calls();
    copy->PreEvaluate(kId);
    EXPECT_EQ(calls(), Lines{}) << "its evaluation is open already";
    TopenCLSharedBuffer batched; // as in the destroyed original
    batched.fInBatch = true;
    batched.fMem = makeMem();
    AutoCLObject<cl_event> acquired;
    copy->EnqueueAcquireSharedCLBuffer(queue(), &batched, acquired.receive());
    EXPECT_EQ(runtime().name(acquired.get()), "event#3");
    copy->PostEvaluate(kId);
    EXPECT_EQ(callsOf("clEnqueue"),
              Lines{"clEnqueueReleaseGLObjects(queue#1, [mem#1], []) = event#4"})
        << "the reported events stay in the original";
    copy->PreEvaluate(kId);
    EXPECT_THAT(callsOf("clEnqueue"), ::testing::ElementsAre(::testing::HasSubstr("mem#2, mem#1")));
    copy->PostEvaluate(kId);
    ocl.clReleaseEvent(acquired.get()); // the reference in the list of the original
}

TEST_P(CopyTest, WithoutBatchingOriginalAndCopyMakeNoCalls)
{
    setEnvironment("VYRA_OPENCL_FORCE_THREADING", "1");
    startWithBuffer(2, 3);
    const auto copy = copied();
    host().sampling = true;
    calls();
    for (TopenCLSharedBufferMgr* unbatched : {&manager(), copy.get()}) {
        unbatched->PreEvaluate(kId);
        EXPECT_NE(unbatched->EnqueueReleaseBatchedSharedCLBuffer(0, nullptr), nullptr);
        unbatched->PostEvaluate(kId);
        unbatched->RenderingComplete();
        EXPECT_EQ(calls(), Lines{});
    }
}
INSTANTIATE_TEST_SUITE_P(SharedBuffers, CopyTest, ::testing::Bool(),
                         [](const auto& row) { return row.param ? "Constructed" : "Assigned"; });

TEST_F(SharedBufferTest, AssignmentReleasesTargetsEvents)
{
    startIn(1, 1);
    const AutoCLObject<cl_event> event = makeEvent();
    const cl_event reported = event.get();
    manager().EnqueueReleaseBatchedSharedCLBuffer(1, &reported);
    TopenCLSharedBufferMgr& itself = manager();
    manager() = itself;
    EXPECT_EQ(runtime().references(Kind::kEvent, reported), 2U);
    manager() = TopenCLSharedBufferMgr();
    EXPECT_EQ(runtime().references(Kind::kEvent, reported), 1U);
}

} // namespace
