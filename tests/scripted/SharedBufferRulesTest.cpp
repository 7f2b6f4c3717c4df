// Each rule of the shared-buffer manager, with the exact calls: evaluations, buffers that come and
// go, the renderer's fence.
#include "ManagerTest.h"

#include <algorithm>
#include <array>
#include <future>

using namespace scripted;

namespace {

class SharedBufferRules : public ManagerTest {
protected:
    void startWithThree(int graphicsToCL = 1, int clToGraphics = 1)
    {
        startIn(graphicsToCL, clToGraphics);
        createThree();
    }
    // Three buffers, in the order of their handles.
    void createThree()
    {
        for (auto& buffer : fBuffers)
            buffer = create();
        std::ranges::sort(fBuffers, {}, [](const auto* buffer) {
            return reinterpret_cast<std::uintptr_t>(buffer->fMem.get());
        });
        for (std::size_t i = 0; i < fBuffers.size(); ++i)
            fMems[i] = nameOf(fBuffers[i]);
        calls();
    }
    static std::string nameOf(const TopenCLSharedBuffer* buffer)
    {
        return runtime().name(buffer->fMem.get());
    }
    // The text with the names of the three memory objects for A, B and C in angle brackets.
    std::string named(std::string text) const
    {
        for (std::size_t i = 0; i < fMems.size(); ++i) {
            const std::string token{'<', static_cast<char>('A' + i), '>'};
            for (auto at = text.find(token); at != text.npos; at = text.find(token))
                text.replace(at, token.size(), fMems[i]);
        }
        return text;
    }
    Lines named(Lines lines) const
    {
        for (std::string& line : lines)
            line = named(line);
        return lines;
    }
    const cl_event* report(const std::vector<cl_event>& events)
    {
        return manager().EnqueueReleaseBatchedSharedCLBuffer(static_cast<unsigned>(events.size()),
                                                             events.data());
    }
    // The wait list of the next batch release.
    std::string waitListOfRelease()
    {
        calls();
        manager().PostEvaluate(kId);
        const Lines releases = callsOf("clEnqueueRelease");
        return releases.empty() ? "" : releases[0].substr(releases[0].rfind('['));
    }

    std::array<const TopenCLSharedBuffer*, 3> fBuffers{};
    std::array<std::string, 3> fMems;
};

TEST_F(SharedBufferRules, AnEvaluationIsOneAcquireAndOneReleaseAfterAllReportedEvents)
{
    startWithThree(2, 3);
    AutoCLObject<cl_event> reported; // event#1
    reported.adopt(makeEvent());
    manager().RenderingComplete();
    calls();
    manager().PreEvaluate(kId);
    EXPECT_EQ(calls(),
              named(Lines{"clRetainMemObject(<A>)", "clRetainMemObject(<B>)",
                          "clRetainMemObject(<C>)", "resourceWindow()",
                          "glClientWaitSync(sync#1, 1, 1000000000)", "glDeleteSync(sync#1)",
                          "clEnqueueAcquireGLObjects(queue#1, [<A>, <B>, <C>], []) = event#2",
                          "clRetainEvent(event#2)"}));

    AutoCLObject<cl_event> acquired;
    EXPECT_EQ(manager().EnqueueAcquireSharedCLBuffer(nullptr, fBuffers[1], acquired.receive()), 0);
    EXPECT_EQ(calls(), Lines{"clRetainEvent(event#2)"});
    const cl_event* slot = report({reported.get(), acquired.get(), reported.get()});
    EXPECT_EQ(calls(), (Lines{"clRetainEvent(event#1)", "clRetainEvent(event#2)",
                              "clRetainEvent(event#1)"}));
    EXPECT_EQ(*slot, nullptr);
    EXPECT_EQ(report({}), slot);
    EXPECT_EQ(manager().EnqueueReleaseBatchedSharedCLBuffer(3, nullptr), slot);
    EXPECT_EQ(calls(), Lines{}) << "nothing was reported";

    manager().PostEvaluate(kId);
    EXPECT_EQ(calls(),
              named(Lines{"clEnqueueReleaseGLObjects(queue#1, [<A>, <B>, <C>], "
                          "[event#2, event#1, event#2, event#1]) = event#3",
                          "clReleaseEvent(event#2)", "clReleaseEvent(event#1)",
                          "clReleaseEvent(event#2)", "clReleaseEvent(event#1)",
                          "glCreateSyncFromCLeventARB(context#1, event#3, 0) = sync#2",
                          "glWaitSync(sync#2, 0, 18446744073709551615)", "glDeleteSync(sync#2)"}));
    EXPECT_EQ(runtime().name(*slot), "event#3");

    manager().PreEvaluate(kId); // the batch is not rebuilt
    EXPECT_EQ(calls(),
              named(Lines{"clReleaseEvent(event#3)", "resourceWindow()", "clReleaseEvent(event#2)",
                          "clEnqueueAcquireGLObjects(queue#1, [<A>, <B>, <C>], []) = event#4",
                          "clRetainEvent(event#4)"}));
    EXPECT_EQ(*slot, nullptr);
    manager().PreEvaluate(kId);
    EXPECT_EQ(calls(), Lines{}) << "the evaluation is open";
    manager().PostEvaluate(kId);
}

TEST_F(SharedBufferRules, WithoutBuffersAnEvaluationEnqueuesNothing)
{
    startIn(2, 3);
    evaluate();
    EXPECT_EQ(calls(), Lines{});
    EXPECT_EQ(*report({}), nullptr);
}

TEST_F(SharedBufferRules, ABufferCreatedDuringAnEvaluationJoinsTheBatchAtItsEnd)
{
    startWithThree(1, 3);
    manager().PreEvaluate(kId);
    EXPECT_EQ(manager().DestroySharedCLBuffer(create()), CL_SUCCESS) << "it is not in the batch";
    const TopenCLSharedBuffer* late[] = {create(), create()};
    AutoCLObject<cl_event> released[2];
    calls();
    for (int i : {1, 0}) {
        EXPECT_FALSE(late[i]->fInBatch);
        acquire(late[i]);
        release(late[i], released[i].receive());
        EXPECT_EQ(calls(),
                  (Lines{"clEnqueueAcquireGLObjects(queue#1, [" + nameOf(late[i]) + "], [])",
                         "clEnqueueReleaseGLObjects(queue#1, [" + nameOf(late[i]) +
                             "], []) = event#" + std::to_string(3 - i)}));
    }
    manager().PostEvaluate(kId);
    EXPECT_TRUE(late[0]->fInBatch && late[1]->fInBatch);
    EXPECT_EQ(callsOf("glCreateSync"),
              (Lines{"glCreateSyncFromCLeventARB(context#1, event#4, 0) = sync#1",
                     "glCreateSyncFromCLeventARB(context#1, event#2, 0) = sync#2",
                     "glCreateSyncFromCLeventARB(context#1, event#3, 0) = sync#3"}))
        << "the batch first, then the single releases in their order";
    manager().PreEvaluate(kId);
    EXPECT_EQ(callsOf("clRetainMemObject"), Lines{});
    manager().PostEvaluate(kId);
    EXPECT_EQ(callsOf("glCreateSync").size(), 1U) << "single releases are waited for once";
}

TEST_F(SharedBufferRules, EventsStayPendingUntilABatchIsReleased)
{
    startIn(1, 1);
    AutoCLObject<cl_event> reported; // event#1
    reported.adopt(makeEvent());
    manager().PreEvaluate(kId);
    report({reported.get()});
    EXPECT_EQ(waitListOfRelease(), "") << "an empty batch";
    const auto* last = create();
    manager().PreEvaluate(kId);
    manager().DestroyBatchedSharedCLBuffer(last);
    report({reported.get()});
    EXPECT_EQ(waitListOfRelease(), "") << "emptied while acquired";
    create();
    manager().PreEvaluate(kId);
    EXPECT_EQ(waitListOfRelease(), "[event#1, event#2, event#1, event#4]) = event#5");
}

TEST_F(SharedBufferRules, AFenceReplacesThePendingOneButNotOneThatIsWaitedFor)
{
    startWithThree(2, 1);
    std::future<void> set;
    host().duringFenceWait = [&] {
        set = std::async(std::launch::async, [&] { manager().RenderingComplete(); });
        EXPECT_EQ(set.wait_for(std::chrono::seconds(10)), std::future_status::ready)
            << "setting a fence waited for a lock";
    };
    manager().RenderingComplete();
    manager().RenderingComplete();
    acquire(fBuffers[0]);
    acquire(fBuffers[1]);
    acquire(fBuffers[2]);
    EXPECT_EQ(callsOf("gl"),
              (Lines{"glFenceSync(37143, 0) = sync#1", "glDeleteSync(sync#1)",
                     "glFenceSync(37143, 0) = sync#2", "glFenceSync(37143, 0) = sync#3",
                     "glClientWaitSync(sync#2, 1, 1000000000)", "glDeleteSync(sync#2)",
                     "glClientWaitSync(sync#3, 1, 1000000000)", "glDeleteSync(sync#3)"}));
}

TEST_F(SharedBufferRules, DestructionReleasesEventsBeforeMemory)
{
    startWithThree();
    evaluate();
    const auto* unbatched = create();
    const std::string mem = nameOf(unbatched);
    calls();
    dropManager();
    const Lines lines = calls();
    ASSERT_EQ(lines.size(), 9U);
    EXPECT_EQ(lines[0], "clReleaseEvent(event#2)") << "of the release";
    EXPECT_EQ(lines[1], "clReleaseEvent(event#1)") << "of the acquire";
    // The records in an order of their own, then the batch in its order.
    EXPECT_EQ(std::count(lines.begin(), lines.begin() + 6, "clReleaseMemObject(" + mem + ')'), 1);
    EXPECT_EQ(Lines(lines.begin() + 6, lines.end()),
              named(Lines{"clReleaseMemObject(<A>)", "clReleaseMemObject(<B>)",
                          "clReleaseMemObject(<C>)"}));
}

enum class Batch { kNone, kNeverReleased, kReleased, kAcquired };

struct DestroyRow : Named {
    Batch batch;     // in which the three buffers are
    bool keepsBatch; // DestroyBatchedSharedCLBuffer
    int status;
    Lines calls; // of destroying A
};

class DestroyRules : public SharedBufferRules, public ::testing::WithParamInterface<DestroyRow> {
protected:
    void SetUp() override
    {
        const Batch batch = GetParam().batch;
        startIn(1, 1);
        if (batch == Batch::kNeverReleased)
            manager().PreEvaluate(kId); // of no buffer; its end makes the batch
        createThree();
        if (batch == Batch::kNeverReleased)
            manager().PostEvaluate(kId);
        if (batch == Batch::kReleased || batch == Batch::kAcquired)
            evaluate();
        if (batch == Batch::kAcquired)
            manager().PreEvaluate(kId);
        calls();
    }
};

TEST_P(DestroyRules, TheOthersStayInTheBatchOrJoinItAgain)
{
    const Batch batch = GetParam().batch;
    const bool keepsBatch = GetParam().keepsBatch;
    const cl_mem destroyed = fBuffers[0]->fMem.get();
    EXPECT_EQ(keepsBatch ? manager().DestroyBatchedSharedCLBuffer(fBuffers[0])
                         : manager().DestroySharedCLBuffer(fBuffers[0]),
              GetParam().status);
    EXPECT_EQ(calls(), named(GetParam().calls));
    const bool stay = batch == Batch::kAcquired || (batch != Batch::kNone && keepsBatch);
    EXPECT_EQ(fBuffers[1]->fInBatch, stay);
    EXPECT_EQ(fBuffers[2]->fInBatch, stay);
    if (batch == Batch::kAcquired) {
        manager().PostEvaluate(kId);
        EXPECT_THAT(callsOf("clEnqueueRelease"),
                    ::testing::ElementsAre(::testing::HasSubstr(
                        named(std::string(keepsBatch ? "[<B>, <C>]" : "[<A>, <B>, <C>]")))));
    }
    EXPECT_EQ(runtime().references(Kind::kMem, destroyed), 0U);
    manager().PreEvaluate(kId);
    const Lines lines = calls();
    const auto isRetain = [](const auto& line) { return line.starts_with("clRetainMemObject"); };
    EXPECT_EQ(std::ranges::count_if(lines, isRetain), stay ? 0 : 2) << "the batch is rebuilt";
    EXPECT_THAT(lines, ::testing::Contains(::testing::HasSubstr(named(
                           std::string("clEnqueueAcquireGLObjects(queue#1, [<B>, <C>], []")))));
    manager().PostEvaluate(kId);
}
const std::string kReleaseA = "clReleaseMemObject(<A>)";
const Lines kDissolve{kReleaseA, "clReleaseMemObject(<B>)", "clReleaseMemObject(<C>)", kReleaseA};
INSTANTIATE_TEST_SUITE_P(
    SharedBuffers, DestroyRules,
    ::testing::Values(
        DestroyRow{"Unbatched", Batch::kNone, false, 0, {kReleaseA}},
        DestroyRow{"UnbatchedKeepingTheBatch", Batch::kNone, true, 0, {kReleaseA}},
        DestroyRow{"BatchedBeforeAnyRelease", Batch::kNeverReleased, false, 0, kDissolve},
        DestroyRow{
            "Batched",
            Batch::kReleased,
            false,
            0,
            {"clWaitForEvents([event#2])", kDissolve[0], kDissolve[1], kDissolve[2], kDissolve[3]}},
        DestroyRow{"BatchedKeepingTheBatch", Batch::kReleased, true, 0, {kReleaseA, kReleaseA}},
        DestroyRow{"Acquired", Batch::kAcquired, false, CL_INVALID_VALUE, {kReleaseA}},
        DestroyRow{"AcquiredKeepingTheBatch",
                   Batch::kAcquired,
                   true,
                   0,
                   {"clEnqueueReleaseGLObjects(queue#1, [<A>], [event#3]) = event#4",
                    "clWaitForEvents([event#4])", "clReleaseEvent(event#4)", kReleaseA,
                    kReleaseA}}),
    ::testing::PrintToStringParamName());

} // namespace
